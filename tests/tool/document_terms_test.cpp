// The action "doc_term": the term vector of a document.

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <filesystem>
#include <string>
#include <vector>

#include "tool/inspection.h"
#include "tool/outcome.h"

namespace quorelastic::testing {
namespace {

using ::testing::AllOf;
using ::testing::EndsWith;
using ::testing::StartsWith;
using Vector = LibraryField::Vector;

constexpr char kWarning[] = "Bad parameter, must give db path and field name (use -d and -n)\n";
constexpr char kNoVector[] = "Failed to get term vector\n";

class DocumentTermsTest : public ::testing::Test {
 protected:
  RunResult Terms(const std::vector<std::string>& options) const {
    return Inspect("doc_term", folder_.path(), options);
  }

  TemporaryFolder folder_;
};

struct VectorKind {
  std::string name;
  Vector vector;
};

void PrintTo(const VectorKind& kind, std::ostream* stream) { *stream << kind.name; }

class VectorKindTest : public DocumentTermsTest, public ::testing::WithParamInterface<VectorKind> {};

TEST_P(VectorKindTest, ShowsEachTermOnceInTheVectorsOrder) {
  {
    LibraryIndex index(folder_.path());
    index.Add({VectorText("body", "pear Zebra apple pear apple", GetParam().vector),
               VectorText("title", "other", GetParam().vector)});
  }
  EXPECT_THAT(Terms({"-f", "body"}), Printed("body: Zebra\nbody: apple\nbody: pear\n"));
  EXPECT_THAT(Terms({"-f", "body", "-n", "0"}), Printed("body: Zebra\nbody: apple\nbody: pear\n"));
  EXPECT_THAT(Terms({"-f", "title"}), Printed("title: other\n"));
}

INSTANTIATE_TEST_SUITE_P(EveryKind, VectorKindTest,
                         ::testing::Values(VectorKind{"Terms", Vector::kTerms},
                                           VectorKind{"Positions", Vector::kPositions},
                                           VectorKind{"Offsets", Vector::kOffsets},
                                           VectorKind{"PositionsAndOffsets", Vector::kPositionsAndOffsets}),
                         [](const auto& instance) { return instance.param.name; });

TEST_F(DocumentTermsTest, FindsNoneWhereNoneWasStored) {
  {
    LibraryIndex index(folder_.path());
    index.Add({{.name = "plain", .value = "no vector"}, VectorText("body", "vector", Vector::kTerms)});
    index.Add({{.name = "body", .value = "none here"}});
  }
  EXPECT_THAT(Terms({"-f", "plain"}), Printed(kNoVector));
  EXPECT_THAT(Terms({"-f", "absent"}), Printed(kNoVector));
  EXPECT_THAT(Terms({"-f", "Body"}), Printed(kNoVector));
  EXPECT_THAT(Terms({"-f", "\xff"}), Printed(kNoVector));
  EXPECT_THAT(Terms({"-f", "body", "-n", "1"}), Printed(kNoVector));
  EXPECT_THAT(Terms({"-f", "body"}), Printed("body: vector\n"));
}

TEST_F(DocumentTermsTest, FindsNoneInASegmentWithoutVectors) {
  {
    LibraryIndex index(folder_.path());
    index.Add({{.name = "body", .value = "no vectors at all"}});
  }
  EXPECT_THAT(Terms({"-f", "body"}), Printed(kNoVector));
}

TEST_F(DocumentTermsTest, FindsNoneForADocumentNumberBelowNought) {
  {
    LibraryIndex index(folder_.path());
    index.Add({VectorText("body", "vector", Vector::kTerms)});
    index.Commit();
    index.Add({VectorText("body", "second", Vector::kTerms)});
  }
  for (const char* document : {"-1", "-2", "-2147483648", "4294967295", "99999999999999999999"}) {
    EXPECT_THAT(Terms({"-f", "body", "-n", document}), Printed(kNoVector)) << document;
  }
}

TEST_F(DocumentTermsTest, ReportsADocumentNumberBeyondTheLast) {
  {
    LibraryIndex index(folder_.path());
    index.Add({VectorText("body", "vector", Vector::kTerms)});
    index.Commit();
    index.Add({VectorText("body", "second", Vector::kTerms)});
  }
  for (const char* document : {"2", "3", "1000000", "2147483647"}) {
    EXPECT_THAT(Terms({"-f", "body", "-n", document}),
                Printed(AllOf(StartsWith("LuceneException: "), EndsWith("\n"))))
        << document;
  }
}

TEST_F(DocumentTermsTest, FindsNoneInAnIndexWithoutSegments) {
  { LibraryIndex index(folder_.path()); }
  for (const char* document : {"0", "-1", "1", "2147483647", "-2147483648"}) {
    EXPECT_THAT(Terms({"-f", "body", "-n", document}), Printed(kNoVector)) << document;
  }
}

TEST_F(DocumentTermsTest, CountsDocumentsThroughAllSegments) {
  {
    LibraryIndex index(folder_.path(), {.compound = false});
    index.Add({VectorText("body", "zero", Vector::kPositions)});
    index.Add({VectorText("body", "one", Vector::kPositions)});
    index.Commit();
    index.Add({{.name = "body", .value = "two"}});
    index.Add({VectorText("body", "three", Vector::kOffsets)});
    index.Commit();
    index.Add({VectorText("body", "four", Vector::kTerms)});
  }
  EXPECT_THAT(Terms({"-f", "body"}), Printed("body: zero\n"));
  EXPECT_THAT(Terms({"-f", "body", "-n", "1"}), Printed("body: one\n"));
  EXPECT_THAT(Terms({"-f", "body", "-n", "2"}), Printed(kNoVector));
  EXPECT_THAT(Terms({"-f", "body", "-n", "3"}), Printed("body: three\n"));
  EXPECT_THAT(Terms({"-f", "body", "-n", "4"}), Printed("body: four\n"));
}

TEST_F(DocumentTermsTest, GathersTheValuesOfAField) {
  {
    LibraryIndex index(folder_.path());
    index.Add({VectorText("body", "b a", Vector::kTerms),
               VectorText("body", "c a", Vector::kTerms),
               {.name = "id", .value = "whole value", .keyword = true, .vector = Vector::kTerms},
               {.name = "empty", .value = "", .keyword = true, .vector = Vector::kTerms}});
  }
  EXPECT_THAT(Terms({"-f", "body"}), Printed("body: a\nbody: b\nbody: c\n"));
  EXPECT_THAT(Terms({"-f", "id"}), Printed("id: whole value\n"));
  EXPECT_THAT(Terms({"-f", "empty"}), Printed("empty: \n"));
}

TEST_F(DocumentTermsTest, TakesFieldsOfAnyScriptInAnyLocale) {
  {
    LibraryIndex index(folder_.path());
    index.Add({VectorText("größe", "中文 𠮷野 straße", Vector::kTerms)});
  }
  for (const char* locale : {"LC_ALL=C", "LC_ALL=C.UTF-8", "LC_ALL=no_SUCH.locale"}) {
    EXPECT_THAT(Inspect("doc_term", folder_.path(), {"-f", "größe"}, {.environment = {locale}}),
                Printed("größe: straße\ngröße: 中文\ngröße: 𠮷野\n"));
  }
}

TEST_F(DocumentTermsTest, TakesAPathOfAnyScriptInAnyLocale) {
  {
    LibraryIndex index(folder_ / "index");
    index.Add({VectorText("body", "word", Vector::kTerms)});
  }
  const std::string path = folder_ / "größe 中文";
  std::filesystem::rename(folder_ / "index", path);
  for (const char* locale : {"LC_ALL=C", "LC_ALL=C.UTF-8", "LC_ALL=no_SUCH.locale"}) {
    EXPECT_THAT(Inspect("doc_term", path, {"-f", "body"}, {.environment = {locale}}),
                Printed("body: word\n"));
  }
}

TEST_F(DocumentTermsTest, WarnsOfAMissingFieldAndLooksItUpAllTheSame) {
  {
    LibraryIndex index(folder_.path());
    index.Add({VectorText("body", "vector", Vector::kTerms)});
  }
  EXPECT_THAT(Terms({}), Printed(kWarning + std::string(kNoVector)));
  EXPECT_THAT(Terms({"-f", ""}), Printed(kWarning + std::string(kNoVector)));
}

TEST_F(DocumentTermsTest, WarnsOfAMissingPathAndReportsWhatComesOfIt) {
  EXPECT_THAT(RunTool({"-a", "doc_term", "-f", "body"}),
              Printed(StartsWith(kWarning + std::string("LuceneException: "))));
  EXPECT_THAT(RunTool({"-a", "doc_term"}), Printed(StartsWith(kWarning + std::string("LuceneException: "))));
}

TEST_F(DocumentTermsTest, WritesOutEveryLineAsItIsFound) {
  {
    LibraryIndex index(folder_.path());
    index.Add({VectorText("body", "a b", Vector::kTerms)});
  }
  const RunResult run = Inspect("doc_term", folder_.path(), {"-f", "body"}, {.record_writes = true});
  EXPECT_EQ(run.writes, (std::vector<std::string>{"body: a\n", "body: b\n"}));
  EXPECT_EQ(Inspect("doc_term", folder_.path(), {}, {.record_writes = true}).writes,
            (std::vector<std::string>{kWarning, kNoVector}));
}

}  // namespace
}  // namespace quorelastic::testing

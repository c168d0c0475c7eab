// One damage for each value that the index library takes on trust in a lookup: it must be told as the library's own
// exception, with the file and the place, and where another lookup does not come by, that one must still be answered.

#include <gmock/gmock.h>
#include <gtest/gtest.h>
#include <lucene++/LuceneHeaders.h>
// Not without the headers above.
#include <lucene++/TermFreqVector.h>
#include <lucene++/TermPositions.h>

#include <memory>
#include <optional>
#include <ostream>
#include <string>

#include "support/byte_writer.h"
#include "support/files.h"
#include "support/small_index.h"
#include "support/temporary_folder.h"
#include "vantrel/elastic/checked_reader.h"

namespace quorelastic::testing {
namespace {

using Lucene::newLucene;
using Lucene::StringUtils;
using ::testing::AllOf;
using ::testing::HasSubstr;
using ::testing::StartsWith;
using vantrel::elastic::CheckedReader;

void WriteSmall(const std::string& path) { WriteSmallIndex(path, false); }

struct Craft {
  const char* name;
  void (*write)(const std::string& path);
  const char* file;  // how its name ends
  uint64_t offset;   // where bytes are replaced
  std::string bytes;
  const char* term;  // of which positions are looked for; null for term vectors
  int32_t document;
  const char* report;       // of the file; a part of it where another file is named
  int other_document = -1;  // that is still answered
  const char* found_in = nullptr;
};

// What the test runner shows of it.
void PrintTo(const Craft& craft, std::ostream* out) { *out << craft.name; }

std::string Int(int64_t value) { return ByteWriter().Int(value).bytes(); }
std::string Long(int64_t value) { return ByteWriter().Long(value).bytes(); }
std::string VInt(int64_t value) { return ByteWriter().VInt(value).bytes(); }

const Craft kCrafts[] = {
    // Opening.
    {"FieldCount", WriteSmall, ".fnm", 5, VInt(1 << 20), "beta", 0, "offset 5: 1048576 fields"},
    {"FieldNameLength", WriteSmall, ".fnm", 6, VInt(-1), "beta", 0, "offset 6: string of 4294967295 bytes"},
    {"IndexInterval", WriteSmall, ".tis", 12, Int(0), "beta", 0, "offset 12: index interval 0"},
    {"TermsIndexCount", WriteSmall, ".tii", 4, Long(int64_t{1} << 31), "beta", 0,
     "offset 4: term count 2147483648"},
    {"TermsIndexText", WriteSmall, ".tii", 25, VInt(1 << 30), nullptr, 0,
     "offset 24: term of 1073741824 bytes"},
    {"TermsIndexField", WriteSmall, ".tii", 26, VInt(1), nullptr, 0,
     "offset 24: term bears field number 1 of 1"},
    {"DeletionsSize", WriteSmall, ".del", 0, Int(-2), nullptr, 0,
     "offset 0: deletions are about -2 documents"},
    // The dictionary; what comes before the term is read, what comes behind is not.
    {"TermPrefix", WriteSmall, ".tis", 35, VInt(-1), "beta", 0, "offset 35: term shares 4294967295 bytes"},
    {"TermField", WriteSmall, ".tis", 31, "\x01", "beta", 0, "offset 24: term bears field number 1 of 1"},
    {"TermDocuments", WriteSmall, ".tis", 32, "\x04", "alpha", 0, "offset 24: term is in 4 documents of 3"},
    {"TermPostings", WriteSmall, ".tis", 43, "\x7f", "beta", 0, "", -1, ".frq"},
    {"SkipInterval", WriteSkippingIndex, ".tis", 16, Int(1), "often", 99,
     "skip interval is 16, but by the dictionary it is 1", -1, ".tii"},
    {"SkipLevels", WriteSkippingIndex, ".tis", 20, Int(0), "often", 99,
     "number of skip levels is 10, but by the dictionary it is 0", -1, ".tii"},
    {"SkipLevelsHuge", WriteSkippingIndex, ".tis", 20, Int(1 << 28), "often", 99,
     "number of skip levels is 10, but by the dictionary it is 268435456", -1, ".tii"},
    // Postings and positions.
    {"Document", WriteSmall, ".frq", 2, "\x0a", "alpha", 1, "offset 2: posting lies 5 after document 0 of 3",
     0},
    {"Frequency", WriteSmall, ".frq", 1, std::string(1, '\0'), "alpha", 0,
     "offset 0: posting has frequency 0"},
    {"Position", WriteSmall, ".prx", 1, VInt(-7), "alpha", 0, "offset 1: position -7 follows 0"},
    // Skip data: what lies on the way to a document far behind, but not on that to the first.
    {"SkipOffset", WriteSkippingIndex, ".tis", 37, VInt(400), "often", 250, "", -1, ".frq"},
    {"SkipLevelLength", WriteSkippingIndex, ".frq", 300, VInt(1 << 28), "often", 250,
     "offset 300: level 1 of skip data takes"},
    {"SkipLevelEmpty", WriteSkippingIndex, ".frq", 300, std::string(1, '\0'), "often", 250,
     "offset 301: level 1 is empty", 0},
    {"SkipLevelShort", WriteSkippingIndex, ".frq", 300, "\x02", "often", 250,
     "offset 301: skip entry reaches past", 0},
    {"SkipPostings", WriteSkippingIndex, ".frq", 309, VInt(-16), "often", 40, "offset", 0},
    {"SkipDocument", WriteSkippingIndex, ".frq", 308, VInt(400), "often", 40,
     "offset 308: skip entry leads from document 0 to 400 of 300", 0},
    {"SkipDocumentHuge", WriteSkippingIndex, ".frq", 308, VInt(-16), "often", 40,
     "offset 308: skip entry leads from document 0 to", 0},
    // Term vectors.
    {"VectorPointer", WriteSmall, ".tvx", 4, Long(-1), nullptr, 0, "offset 4: pointer is -1", 1},
    {"VectorTermsPointer", WriteSmall, ".tvx", 12, Long(int64_t{1} << 40), nullptr, 0, "", 1, ".tvd"},
    {"VectorFieldCount", WriteSmall, ".tvd", 4, "\x7f", nullptr, 0,
     "offset 4: document has vectors of 127 fields", 1},
    {"VectorField", WriteSmall, ".tvd", 5, "\x01", nullptr, 0, "offset 5: field number 1 of 1", 1},
    {"VectorTermCount", WriteSmall, ".tvf", 4, "\x7f", nullptr, 0, "offset 4: vector of 127 terms", 1},
    {"VectorPrefix", WriteSmall, ".tvf", 6, "\x7f", nullptr, 0, "offset 6: term shares 127 bytes", 1},
    {"VectorFrequency", WriteSmall, ".tvf", 13, VInt(1 << 30), nullptr, 0, "offset", 2},
};

class CraftedLookupTest : public ::testing::TestWithParam<Craft> {
 protected:
  void SetUp() override {
    const Craft& craft = GetParam();
    craft.write(folder_.path());
    EXPECT_EQ(LookUp(craft.document), "");
    name_ = FindFile(folder_.path(), craft.file);
    std::string bytes = ReadFile(folder_ / name_);
    ASSERT_LT(craft.offset, bytes.size());
    bytes.replace(craft.offset, craft.bytes.size(), craft.bytes);
    ASSERT_NE(bytes, ReadFile(folder_ / name_));
    WriteFile(folder_ / name_, bytes);
  }

  // Reads all that there is of an answer; the text of the library's exception, if there was one.
  std::string LookUp(int32_t document) const {
    try {
      if (GetParam().term == nullptr) {
        CheckedReader(folder_.path()).TermVector(document, L"body")->getTerms();
        return "";
      }
      const auto term = newLucene<Lucene::Term>(L"body", StringUtils::toUnicode(GetParam().term));
      const CheckedReader reader(folder_.path(), term);
      const auto positions = reader.Positions(document);
      if (!positions->skipTo(document)) return "no entry";
      for (int32_t left = positions->freq(); left > 0; --left) positions->nextPosition();
      return "";
    } catch (const Lucene::CorruptIndexException& error) {
      return StringUtils::toUTF8(error.getError());
    }
  }

  TemporaryFolder folder_;
  std::string name_;
};

INSTANTIATE_TEST_SUITE_P(Values, CraftedLookupTest, ::testing::ValuesIn(kCrafts),
                         [](const auto& test) { return test.param.name; });

TEST_P(CraftedLookupTest, IsReportedWithItsFileAndPlace) {
  const Craft& craft = GetParam();
  const std::string report = LookUp(craft.document);
  if (craft.found_in != nullptr) {
    EXPECT_THAT(report, AllOf(StartsWith(folder_ / FindFile(folder_.path(), craft.found_in) + ": offset "),
                              HasSubstr(craft.report)));
  } else {
    EXPECT_THAT(report, StartsWith(folder_ / name_ + ": " + craft.report));
  }
  if (craft.other_document >= 0) {
    EXPECT_EQ(LookUp(craft.other_document), "");
  }
}

}  // namespace
}  // namespace quorelastic::testing

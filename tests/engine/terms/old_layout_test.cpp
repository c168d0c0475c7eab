#include <gtest/gtest.h>
#include <sys/wait.h>

#include <cstdlib>

#include "engine/terms/expect_same_terms.h"
#include "support/byte_writer.h"
#include "support/files.h"
#include "support/temporary_folder.h"

namespace vantrel::elastic {
namespace {

using ::quorelastic::testing::ByteWriter;
using ::quorelastic::testing::ExpectSameTerms;
using ::quorelastic::testing::FindFile;
using ::quorelastic::testing::LibrarySegment;
using ::quorelastic::testing::LibraryTerm;
using ::quorelastic::testing::ListFolder;
using ::quorelastic::testing::ReadFile;
using ::quorelastic::testing::ReadLibraryTerms;
using ::quorelastic::testing::TemporaryFolder;
using ::quorelastic::testing::WriteFile;

void WriteWithCLucene(const std::string& folder, const char* layout, int documents, int deletions) {
  const std::string command = std::string(CLUCENE_WRITER) + " '" + folder + "' " + layout + " " +
                              std::to_string(documents) + " " + std::to_string(deletions);
  const int status = std::system(command.c_str());
  ASSERT_TRUE(WIFEXITED(status) && WEXITSTATUS(status) == 0) << command;
}

struct CLuceneCase {
  const char* layout;
  int documents;
  int deletions;
};

class CLuceneIndexTest : public ::testing::TestWithParam<CLuceneCase> {};

INSTANTIATE_TEST_SUITE_P(Shapes, CLuceneIndexTest,
                         ::testing::Values(CLuceneCase{"plain", 250, 0}, CLuceneCase{"plain", 250, 40},
                                           CLuceneCase{"compound", 250, 0}, CLuceneCase{"compound", 250, 40},
                                           CLuceneCase{"plain", 90, 90}, CLuceneCase{"compound", 3000, 1}));

TEST_P(CLuceneIndexTest, ReadsAsTheIndexLibraryReadsIt) {
  const CLuceneCase shape = GetParam();
  const TemporaryFolder folder;
  ASSERT_NO_FATAL_FAILURE(WriteWithCLucene(folder.path(), shape.layout, shape.documents, shape.deletions));
  const std::string commit = ReadFile(folder / FindFile(folder.path(), ListFolder(folder.path()).back()));
  ASSERT_EQ(commit.substr(0, 4), "\xff\xff\xff\xfc") << "not the layout that this test is about";
  const auto expected = ReadLibraryTerms(folder.path());
  ASSERT_FALSE(expected.empty());
  size_t all = 0;
  size_t live = 0;
  for (const LibrarySegment& segment : expected) {
    all += segment.all.size();
    live += segment.live.size();
  }
  EXPECT_EQ(live<all, shape.deletions> 0);
  ExpectSameTerms(folder.path(), expected);
}

// Three documents by hand, in layouts that nothing writes any more: "a" in all of them, "b" in the second,
// a supplementary character in the last.
class OldestLayoutTest : public ::testing::TestWithParam<int> {
 protected:
  static constexpr int kDocuments = 3;

  static ByteWriter TermsHeader(int64_t count, bool is_index) {
    if (GetParam() == 0) return ByteWriter().Int(count);
    ByteWriter out = ByteWriter().Int(GetParam()).Long(count);
    if (GetParam() < -1 || !is_index) out.Int(128).Int(16);
    if (GetParam() <= -3) out.Int(10);
    return out;
  }

  static void WriteSegment(const TemporaryFolder& folder) {
    WriteFile(
        folder / "_0.fnm",
        ByteWriter().VInt(2).UnitsString(u"k\u00f6rper").Byte(0x11).UnitsString(u"z").Byte(0x11).bytes());
    ByteWriter terms = TermsHeader(3, false);
    terms.VInt(0).UnitsString(u"a").VInt(0).VInt(3).VLong(0).VLong(0);
    terms.VInt(0).UnitsString(u"b").VInt(0).VInt(1).VLong(3).VLong(3);
    terms.VInt(0).UnitsString(u"\u00e4\u4e2d").VInt(1).VInt(1).VLong(1).VLong(1);
    WriteFile(folder / "_0.tis", terms.bytes());
    const auto first = static_cast<uint64_t>(TermsHeader(3, false).size());
    ByteWriter index = TermsHeader(1, true);
    index.VInt(0).VInt(0).VInt(-1).VInt(0).VLong(0).VLong(0).VLong(first);
    WriteFile(folder / "_0.tii", index.bytes());
    WriteFile(folder / "_0.frq", ByteWriter().VInt(1).VInt(3).VInt(3).VInt(3).VInt(5).bytes());
    WriteFile(folder / "_0.prx", std::string(5, '\0'));
    WriteFile(folder / "_0.fdx", ByteWriter().Long(0).Long(1).Long(2).bytes());
    WriteFile(folder / "_0.fdt", std::string(kDocuments, '\0'));
  }

  static const std::vector<LibraryTerm>& AllTerms() {
    static const std::vector<LibraryTerm> kTerms = {
        {L"k\u00f6rper", L"a"}, {L"k\u00f6rper", L"b"}, {L"z", L"\u00e4\u4e2d"}};
    return kTerms;
  }
};

INSTANTIATE_TEST_SUITE_P(Formats, OldestLayoutTest, ::testing::Range(-3, 1),
                         [](const auto& test) { return "Minus" + std::to_string(-test.param); });

TEST_P(OldestLayoutTest, ReadsAsTheIndexLibraryReadsIt) {
  const TemporaryFolder folder;
  WriteSegment(folder);
  WriteFile(folder / "segments", ByteWriter().Int(1).Int(1).String("_0").Int(kDocuments).bytes());
  ASSERT_EQ(ReadLibraryTerms(folder.path()).at(0).all, AllTerms());
  ExpectSameTerms(folder.path(), ReadLibraryTerms(folder.path()));
}

TEST_P(OldestLayoutTest, ItsDeletionsAreFoundInTheFolder) {
  const TemporaryFolder folder;
  WriteSegment(folder);
  WriteFile(folder / "segments",
            ByteWriter().Int(-1).Long(1).Int(1).Int(1).String("_0").Int(kDocuments).bytes());
  WriteFile(folder / "_0.del", ByteWriter().Int(kDocuments).Int(1).Byte(1 << 1).bytes());
  const auto expected = ReadLibraryTerms(folder.path());
  ASSERT_EQ(expected.at(0).all, AllTerms());
  ASSERT_EQ(expected.at(0).live, (std::vector<LibraryTerm>{AllTerms()[0], AllTerms()[2]}));
  ExpectSameTerms(folder.path(), expected);
}

}  // namespace
}  // namespace vantrel::elastic

// One damage for each value that the index library takes on trust: the check must find it, at its place, and where the
// library could crash on it, say so.

#include <gmock/gmock.h>
#include <gtest/gtest.h>
#include <sys/wait.h>

#include <memory>
#include <ostream>
#include <string>

#include "damage/limited_run.h"
#include "support/byte_writer.h"
#include "support/files.h"
#include "support/small_index.h"
#include "support/temporary_folder.h"
#include "vantrel/elastic/index_health.h"

namespace vantrel::elastic {
namespace {

using ::quorelastic::testing::ByteWriter;
using ::quorelastic::testing::CopyFolder;
using ::quorelastic::testing::FindFile;
using ::quorelastic::testing::LimitedRun;
using ::quorelastic::testing::ListFolder;
using ::quorelastic::testing::ReadFile;
using ::quorelastic::testing::RunToolLimited;
using ::quorelastic::testing::TemporaryFolder;
using ::quorelastic::testing::WriteFile;
using ::quorelastic::testing::WriteSkippingIndex;
using ::quorelastic::testing::WriteSmallIndex;
using Grade = HealthFinding::Grade;

// The lookups of the real program in such an index, each of which must end in an answer or a report.
void ExpectLookupsToEnd(const std::string& path) {
  const auto expect_end = [&](const std::string& action, const std::string& token,
                              const std::string& document) {
    const LimitedRun run =
        RunToolLimited({"-a", action, "-d", path, "-f", "body", "-t", token, "-n", document});
    EXPECT_TRUE(WIFEXITED(run.status) && WEXITSTATUS(run.status) == 0)
        << action << " of " << token << " from " << document << " ends in signal " << WTERMSIG(run.status)
        << "\n"
        << run.output << run.errors;
    EXPECT_EQ(run.output.find("bad_alloc"), std::string::npos) << action << " of " << token;
    EXPECT_NE(run.output, "");
  };
  for (const char* token : {"alpha", "beta", "gamma", "often", "zeta"}) expect_end("position", token, "0");
  for (const char* document : {"2", "17", "280"}) expect_end("position", "often", document);
  for (const char* document : {"0", "1", "2", "3"}) expect_end("doc_term", "", document);
}

enum class CraftedIndex { kSmall, kCompound, kSkips };

struct Craft {
  const char* name;
  CraftedIndex index;
  const char* file;   // how its name ends
  uint64_t offset;    // where bytes are replaced
  std::string bytes;  // by these
  const char* found_in;
  Grade grade = Grade::kUnsafe;
};

// What the test runner shows of it.
void PrintTo(const Craft& craft, std::ostream* out) { *out << craft.name; }

std::string Int(int64_t value) { return ByteWriter().Int(value).bytes(); }
std::string Long(int64_t value) { return ByteWriter().Long(value).bytes(); }
std::string VInt(int64_t value) { return ByteWriter().VInt(value).bytes(); }
std::string Bytes(std::string_view bytes) { return std::string(bytes); }

const Craft kCrafts[] = {
    // Field names.
    {"FieldNamesFormat", CraftedIndex::kSmall, ".fnm", 0, VInt(-3), ".fnm"},
    {"FieldCountNegative", CraftedIndex::kSmall, ".fnm", 5, VInt(-1), ".fnm"},
    {"FieldNameLengthNegative", CraftedIndex::kSmall, ".fnm", 6, VInt(-1), ".fnm"},
    {"FieldNameTooLong", CraftedIndex::kSmall, ".fnm", 6, "\x70", ".fnm"},
    {"FieldFlagUnknown", CraftedIndex::kSmall, ".fnm", 11, "\x8f", ".fnm", Grade::kDamaged},
    {"FieldVectorsWithoutFlag", CraftedIndex::kSmall, ".fnm", 11, "\x01", ".fnm", Grade::kDamaged},
    {"FieldVectorPartsWithoutFlag", CraftedIndex::kSmall, ".fnm", 11, "\x0d", ".fnm", Grade::kDamaged},
    {"FieldNotIndexed", CraftedIndex::kSmall, ".fnm", 11, "\x0e", ".tis"},
    {"FieldOmitsFrequencies", CraftedIndex::kSmall, ".fnm", 11, "\x4f", ".frq"},
    {"FieldHasPayloads", CraftedIndex::kSmall, ".fnm", 11, "\x2f", ".prx"},
    {"FieldOmitsNorms", CraftedIndex::kSmall, ".fnm", 11, "\x1f", ".nrm", Grade::kDamaged},
    // The dictionary.
    {"DictionaryFormat", CraftedIndex::kSmall, ".tis", 0, Int(-5), ".tis"},
    {"DictionaryOfOldText", CraftedIndex::kSmall, ".tis", 0, Int(-3), ".tii"},
    {"DictionaryCountHuge", CraftedIndex::kSmall, ".tis", 4, Long(int64_t{1} << 40), ".tis"},
    {"DictionaryCountNegative", CraftedIndex::kSmall, ".tis", 4, Long(-1), ".tis"},
    {"DictionaryCountTooSmall", CraftedIndex::kSmall, ".tis", 4, Long(2), ".tis"},
    {"IndexIntervalZero", CraftedIndex::kSmall, ".tis", 12, Int(0), ".tis"},
    {"IndexIntervalOther", CraftedIndex::kSmall, ".tis", 12, Int(127), ".tii"},
    {"SkipIntervalZero", CraftedIndex::kSmall, ".tis", 16, Int(0), ".tis"},
    {"SkipIntervalOne", CraftedIndex::kSmall, ".tis", 16, Int(1), ".tis"},
    {"SkipIntervalOther", CraftedIndex::kSmall, ".tis", 16, Int(17), ".tii"},
    {"SkipLevelsNone", CraftedIndex::kSmall, ".tis", 20, Int(0), ".tis"},
    {"SkipLevelsNegative", CraftedIndex::kSmall, ".tis", 20, Int(-1), ".tis"},
    {"SkipLevelsHuge", CraftedIndex::kSmall, ".tis", 20, Int(1 << 28), ".tis"},
    {"TermPrefixOfTheFirst", CraftedIndex::kSmall, ".tis", 24, "\x01", ".tis"},
    {"TermPrefixNegative", CraftedIndex::kSmall, ".tis", 35, VInt(-1), ".tis"},
    {"TermPrefixHuge", CraftedIndex::kSmall, ".tis", 35, VInt(1 << 30), ".tis"},
    {"TermSuffixNegative", CraftedIndex::kSmall, ".tis", 25, VInt(-5), ".tis"},
    {"TermSuffixHuge", CraftedIndex::kSmall, ".tis", 25, VInt(1 << 30), ".tis"},
    {"TermTextNoUtf8", CraftedIndex::kSmall, ".tis", 26, "\xff", ".tis"},
    {"TermTextLost", CraftedIndex::kSmall, ".tis", 26, "\xef\xbf\xbf", ".tis"},
    {"TermTwice", CraftedIndex::kSmall, ".tis", 35, "\x01\x04lpha", ".tis"},
    {"TermsOutOfOrder", CraftedIndex::kSmall, ".tis", 26, "z", ".tis"},
    {"TermFieldTooLarge", CraftedIndex::kSmall, ".tis", 31, "\x01", ".tis"},
    {"TermFieldNegative", CraftedIndex::kSmall, ".tis", 31, VInt(-1), ".tis"},
    {"DocumentFrequencyNone", CraftedIndex::kSmall, ".tis", 32, Bytes(std::string_view("\0", 1)), ".tis"},
    {"DocumentFrequencyTooLarge", CraftedIndex::kSmall, ".tis", 32, "\x04", ".tis"},
    {"DocumentFrequencyTooSmall", CraftedIndex::kSmall, ".tis", 32, "\x02", ".tis"},
    {"DocumentFrequencyNegative", CraftedIndex::kSmall, ".tis", 32, VInt(-1), ".tis"},
    {"PostingsPointerOfTheFirst", CraftedIndex::kSmall, ".tis", 33, "\x01", ".tis"},
    {"PostingsPointerOfAnother", CraftedIndex::kSmall, ".tis", 43, "\x05", ".tis"},
    {"PositionsPointer", CraftedIndex::kSmall, ".tis", 44, "\x05", ".tis"},
    // The index over it.
    {"TermsIndexCountHuge", CraftedIndex::kSmall, ".tii", 4, Long(int64_t{1} << 31), ".tii"},
    {"TermsIndexCountNone", CraftedIndex::kSmall, ".tii", 4, Long(0), ".tii"},
    {"TermsIndexFirstHasText", CraftedIndex::kSmall, ".tii", 25, "\x01", ".tii"},
    {"TermsIndexPointer", CraftedIndex::kSmall, ".tii", 34, "\x19", ".tii"},
    {"TermsIndexPostings", CraftedIndex::kSmall, ".tii", 32, "\x01", ".tii"},
    // Documents, positions.
    {"DocumentTooLarge", CraftedIndex::kSmall, ".frq", 2, "\x06", ".frq"},
    {"DocumentTwice", CraftedIndex::kSmall, ".frq", 2, Bytes(std::string_view("\0", 1)), ".frq"},
    {"FrequencyNone", CraftedIndex::kSmall, ".frq", 1, Bytes(std::string_view("\0", 1)), ".frq"},
    {"FrequencyTooLarge", CraftedIndex::kSmall, ".frq", 1, "\x7f", ".prx"},
    {"PositionNegative", CraftedIndex::kSmall, ".prx", 1, VInt(-7), ".prx"},
    // Skip data.
    {"SkipOffset", CraftedIndex::kSkips, ".tis", 37, VInt(302), ".frq"},
    {"SkipLevelLength", CraftedIndex::kSkips, ".frq", 300, "\x7f", ".frq"},
    {"SkipDocument", CraftedIndex::kSkips, ".frq", 301, "\x80", ".frq"},
    {"SkipLowestDocument", CraftedIndex::kSkips, ".frq", 309, "\x0d", ".frq"},
    {"SkipPostings", CraftedIndex::kSkips, ".frq", 310, "\x0e", ".frq"},
    {"SkipPositions", CraftedIndex::kSkips, ".frq", 311, "\x0e", ".frq"},
    // Stored fields.
    {"StoredFormat", CraftedIndex::kSmall, ".fdx", 0, Int(3), ".fdx"},
    {"StoredFormatNegative", CraftedIndex::kSmall, ".fdx", 0, Int(-1), ".fdx"},
    {"StoredFormatOfRecords", CraftedIndex::kSmall, ".fdt", 0, Int(1), ".fdt"},
    {"RecordPointerOfTheFirst", CraftedIndex::kSmall, ".fdx", 4, Long(5), ".fdt"},
    {"RecordPointerNegative", CraftedIndex::kSmall, ".fdx", 4, Long(-4), ".fdx"},
    {"RecordPointerHuge", CraftedIndex::kSmall, ".fdx", 12, Long(int64_t{1} << 40), ".fdx"},
    {"StoredCountHuge", CraftedIndex::kSmall, ".fdt", 4, "\x7f", ".fdt"},
    {"StoredCountNone", CraftedIndex::kSmall, ".fdt", 4, Bytes(std::string_view("\0", 1)), ".fdt"},
    {"StoredFieldTooLarge", CraftedIndex::kSmall, ".fdt", 5, "\x01", ".fdt"},
    {"StoredFieldNegative", CraftedIndex::kSmall, ".fdt", 5, VInt(-1), ".fdt"},
    {"StoredFlags", CraftedIndex::kSmall, ".fdt", 6, "\x09", ".fdt"},
    {"StoredCompressed", CraftedIndex::kSmall, ".fdt", 6, "\x05", ".fdt"},
    {"StoredLengthNegative", CraftedIndex::kSmall, ".fdt", 7, VInt(-1), ".fdt"},
    {"StoredLengthTooLarge", CraftedIndex::kSmall, ".fdt", 7, "\x7f", ".fdt"},
    {"StoredTextNoUtf8", CraftedIndex::kSmall, ".fdt", 8, "\xc0", ".fdt"},
    // Term vectors.
    {"VectorFormat", CraftedIndex::kSmall, ".tvx", 0, Int(5), ".tvx"},
    {"VectorFormatZero", CraftedIndex::kSmall, ".tvx", 0, Int(0), ".tvx"},
    {"VectorFormatOfDocuments", CraftedIndex::kSmall, ".tvd", 0, Int(3), ".tvd"},
    {"VectorFormatOfTerms", CraftedIndex::kSmall, ".tvf", 0, Int(3), ".tvf"},
    {"VectorListPointer", CraftedIndex::kSmall, ".tvx", 4, Long(6), ".tvx"},
    {"VectorListPointerNegative", CraftedIndex::kSmall, ".tvx", 4, Long(-1), ".tvx"},
    {"VectorTermsPointer", CraftedIndex::kSmall, ".tvx", 12, Long(int64_t{1} << 40), ".tvd"},
    {"VectorFieldCountHuge", CraftedIndex::kSmall, ".tvd", 4, VInt(1 << 28), ".tvd"},
    {"VectorFieldCountNone", CraftedIndex::kSmall, ".tvd", 4, Bytes(std::string_view("\0", 1)), ".tvx"},
    {"VectorFieldTooLarge", CraftedIndex::kSmall, ".tvd", 5, "\x01", ".tvd"},
    {"VectorTermCountNone", CraftedIndex::kSmall, ".tvf", 4, Bytes(std::string_view("\0", 1)), ".tvf"},
    {"VectorTermCountHuge", CraftedIndex::kSmall, ".tvf", 4, VInt(1 << 28), ".tvf"},
    {"VectorFlags", CraftedIndex::kSmall, ".tvf", 5, "\x07", ".tvf"},
    {"VectorPrefixHuge", CraftedIndex::kSmall, ".tvf", 6, VInt(1 << 30), ".tvf"},
    {"VectorSuffixNegative", CraftedIndex::kSmall, ".tvf", 7, VInt(-1), ".tvf"},
    {"VectorTextNoUtf8", CraftedIndex::kSmall, ".tvf", 8, "\xfe", ".tvf"},
    {"VectorTermsOutOfOrder", CraftedIndex::kSmall, ".tvf", 8, "z", ".tvf"},
    {"VectorFrequencyNone", CraftedIndex::kSmall, ".tvf", 13, Bytes(std::string_view("\0", 1)), ".tvf"},
    {"VectorFrequencyHuge", CraftedIndex::kSmall, ".tvf", 13, VInt(1 << 30), ".tvf"},
    {"VectorPositionNegative", CraftedIndex::kSmall, ".tvf", 15, VInt(-9), ".tvf"},
    // Deleted documents.
    {"DeletionsOfFewerDocuments", CraftedIndex::kSmall, ".del", 0, Int(2), ".del"},
    {"DeletionsOfMoreDocuments", CraftedIndex::kSmall, ".del", 0, Int(1 << 30), ".del"},
    {"DeletionsNegative", CraftedIndex::kSmall, ".del", 0, Int(-2), ".del"},
    {"DeletionsSparseNegative", CraftedIndex::kSmall, ".del", 0, Int(-1), ".del"},
    {"DeletionsCount", CraftedIndex::kSmall, ".del", 4, Int(2), ".del"},
    {"DeletionsBits", CraftedIndex::kSmall, ".del", 8, "\x06", ".del"},
    {"DeletionsPastTheEnd", CraftedIndex::kSmall, ".del", 8, "\x08", ".del", Grade::kDamaged},
    // Norms.
    {"NormsHeader", CraftedIndex::kSmall, ".nrm", 0, "M", ".nrm", Grade::kDamaged},
    {"NormsHeaderVersion", CraftedIndex::kSmall, ".nrm", 3, "\xfe", ".nrm", Grade::kDamaged},
    // Compound files.
    {"CompoundCountHuge", CraftedIndex::kCompound, ".cfs", 0, VInt(1 << 30), ".cfs"},
    {"CompoundCountTooSmall", CraftedIndex::kCompound, ".cfs", 0, "\x05", ".cfs", Grade::kDamaged},
    {"CompoundOffsetNegative", CraftedIndex::kCompound, ".cfs", 1, Long(-1), ".cfs"},
    {"CompoundOffsetTooSmall", CraftedIndex::kCompound, ".cfs", 1, Long(1), ".cfs"},
    {"CompoundNameLengthNegative", CraftedIndex::kCompound, ".cfs", 9, VInt(-1), ".cfs"},
    {"CompoundNameUnknown", CraftedIndex::kCompound, ".cfs", 12, "?", ".cfs", Grade::kDamaged},
};

class CraftedDamageTest : public ::testing::TestWithParam<Craft> {
 protected:
  // Written once: that takes longer than all of the tests.
  static void SetUpTestSuite() {
    originals_ = std::make_unique<TemporaryFolder>();
    WriteSmallIndex(Original(CraftedIndex::kSmall), false);
    WriteSmallIndex(Original(CraftedIndex::kCompound), true);
    WriteSkippingIndex(Original(CraftedIndex::kSkips));
  }
  static void TearDownTestSuite() { originals_.reset(); }

  void SetUp() override {
    CopyFolder(Original(GetParam().index), path());
    ASSERT_TRUE(CheckIndexHealth(path()).clean());
  }

  std::string path() const { return folder_ / "index"; }

  void Apply(const Craft& craft) const {
    const std::string file = path() + "/" + FindFile(path(), craft.file);
    std::string bytes = ReadFile(file);
    ASSERT_LT(craft.offset, bytes.size());
    const std::string before = bytes;
    bytes.replace(craft.offset, craft.bytes.size(), craft.bytes);
    ASSERT_NE(bytes, before);
    WriteFile(file, bytes);
  }

 private:
  static std::string Original(CraftedIndex index) {
    return *originals_ / std::to_string(static_cast<int>(index));
  }

  static inline std::unique_ptr<TemporaryFolder> originals_;
  TemporaryFolder folder_;
};

INSTANTIATE_TEST_SUITE_P(Values, CraftedDamageTest, ::testing::ValuesIn(kCrafts),
                         [](const auto& test) { return test.param.name; });

TEST_P(CraftedDamageTest, IsFoundInItsFileAndGraded) {
  const Craft& craft = GetParam();
  ASSERT_NO_FATAL_FAILURE(Apply(craft));
  const HealthReport report = CheckIndexHealth(path());
  std::string seen;
  bool is_found = false;
  for (const HealthFinding& finding : report.findings) {
    seen += finding.file + ", offset " + std::to_string(finding.offset) + ": expected " + finding.expected +
            ", found " + finding.found + "\n";
    is_found =
        is_found || (finding.file.find(craft.found_in) != std::string::npos && finding.grade == craft.grade);
  }
  EXPECT_TRUE(is_found) << "not among\n" << seen;
}

TEST_P(CraftedDamageTest, LetsLookupsEnd) {
  ASSERT_NO_FATAL_FAILURE(Apply(GetParam()));
  ExpectLookupsToEnd(path());
}

// Commits, whose checksum would tell anything else.
class CraftedCommitTest : public ::testing::Test {
 protected:
  void SetUp() override {
    WriteSmallIndex(folder_.path(), false);
    for (const std::string& name : ListFolder(folder_.path())) {
      if (name.starts_with("segments_")) name_ = folder_ / name;
    }
    intact_ = ReadFile(name_);
    ASSERT_EQ(intact_.substr(20, 3), "\x02_0");
  }

  HealthReport CheckWith(uint64_t offset, const std::string& bytes) const {
    constexpr size_t kChecksumLength = 8;
    std::string damaged = intact_.substr(0, intact_.size() - kChecksumLength);
    damaged.replace(offset, bytes.size(), bytes);
    WriteFile(name_, ByteWriter().Raw(damaged).Checksum().bytes());
    ExpectLookupsToEnd(folder_.path());
    return CheckIndexHealth(folder_.path());
  }

  TemporaryFolder folder_;
  std::string name_;
  std::string intact_;
};

TEST_F(CraftedCommitTest, IsFoundBelowAChecksumThatIsRight) {
  EXPECT_TRUE(CheckWith(20, "\x02").clean());
  EXPECT_FALSE(CheckWith(0, Int(-10)).clean()) << "format";
  EXPECT_FALSE(CheckWith(12, Int(0)).clean()) << "number of the next segment";
  EXPECT_FALSE(CheckWith(16, Int(-1)).clean()) << "count of segments";
  EXPECT_FALSE(CheckWith(16, Int(1 << 30)).clean()) << "count of segments";
  EXPECT_FALSE(CheckWith(20, VInt(-1)).clean()) << "length of the name";
  EXPECT_FALSE(CheckWith(21, "..").clean()) << "name";
  EXPECT_FALSE(CheckWith(23, Int(-1)).clean()) << "documents";
  EXPECT_FALSE(CheckWith(23, Int(4)).clean()) << "documents";
  EXPECT_FALSE(CheckWith(27, Long(-2)).clean()) << "generation of deletions";
  EXPECT_FALSE(CheckWith(27, Long(-1)).clean()) << "deleted documents without a file";
  EXPECT_FALSE(CheckWith(27, Long(9)).clean()) << "generation of deletions";
  EXPECT_FALSE(CheckWith(35, Int(-2)).clean()) << "place in a document store";
  EXPECT_FALSE(CheckWith(35, Int(0)).clean()) << "place in a document store";
}

TEST_F(CraftedCommitTest, IsFoundByItsChecksumAndItsEnd) {
  WriteFile(name_, intact_ + "more");
  ASSERT_EQ(CheckIndexHealth(folder_.path()).findings.size(), 1U);
  EXPECT_EQ(CheckIndexHealth(folder_.path()).findings[0].offset, intact_.size());
  for (size_t offset = 0; offset < intact_.size(); ++offset) {
    std::string damaged = intact_;
    damaged[offset] = static_cast<char>(damaged[offset] ^ 0x10);
    WriteFile(name_, damaged);
    EXPECT_FALSE(CheckIndexHealth(folder_.path()).clean()) << offset;
  }
}

}  // namespace
}  // namespace vantrel::elastic

// Files that are small on disk and announce more than any machine has: every action must end soon and in little memory.

#include <gmock/gmock.h>
#include <gtest/gtest.h>
#include <sys/wait.h>
#include <zlib.h>

#include <algorithm>
#include <csignal>
#include <cstdint>
#include <filesystem>
#include <string>
#include <vector>

#include "damage/limited_run.h"
#include "support/byte_writer.h"
#include "support/files.h"
#include "support/sanitized.h"
#include "support/shared_prefix_index.h"
#include "support/small_index.h"
#include "support/sparse_file.h"
#include "support/temporary_folder.h"
#include "vantrel/elastic/index_health.h"

namespace quorelastic::testing {
namespace {

using ::testing::ElementsAre;
using ::testing::Field;
using ::testing::HasSubstr;
using vantrel::elastic::CheckIndexHealth;
using vantrel::elastic::HealthFinding;

constexpr int64_t kMebibyte = int64_t{1} << 20;
// As the format's readers have them.
constexpr int kMostFields = 65'536;
constexpr int kMostSegments = 4096;

constexpr int64_t kMostOfCheck = 64 * kMebibyte;
constexpr int64_t kMostOfOthers = 128 * kMebibyte;

class CraftedBoundsTest : public ::testing::Test {
 protected:
  const std::string& path() const { return folder_.path(); }

  // Adds field names, all different and with a hole in each that is long, to the field that is there.
  void AddFieldNames(const std::string& file, int names, uint64_t longest) const {
    std::string bytes = ReadFile(folder_ / file);
    ASSERT_EQ(bytes.substr(5, 6),
              "\x01\x04"
              "body");
    SparseFile out(folder_ / file);
    out.Bytes(ByteWriter().VInt(-2).VInt(names + 1).Raw(bytes.substr(6)).bytes());
    for (int number = 1; number <= names; ++number) {
      const std::string start = ShortText(number);
      const uint64_t length = std::max<uint64_t>(longest, start.size());
      out.Bytes(ByteWriter().VInt(static_cast<int64_t>(length)).Raw(start).bytes());
      out.Hole(length - start.size() + 1);  // with the flags
    }
    out.Close();
  }

  // Another one for each number, of three bytes at most.
  static std::string ShortText(int number) {
    std::string text;
    for (; number > 0; number /= 90) text.push_back(static_cast<char>('!' + number % 90));
    return text;
  }

  // The only document's vector has one term with so many positions and offsets, in a hole.
  void WriteVectorOfOccurrences(uint64_t occurrences) const {
    SparseFile out(folder_ / "_0.tvf");
    constexpr int kPositionsAndOffsets = 3;
    out.Bytes(ByteWriter().Int(4).VInt(1).Byte(kPositionsAndOffsets).VInt(0).String("a").bytes());
    out.Bytes(ByteWriter().VInt(static_cast<int64_t>(occurrences)).bytes()).Hole(3 * occurrences).Close();
  }

  // A commit with so many diagnostics.
  void WriteDiagnostics(int diagnostics) const {
    ByteWriter commit = ByteWriter().Int(-9).Long(1).Int(1).Int(1);
    commit.String("_0").Int(3).Long(-1).Int(-1).Byte(1).Int(-1).Byte(-1).Int(0).Byte(1).Int(diagnostics);
    for (int number = 0; number < diagnostics; ++number) commit.String(ShortText(number)).VInt(0);
    RemoveCommit();
    WriteFile(folder_ / "segments_1", commit.Int(0).Checksum().bytes());
  }

  void RemoveCommit() const {
    for (const std::string& name : ListFolder(path())) {
      if (name.starts_with("segments") || name.ends_with(".del")) std::filesystem::remove(folder_ / name);
    }
  }

  // The only segment with as many documents as there can be, one of them deleted. Only what is needed to open it.
  void WriteDeletedDocument() const {
    constexpr int64_t kDocuments = 0x7fffffff;
    RemoveCommit();
    ByteWriter commit = ByteWriter().Int(-4).Long(1).Int(1).Int(1);
    commit.String("_0").Int(kDocuments).Long(1).Int(-1).Byte(1).Int(-1).Byte(-1);
    WriteFile(folder_ / "segments_1", commit.bytes());
    WriteFile(folder_ / "_0_1.del", ByteWriter().Int(-1).Int(kDocuments).Int(1).VInt(0).Byte(1).bytes());
    SparseFile index(folder_ / "_0.fdx");
    index.Bytes(ByteWriter().Int(2).bytes()).Hole(8 * kDocuments).Close();
  }

  // The only segment, so many times.
  void Multiply(int segments) const {
    ByteWriter commit;
    constexpr int kNextNumber = 2'000'000;  // names are counted in base 36
    commit.Int(-4).Long(1).Int(kNextNumber).Int(segments);
    for (int number = 0; number < segments; ++number) {
      const std::string name = "_" + std::to_string(number);
      commit.String(name).Int(3);
      commit.Long(-1).Int(-1).Byte(1).Int(-1).Byte(-1);  // nothing deleted, nothing shared, no compound file
    }
    RemoveCommit();
    for (const std::string& name : ListFolder(path())) {
      if (!name.starts_with("_0.")) continue;
      for (int number = 1; number < segments; ++number) {
        std::filesystem::create_hard_link(folder_ / name,
                                          folder_ / ("_" + std::to_string(number) + name.substr(2)));
      }
    }
    WriteFile(folder_ / "segments_1", commit.bytes());
  }

  // 8 MiB of compressed values in the first document, which become 8 GiB.
  void WriteInflatingValues() const {
    constexpr size_t kValueSize = 16 * kMebibyte;
    constexpr int kValues = 512;
    const std::string text(kValueSize, 'x');
    std::string value(compressBound(kValueSize), '\0');
    uLongf length = value.size();
    ASSERT_EQ(compress2(reinterpret_cast<Bytef*>(value.data()), &length,
                        reinterpret_cast<const Bytef*>(text.data()), text.size(), 9),
              Z_OK);
    value.resize(length);
    ByteWriter records;
    records.Int(1).VInt(kValues);
    for (int left = kValues; left > 0; --left) records.VInt(0).Byte(4).String(value);
    const auto second = static_cast<int64_t>(records.size());
    records.VInt(0).VInt(0);
    WriteFile(folder_ / "_0.fdt", records.bytes());
    WriteFile(folder_ / "_0.fdx", ByteWriter().Int(1).Long(4).Long(second).Long(second + 1).bytes());
  }

  // The check and every lookup; `verdict` is what the check prints.
  void ExpectLittleMemory(const std::string& verdict) const {
    const LimitedRun check = Run("check", kMostOfCheck);
    EXPECT_EQ(check.errors, verdict + "\n");
    for (const char* action : {"allterm", "term", "position", "doc_term", "term_suggest"})
      Run(action, kMostOfOthers);
  }

  LimitedRun Run(const std::string& action, int64_t most) const {
    const LimitedRun run =
        RunToolLimited({"-a", action, "-d", path(), "-f", field_, "-t", "beta", "-n", "0"});
    // An error that an action does not catch ends it in SIGABRT, after it has said which.
    EXPECT_TRUE(WIFEXITED(run.status) ||
                (WTERMSIG(run.status) == SIGABRT && run.errors.find("what():") != std::string::npos))
        << action << " ends in signal " << WTERMSIG(run.status) << ": " << run.errors;
    EXPECT_THAT(run.output + run.errors, ::testing::Not(HasSubstr("bad_alloc"))) << action;
    if (!kIsSanitized) {
      EXPECT_LT(run.peak_bytes, most) << action;
    }
    return run;
  }

  void ExpectFinding(const std::string& file, const std::string& found) const {
    EXPECT_THAT(CheckIndexHealth(path()).findings,
                ElementsAre(::testing::AllOf(Field(&HealthFinding::file, HasSubstr(file)),
                                             Field(&HealthFinding::found, HasSubstr(found)))));
  }

  TemporaryFolder folder_;
  std::string field_ = "body";
};

TEST_F(CraftedBoundsTest, FieldNamesOfGigabytesTakeLittle) {
  WriteSmallIndex(path(), false);
  AddFieldNames("_0.fnm", 8192, kMebibyte);
  ExpectLittleMemory("NOT clean");
  ExpectFinding("_0.fnm", "bytes is too long");
}

TEST_F(CraftedBoundsTest, SubFileNamesOfGigabytesTakeLittle) {
  WriteSmallIndex(path(), true);
  constexpr int kNames = 8192;
  constexpr int64_t kBegin = kNames * kMebibyte;
  SparseFile out(folder_ / "_0.cfs");
  out.Bytes(ByteWriter().VInt(kNames).bytes());
  for (int number = 1; number <= kNames; ++number) {
    // The offset, and what the length and the name take.
    out.Bytes(ByteWriter().Long(kBegin + 32 * kNames).VInt(kMebibyte - number).bytes());
    out.Hole(static_cast<uint64_t>(kMebibyte - number));
  }
  out.Hole(64 * kMebibyte).Close();
  ExpectLittleMemory("NOT clean");
  ExpectFinding("_0.cfs", "bytes is too long");
}

TEST_F(CraftedBoundsTest, FieldNamesOfManySegmentsTakeLittle) {
  WriteSmallIndex(path(), false);
  AddFieldNames("_0.fnm", 500, 4096);
  Multiply(60);
  ExpectLittleMemory("clean");
}

TEST_F(CraftedBoundsTest, ShortFieldNamesOfManySegmentsTakeLittle) {
  WriteSmallIndex(path(), false);
  AddFieldNames("_0.fnm", kMostFields - 1, 1);
  Multiply(26);
  Run("term_suggest", kMostOfOthers);
}

TEST_F(CraftedBoundsTest, AllTheFieldNamesThatALookupMayHoldTakeLittle) {
  WriteSmallIndex(path(), false);
  AddFieldNames("_0.fnm", kMostFields - 2, 32);
  Multiply(2);
  ExpectLittleMemory("clean");
}

TEST_F(CraftedBoundsTest, LongTextsThatEntriesOfTheIndexShareTakeLittle) {
  SharedPrefixIndex{.terms = 3000, .interval = 1}.Write(path());
  field_ = "f";
  ExpectLittleMemory("clean");
}

TEST_F(CraftedBoundsTest, ARepairLeavesAloneWhatIsCleanButNeedsMuchMemory) {
  SharedPrefixIndex{.terms = 20'000, .interval = 1}.Write(path());
  const LimitedRun run = RunToolLimited({"-a", "repair", "-d", path()});
  EXPECT_THAT(run.errors, HasSubstr("too much memory or time to check segment _0; nothing was changed"));
  EXPECT_TRUE(std::filesystem::exists(folder_ / "segments_1"));
  EXPECT_TRUE(CheckIndexHealth(path()).clean());
}

TEST_F(CraftedBoundsTest, LongTextsThatTermsOfAVectorShareTakeLittle) {
  SharedPrefixIndex{.terms = 3000, .has_vectors = true}.Write(path());
  field_ = "f";
  ExpectLittleMemory("clean");
}

TEST_F(CraftedBoundsTest, PlacesOfAVectorTakeLittle) {
  WriteSmallIndex(path(), false);
  WriteVectorOfOccurrences(10'000'000);
  ExpectLittleMemory("NOT clean");
}

TEST_F(CraftedBoundsTest, DiagnosticsTakeLittle) {
  WriteSmallIndex(path(), false);
  WriteDiagnostics(700'000);
  ExpectLittleMemory("NOT clean");
  ExpectFinding("segments_1", "strings of diagnostics");
}

TEST_F(CraftedBoundsTest, DeletedDocumentsTakeLittle) {
  WriteSmallIndex(path(), false);
  WriteDeletedDocument();
  ExpectLittleMemory("NOT clean");
}

TEST_F(CraftedBoundsTest, ManySegmentsTakeLittle) {
  WriteSmallIndex(path(), false);
  Multiply(kMostSegments);
  ExpectLittleMemory("clean");
}

// Each of them would keep the checker busy as long as it is let.
TEST_F(CraftedBoundsTest, ARepairTriesFewSegmentsThatTheCheckerDoesNotSurvive) {
  WriteSmallIndex(path(), false);
  const std::string dictionary = folder_ / "_0.tis";
  WriteFile(dictionary, ReadFile(dictionary).replace(12, 4, ByteWriter().Int(0).bytes()));
  Multiply(1000);
  EXPECT_EQ(Run("repair", kMostOfOthers).errors, "done\n");
}

TEST_F(CraftedBoundsTest, StoredValuesThatInflateToGigabytesTakeLittle) {
  WriteSmallIndex(path(), false);
  ASSERT_NO_FATAL_FAILURE(WriteInflatingValues());
  ExpectLittleMemory("NOT clean");
  ExpectFinding("_0.fdt", "inflate to more than 32 times their size");
}

}  // namespace
}  // namespace quorelastic::testing

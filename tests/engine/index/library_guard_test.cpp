#include "elastic/index/library_guard.h"

#include <gtest/gtest.h>

#include <filesystem>
#include <string>
#include <vector>

#include "read_back.h"
#include "support/expect_damage.h"
#include "support/files.h"
#include "support/temporary_folder.h"
#include "vantrel/elastic/index.h"
#include "vantrel/elastic/index_error.h"

namespace vantrel::elastic {
namespace {

using ::quorelastic::testing::ExpectIndexError;
using ::quorelastic::testing::MakeDocument;
using ::quorelastic::testing::ReadFile;
using ::quorelastic::testing::TemporaryFolder;
using ::quorelastic::testing::WriteFile;

constexpr const char* kNotAsWritten = "is not what was written";
constexpr const char* kUnsafe = "expected ";

// An index of one commit, its second, with one compound file.
class LibraryGuardTest : public ::testing::Test {
 protected:
  LibraryGuardTest() {
    const auto index = Index::Create(path_, ::quorelastic::testing::IdAndBody());
    index->Add(MakeDocument("a", "red word"));
    index->Commit();
    whole_ = ReadFile(Segment());
  }

  std::string Segment() const { return path_ + "/_0.cfs"; }
  std::string Manifest() const { return path_ + "/quorelastic.manifest"; }

  // With another place of the first sub-file in the table at the front.
  static std::string Damage(std::string bytes) {
    bytes[4] = static_cast<char>(bytes[4] ^ 0x04);
    return bytes;
  }
  std::string Damaged() const { return Damage(whole_); }

  // As a restore does it: the old file lives on where it is open.
  void PutInPlace(const std::string& bytes) const {
    WriteFile(Segment() + ".new", bytes);
    std::filesystem::rename(Segment() + ".new", Segment());
  }

  // Without a change of anything by which a file is known again: only who reads it sees.
  void DamageUnseen() const {
    const auto changed = std::filesystem::last_write_time(Segment());
    WriteFile(Segment(), Damaged());
    std::filesystem::last_write_time(Segment(), changed);
  }

  // Replaces the index by a whole one with a file of the same name, as its third commit and without a manifest.
  // Returns what the file holds.
  std::string PutAnotherIndexInPlace() const {
    const std::string other = folder_ / "other";
    const auto index = Index::Create(other, ::quorelastic::testing::IdAndBody());
    index->Add(MakeDocument("b", "a longer word"));
    index->Commit();
    std::filesystem::remove(Manifest());
    const std::string bytes = ReadFile(other + "/_0.cfs");
    PutInPlace(bytes);
    WriteFile(path_ + "/segments_3", ReadFile(other + "/segments_2"));
    return bytes;
  }

  std::string Read(const std::string& name = "_0.cfs") {
    const auto file = guard_.Open(name);
    std::string bytes(file->size(), '\0');
    file->ReadAt(0, std::span(reinterpret_cast<uint8_t*>(bytes.data()), bytes.size()));
    return bytes;
  }

  TemporaryFolder folder_;
  std::string path_ = folder_ / "index";
  std::string whole_;
  LibraryGuard guard_{path_};
};

TEST_F(LibraryGuardTest, HandsOutTheFilesOfTheNewestCommit) {
  EXPECT_EQ(guard_.AdmitNewestCommit(), 2);
  EXPECT_EQ(Read(), whole_);
  EXPECT_FALSE(Read("segments_2").empty());
}

TEST_F(LibraryGuardTest, LooksForTheCommitOfAFileItDoesNotKnow) { EXPECT_EQ(Read(), whole_); }

TEST_F(LibraryGuardTest, RefusesAFileOfNoCommit) {
  WriteFile(path_ + "/_7.fdt", "stray");
  ExpectIndexError("_7.fdt: neither of the newest commit nor of its manifest", [&] { Read("_7.fdt"); });
  ExpectIndexError("_8.fdt: cannot open file: No such file or directory", [&] { Read("_8.fdt"); });
}

TEST_F(LibraryGuardTest, RefusesACommitThatCannotBeDecoded) {
  WriteFile(path_ + "/segments_9", "no commit");
  ExpectIndexError("segments_9", [&] { Read("segments_9"); });
}

TEST_F(LibraryGuardTest, VerifiesAFileAnewThatTookAnothersPlace) {
  Read();
  PutInPlace(Damaged());
  ExpectIndexError(kNotAsWritten, [&] { Read(); });
  PutInPlace(whole_);
  EXPECT_EQ(Read(), whole_);
}

TEST_F(LibraryGuardTest, ChecksAFileAnewThatTookAnothersPlaceWhereThereIsNoManifest) {
  std::filesystem::remove(Manifest());
  EXPECT_EQ(Read(), whole_);
  PutInPlace(Damaged());
  ExpectIndexError(kUnsafe, [&] { Read(); });
}

TEST_F(LibraryGuardTest, ChecksAFileThatTookAnothersPlaceButOnce) {
  std::filesystem::remove(Manifest());
  EXPECT_EQ(guard_.AdmitNewestCommit(), 2);
  PutInPlace(whole_);
  EXPECT_EQ(guard_.AdmitNewestCommit(), 2);
  DamageUnseen();
  EXPECT_EQ(guard_.AdmitNewestCommit(), 2);
}

TEST_F(LibraryGuardTest, HandsOutWhatPassedTheCheckThoughAnOlderManifestHadAnotherFileOfThatName) {
  EXPECT_EQ(guard_.AdmitNewestCommit(), 2);
  Read();
  const std::string another = PutAnotherIndexInPlace();
  EXPECT_EQ(guard_.AdmitNewestCommit(), 3);
  EXPECT_EQ(Read(), another);
}

TEST_F(LibraryGuardTest, ChecksWhatHasNoManifestThoughAnOlderOneHadAFileOfThatName) {
  EXPECT_EQ(guard_.AdmitNewestCommit(), 2);
  const std::string another = PutAnotherIndexInPlace();
  EXPECT_EQ(guard_.AdmitNewestCommit(), 3);
  EXPECT_EQ(Read(), another);
  PutInPlace(Damaged());
  ExpectIndexError(kUnsafe, [&] { guard_.AdmitNewestCommit(); });
}

TEST_F(LibraryGuardTest, ForgetsTheFilesThatTheNewestCommitDoesNotHave) {
  std::filesystem::remove(Manifest());
  EXPECT_EQ(Read(), whole_);
  const std::string empty = folder_ / "empty";
  Index::Create(empty, ::quorelastic::testing::IdAndBody());
  WriteFile(path_ + "/segments_3", ReadFile(empty + "/segments_1"));
  EXPECT_EQ(guard_.AdmitNewestCommit(), 3);
  ExpectIndexError("neither of the newest commit nor of its manifest", [&] { Read(); });
}

TEST_F(LibraryGuardTest, TakesAManifestThatComesLate) {
  const std::string manifest = ReadFile(Manifest());
  std::filesystem::remove(Manifest());
  guard_.AdmitNewestCommit();
  const auto opened_before = guard_.Open("_0.cfs");
  WriteFile(Manifest(), manifest);
  guard_.AdmitNewestCommit();
  WriteFile(Segment(), Damaged());
  uint8_t byte = 0;
  ExpectIndexError(kNotAsWritten, [&] { opened_before->ReadAt(0, {&byte, 1}); });
  ExpectIndexError(kNotAsWritten, [&] { Read(); });
}

TEST_F(LibraryGuardTest, DoesNotFallBackToTheCommitBeforeARefusedOne) {
  const std::string before = ReadFile(path_ + "/segments_2");
  {
    const auto index = Index::Open(path_);
    index->Add(MakeDocument("b", "blue word"));
    index->Commit();
  }
  WriteFile(path_ + "/segments_2", before);
  std::filesystem::remove(Manifest());
  WriteFile(path_ + "/_1.cfs", Damage(ReadFile(path_ + "/_1.cfs")));
  for (int i = 0; i < 2; ++i) ExpectIndexError("_1.cfs", [&] { guard_.AdmitNewestCommit(); });
}

TEST_F(LibraryGuardTest, RefusesForAWhileWithoutCheckingAgainUntilToldToForget) {
  std::filesystem::remove(Manifest());
  PutInPlace(Damaged());
  ExpectIndexError(kUnsafe, [&] { guard_.AdmitNewestCommit(); });
  PutInPlace(whole_);
  ExpectIndexError(kUnsafe, [&] { guard_.AdmitNewestCommit(); });
  guard_.Forget();
  EXPECT_EQ(guard_.AdmitNewestCommit(), 2);
  EXPECT_EQ(Read(), whole_);
}

TEST_F(LibraryGuardTest, KnowsWhatIsWrittenHereUntilItIsDeleted) {
  guard_.NoteWritten("_7.fdt");
  WriteFile(path_ + "/_7.fdt", "fresh");
  EXPECT_EQ(Read("_7.fdt"), "fresh");
  guard_.Forget();
  EXPECT_EQ(Read("_7.fdt"), "fresh");
  guard_.NoteDeleted("_7.fdt");
  ExpectIndexError("neither of the newest commit", [&] { Read("_7.fdt"); });
}

TEST_F(LibraryGuardTest, VerifiesWhatIsWrittenHereOnceThereIsAManifest) {
  guard_.AdmitNewestCommit();
  guard_.NoteWritten("_7.fdt");
  WriteFile(path_ + "/_7.fdt", "fresh");
  const auto file = guard_.Open("_7.fdt");
  format::Manifest manifest;
  manifest.files = {{.name = "_7.fdt", .size = 5, .digests = {1}}};
  guard_.Take(manifest);
  uint8_t byte = 0;
  ExpectIndexError(kNotAsWritten, [&] { file->ReadAt(0, {&byte, 1}); });
}

}  // namespace
}  // namespace vantrel::elastic

#include <gtest/gtest.h>

#include <filesystem>
#include <random>

#include "support/byte_writer.h"
#include "support/expect_damage.h"
#include "support/files.h"
#include "support/random_index.h"
#include "support/temporary_folder.h"
#include "vantrel/elastic/index_error.h"
#include "vantrel/elastic/suggest_terms.h"

namespace vantrel::elastic {
namespace {

using ::quorelastic::testing::ByteWriter;
using ::quorelastic::testing::ExpectDamage;
using ::quorelastic::testing::ListFolder;
using ::quorelastic::testing::ReadFile;
using ::quorelastic::testing::TemporaryFolder;
using ::quorelastic::testing::WriteFile;
using ::quorelastic::testing::WriteRandomIndex;

ByteWriter TermsHeader(int64_t count) { return ByteWriter().Int(-4).Long(count).Int(2).Int(16).Int(10); }

ByteWriter& AddTerm(ByteWriter& out, std::string_view text) {
  return out.VInt(0).String(text).VInt(0).VInt(1).VLong(1).VLong(0);
}

// An index of one segment with the field "f", its dictionary and the index over that.
void WriteIndex(const TemporaryFolder& folder, const std::string& terms, const std::string& index) {
  WriteFile(folder / "_0.fnm", ByteWriter().VInt(-2).VInt(1).String("f").Byte(1).bytes());
  WriteFile(folder / "_0.tis", terms);
  WriteFile(folder / "_0.tii", index);
  WriteFile(
      folder / "segments_1",
      ByteWriter().Int(-2).Long(1).Int(1).Int(1).String("_0").Int(100).Long(-1).Int(-1).Byte(0xff).bytes());
}

std::vector<SuggestedTerm> Suggest(const TemporaryFolder& folder, const std::string& prefix) {
  return SuggestTerms({folder.path()}, {.field = "f", .prefix = prefix});
}

TEST(DamagedDictionaryTest, TermsOutOfOrderOrTwiceAreDamage) {
  for (const char* second : {"a", "ab"}) {
    const TemporaryFolder folder;
    ByteWriter terms = TermsHeader(2);
    AddTerm(terms, "ab");
    const uint64_t offset = terms.size();
    AddTerm(terms, second);
    WriteIndex(folder, terms.bytes(), TermsHeader(0).bytes());
    ExpectDamage(offset, "term does not come after the one before it", [&] { Suggest(folder, "a"); });
  }
}

TEST(DamagedDictionaryTest, ATermThatIsNotUtf8IsDamage) {
  const TemporaryFolder folder;
  ByteWriter terms = TermsHeader(1);
  WriteIndex(folder, AddTerm(terms, "a\xff").bytes(), TermsHeader(0).bytes());
  ExpectDamage(24, "term is not valid UTF-8", [&] { Suggest(folder, "a"); });
}

TEST(DamagedDictionaryTest, AnIndexThatLeadsOutOfTheDictionaryIsDamage) {
  for (const uint64_t pointer : {uint64_t{1000}, uint64_t{1} << 62}) {
    const TemporaryFolder folder;
    ByteWriter terms = TermsHeader(1);
    AddTerm(terms, "a");
    ByteWriter index = TermsHeader(1);
    index.VInt(0).String("").VInt(-1).VInt(0).VLong(0).VLong(0).VLong(pointer);
    WriteIndex(folder, terms.bytes(), index.bytes());
    ExpectDamage(pointer, "the index over this dictionary places term 0 of 1 here",
                 [&] { Suggest(folder, "a"); });
  }
}

TEST(DamagedDictionaryTest, AnIndexOfMoreTermsThanThereAreIsDamage) {
  const TemporaryFolder folder;
  ByteWriter terms = TermsHeader(1);
  AddTerm(terms, "b");
  ByteWriter index = TermsHeader(2);
  index.VInt(0).String("").VInt(-1).VInt(0).VLong(0).VLong(0).VLong(24);
  index.VInt(0).String("a").VInt(0).VInt(1).VLong(1).VLong(0).VLong(0);
  WriteIndex(folder, terms.bytes(), index.bytes());
  ExpectDamage(24, "places term 2 of 1 here", [&] { Suggest(folder, "b"); });
}

TEST(DamagedDictionaryTest, AnUnknownLayoutIsDamage) {
  const TemporaryFolder folder;
  WriteIndex(folder, ByteWriter().Int(-5).Long(0).Int(2).Int(16).Int(10).bytes(), TermsHeader(0).bytes());
  ExpectDamage(0, "format is -5", [&] { Suggest(folder, "a"); });
}

// Every file in turn is damaged by a few hundred single bytes: what comes of it is suggestions, or an error that
// names a file of the folder.
TEST(DamagedDictionaryTest, AnyByteEndsInSuggestionsOrAnErrorThatNamesTheFile) {
  std::mt19937 random(11);
  int errors = 0;
  for (const bool compound : {false, true}) {
    const TemporaryFolder folder;
    WriteRandomIndex(
        folder.path(),
        {.seed = 5, .documents = 60, .deletions = 20, .compound = compound, .term_index_interval = 4});
    for (const std::string& name : ListFolder(folder.path())) {
      const std::string bytes = ReadFile(folder / name);
      for (int i = 0; i < 150 && !bytes.empty(); ++i) {
        std::string damaged = bytes;
        damaged[random() % bytes.size()] = static_cast<char>(random());
        // As a new file, which is quicker: some file systems flush one that is rewritten.
        std::filesystem::remove(folder / name);
        WriteFile(folder / name, damaged);
        for (const char* prefix : {"", "a", "\xce", "the"}) {
          try {
            SuggestTerms({folder.path()}, {.field = "body", .prefix = prefix, .limit = 100});
          } catch (const IndexError& error) {
            ++errors;
            EXPECT_EQ(std::string(error.what()).rfind(folder.path(), 0), 0U) << error.what();
          }
        }
      }
      WriteFile(folder / name, bytes);
    }
  }
  EXPECT_GT(errors, 100) << "hardly a damage was seen";
}

}  // namespace
}  // namespace vantrel::elastic

#include <gtest/gtest.h>

#include <filesystem>
#include <random>

#include "support/byte_writer.h"
#include "support/expect_damage.h"
#include "support/files.h"
#include "support/random_index.h"
#include "support/sanitized.h"
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

// The entries of an index: the one before all terms, and one behind a term.
ByteWriter& AddFirstEntry(ByteWriter& out, uint64_t pointer = 24) {
  return out.VInt(0).String("").VInt(-1).VInt(0).VLong(0).VLong(0).VLong(pointer);
}
ByteWriter& AddEntry(ByteWriter& out, std::string_view text, uint64_t pointer_step) {
  return out.VInt(0).String(text).VInt(0).VInt(1).VLong(2).VLong(0).VLong(pointer_step);
}

std::vector<SuggestedTerm> Suggest(const TemporaryFolder& folder, const std::string& prefix) {
  return SuggestTerms({folder.path()}, {.field = "f", .prefix = prefix});
}

// A dictionary of terms of one letter, two a block, each of seven bytes, and the index over it.
class LettersTest : public ::testing::Test {
 protected:
  static constexpr uint64_t kHeader = 24;
  static constexpr uint64_t kTerm = 7;

  static std::string Terms(std::string_view letters) {
    ByteWriter terms = TermsHeader(static_cast<int64_t>(letters.size()));
    for (const char letter : letters) AddTerm(terms, std::string_view(&letter, 1));
    return terms.bytes();
  }

  static std::string Index(std::string_view letters) {
    ByteWriter index = TermsHeader(static_cast<int64_t>(letters.size()) + 1);
    AddFirstEntry(index);
    for (const char letter : letters) AddEntry(index, std::string_view(&letter, 1), 2 * kTerm);
    return index.bytes();
  }

  TemporaryFolder folder_;
};

TEST_F(LettersTest, AreFoundWhereNothingIsDamaged) {
  WriteIndex(folder_, Terms("bdfhjlnp"), Index("dhl"));
  for (const char* letter : {"b", "d", "f", "h", "j", "l", "n", "p"}) {
    EXPECT_EQ(Suggest(folder_, letter), (std::vector<SuggestedTerm>{{letter, 1}}));
  }
  for (const char* letter : {"a", "c", "g", "m", "q"}) EXPECT_TRUE(Suggest(folder_, letter).empty());
}

TEST_F(LettersTest, ATermBeforeThePrefixThatIsOutOfOrderIsDamage) {
  WriteIndex(folder_, Terms("bdzhjlnp"), Index("dhl"));
  ExpectDamage(kHeader + 3 * kTerm, "term does not come after the one before it",
               [&] { Suggest(folder_, "h"); });
}

TEST_F(LettersTest, ATermThatIsNoLongerWhereItWasIsDamage) {
  WriteIndex(folder_, Terms("bdfhzlnp"), Index("dhl"));
  ExpectDamage(kHeader + 5 * kTerm, "term does not come after the one before it",
               [&] { Suggest(folder_, "j"); });
}

TEST_F(LettersTest, ABlockThatEndsOtherwiseThanTheIndexSaysIsDamage) {
  WriteIndex(folder_, Terms("bdfijlnp"), Index("dhl"));
  ExpectDamage(kHeader + 6 * kTerm, "not those that the index over the dictionary repeats",
               [&] { Suggest(folder_, "i"); });
}

TEST_F(LettersTest, IndexEntriesOutOfOrderAreDamage) {
  WriteIndex(folder_, Terms("bdfhjlnp"), Index("dbl"));
  ExpectDamage(43, "term does not come after the one before it", [&] { Suggest(folder_, "n"); });
}

TEST_F(LettersTest, AnIndexThatLeadsOutOfTheDictionaryIsDamage) {
  for (const uint64_t pointer : {uint64_t{1000}, uint64_t{1} << 62}) {
    ByteWriter index = TermsHeader(4);
    AddFirstEntry(index);
    AddEntry(index, "d", pointer - kHeader);
    AddEntry(index, "h", 14);
    AddEntry(index, "l", 14);
    WriteIndex(folder_, Terms("bdfhjlnp"), index.bytes());
    ExpectDamage(pointer, "the index over this dictionary places term 2 of 8 here",
                 [&] { Suggest(folder_, "j"); });
  }
}

TEST_F(LettersTest, HeadersThatContradictEachOtherAreDamage) {
  for (const auto& [header, problem] : {
           std::pair{ByteWriter().Int(-4).Long(3).Int(2).Int(16).Int(10),
                     "number of entries is 3, but by the dictionary it is 4"},
           std::pair{ByteWriter().Int(-4).Long(4).Int(3).Int(16).Int(10), "index interval is 3"},
           std::pair{ByteWriter().Int(-4).Long(4).Int(2).Int(17).Int(10), "skip interval is 17"},
           std::pair{ByteWriter().Int(-4).Long(4).Int(2).Int(16).Int(9), "number of skip levels is 9"},
           std::pair{ByteWriter().Int(-3).Long(4).Int(2).Int(16).Int(10), "format is -3"},
       }) {
    std::string index = Index("dhl");
    index.replace(0, header.size(), header.bytes());
    WriteIndex(folder_, Terms("bdfhjlnp"), index);
    ExpectDamage(0, problem, [&] { Suggest(folder_, "d"); });
  }
}

TEST(DamagedDictionaryTest, ATermTwiceOrBeforeTheOneBeforeItIsDamage) {
  for (const char* second : {"a", "ab"}) {
    const TemporaryFolder folder;
    ByteWriter terms = TermsHeader(2);
    AddTerm(terms, "ab");
    const uint64_t offset = terms.size();
    AddTerm(terms, second);
    ByteWriter index = TermsHeader(1);
    WriteIndex(folder, terms.bytes(), AddFirstEntry(index).bytes());
    ExpectDamage(offset, "term does not come after the one before it", [&] { Suggest(folder, "a"); });
  }
}

TEST(DamagedDictionaryTest, ATermThatIsNotUtf8IsDamage) {
  const TemporaryFolder folder;
  ByteWriter terms = TermsHeader(1);
  ByteWriter index = TermsHeader(1);
  WriteIndex(folder, AddTerm(terms, "a\xff").bytes(), AddFirstEntry(index).bytes());
  ExpectDamage(24, "term is not valid UTF-8", [&] { Suggest(folder, "a"); });
  ExpectDamage(24, "term is not valid UTF-8", [&] { Suggest(folder, "ab"); });
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
      for (int i = 0; i < 150 / ::quorelastic::testing::kFewer && !bytes.empty(); ++i) {
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
  EXPECT_GT(errors, 100 / ::quorelastic::testing::kFewer) << "hardly a damage was seen";
}

}  // namespace
}  // namespace vantrel::elastic

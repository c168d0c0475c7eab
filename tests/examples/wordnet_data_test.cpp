#include "wordnet/wordnet_data.h"

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <stdexcept>

#include "support/files.h"
#include "support/temporary_folder.h"

namespace wordnet {
namespace {

using ::quorelastic::testing::TemporaryFolder;
using ::quorelastic::testing::WriteFile;
using ::testing::ElementsAre;

constexpr const char* kLine =
    "00000042 03 n 02 sea_horse 0 hippocampus 1 001 @ 00000007 n 0000 | a small fish  ";

std::string ProblemWith(const std::string& line) {
  try {
    ParseSynset(line, 'n');
  } catch (const std::runtime_error& error) {
    return error.what();
  }
  return "";
}

TEST(WordnetDataTest, ALineBecomesASynset) {
  const Synset synset = ParseSynset(kLine, 'n');
  EXPECT_EQ(synset.id, "n00000042");
  EXPECT_EQ(synset.part_of_speech, "noun");
  EXPECT_THAT(synset.lemmas, ElementsAre("sea horse", "hippocampus"));
  EXPECT_EQ(synset.gloss, "a small fish");
}

TEST(WordnetDataTest, TheWordCountIsHexadecimal) {
  std::string line = "00000042 03 n 0a";
  for (char c = 'a'; c < 'k'; ++c) line += std::string(" ") + c + " 0";
  EXPECT_EQ(ParseSynset(line + " 000 | letters", 'n').lemmas.size(), 10U);
}

TEST(WordnetDataTest, ANoteOnWhereAnAdjectiveStandsIsNoPartOfIt) {
  const Synset synset = ParseSynset("00000042 00 s 02 out_of(p) 0 galore(ip) 0 000 | x", 'a');
  EXPECT_EQ(synset.part_of_speech, "adjective");
  EXPECT_THAT(synset.lemmas, ElementsAre("out of", "galore"));
}

TEST(WordnetDataTest, WhatIsNoSynsetIsRefused) {
  EXPECT_EQ(ProblemWith(""), "no gloss");
  EXPECT_EQ(ProblemWith("00000042 03 n 02 a 0 b 0 000"), "no gloss");
  EXPECT_EQ(ProblemWith("42 03 n 01 a 0 000 | x"), "the offset is not of eight digits");
  EXPECT_EQ(ProblemWith("00000042 03 n 0x a 0 000 | x"), "the word count is no number above 0");
  EXPECT_EQ(ProblemWith("00000042 03 n 00 000 | x"), "the word count is no number above 0");
  EXPECT_EQ(ProblemWith("00000042 03 n 03 a 0 b 0 | x"), "no word");
}

TEST(WordnetDataTest, AFileThatIsMissingOrSpoiltIsNamedWithTheLine) {
  const TemporaryFolder folder;
  const auto problem = [&]() -> std::string {
    try {
      ReadSynsets(folder.path());
    } catch (const std::runtime_error& error) {
      return error.what();
    }
    return "";
  };
  EXPECT_EQ(problem(), folder / "data.noun: cannot open: No such file or directory");
  for (const char* name : {"data.noun", "data.verb", "data.adj"}) WriteFile(folder / name, "  1 licence\n");
  WriteFile(folder / "data.adv", std::string("  1 licence\n") + kLine + "\nnonsense\n");
  EXPECT_EQ(problem(), folder / "data.adv, line 3: no gloss");
  WriteFile(folder / "data.adv", std::string("  1 licence\n") + kLine + "\n");
  ASSERT_EQ(problem(), "");
  EXPECT_EQ(ReadSynsets(folder.path()).front().id, "r00000042");
}

}  // namespace
}  // namespace wordnet

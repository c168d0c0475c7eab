#include "vantrel/elastic/index_settings.h"

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <filesystem>

#include "read_back.h"
#include "support/files.h"
#include "support/temporary_folder.h"
#include "vantrel/elastic/index.h"
#include "vantrel/elastic/index_error.h"
#include "vantrel/elastic/json_value.h"

namespace vantrel::elastic {
namespace {

using ::quorelastic::testing::IdAndBody;
using ::quorelastic::testing::ListFolder;
using ::quorelastic::testing::TemporaryFolder;
using ::quorelastic::testing::WriteFile;
using ::testing::Contains;
using ::testing::EndsWith;
using ::testing::IsEmpty;
using ::testing::Not;
using ::testing::StartsWith;

TEST(IndexSettingsTest, EverySettingComesBackAsItWas) {
  const TemporaryFolder folder;
  IndexSettings settings;
  settings.compound_files = false;
  settings.id_field = "key";
  settings.fields = {
      {.name = "key", .type = FieldType::kKeyword},
      {.name = "schlüssel", .type = FieldType::kKeyword, .stored = false, .norms = false},
      {.name = "a \"b\"\n", .term_vector = TermVector::kTerms, .frequencies = false},
      {.name = "p", .term_vector = TermVector::kPositions},
      {.name = "o", .term_vector = TermVector::kOffsets},
      {.name = "po", .term_vector = TermVector::kPositionsAndOffsets},
  };
  Index::Create(folder.path(), settings);
  const IndexSettings back = Index::Open(folder.path())->settings();
  EXPECT_FALSE(back.compound_files);
  EXPECT_EQ(back.id_field, "key");
  ASSERT_EQ(back.fields.size(), settings.fields.size());
  for (size_t i = 0; i < back.fields.size(); ++i) {
    EXPECT_EQ(back.fields[i].name, settings.fields[i].name);
    EXPECT_EQ(back.fields[i].type, settings.fields[i].type);
    EXPECT_EQ(back.fields[i].stored, settings.fields[i].stored);
    EXPECT_EQ(back.fields[i].term_vector, settings.fields[i].term_vector);
    EXPECT_EQ(back.fields[i].norms, settings.fields[i].norms);
    EXPECT_EQ(back.fields[i].frequencies, settings.fields[i].frequencies);
  }
  EXPECT_THAT(ListFolder(folder.path()), Not(Contains(EndsWith(".new"))));
}

TEST(IndexSettingsTest, SettingsThatMakeNoSenseAreRefusedBeforeAnythingIsMade) {
  const TemporaryFolder folder;
  const auto refusal = [&](const IndexSettings& settings) -> std::string {
    try {
      Index::Create(folder / "index", settings);
    } catch (const IndexValueError& error) {
      return error.what();
    }
    return "";
  };
  const std::string start = folder / "index: ";
  EXPECT_EQ(refusal({}), start + "the settings have no field");
  EXPECT_EQ(refusal({.fields = {{.name = ""}}}), start + "the settings have a field without a name");
  EXPECT_EQ(refusal({.fields = {{.name = "x"}, {.name = "y"}, {.name = "x"}}}),
            start + "the settings have two fields of the name \"x\"");
  EXPECT_EQ(refusal({.fields = {{.name = "x\xe9"}}}), start + R"(the field name "x\xe9" is not valid UTF-8)");
  EXPECT_EQ(refusal({.fields = {{.name = "\xef\xbf\xbf"}}}),
            start + "the field name \"\xef\xbf\xbf\" holds U+FFFF, which an index cannot keep");
  EXPECT_EQ(refusal({.fields = {{.name = "id"}}}), start + "the id field \"id\" is no stored keyword");
  EXPECT_EQ(refusal({.fields = {{.name = "id", .type = FieldType::kKeyword, .stored = false}}}),
            start + "the id field \"id\" is no stored keyword");
  EXPECT_EQ(refusal({.fields = {{.name = "body"}}, .id_field = ""}),
            start + "the settings have a field without a name");
  EXPECT_THAT(ListFolder(folder.path()), IsEmpty());
}

TEST(IndexSettingsTest, TheIdFieldIsPutBeforeTheOthersWhereItIsMissing) {
  const TemporaryFolder folder;
  const auto index = Index::Create(folder.path(), {.fields = {{.name = "body"}}, .id_field = "schlüssel"});
  for (const IndexSettings& settings : {index->settings(), Index::Open(folder.path())->settings()}) {
    EXPECT_EQ(settings.id_field, "schlüssel");
    ASSERT_EQ(settings.fields.size(), 2U);
    EXPECT_EQ(settings.fields[0].name, "schlüssel");
    EXPECT_EQ(settings.fields[0].type, FieldType::kKeyword);
    EXPECT_TRUE(settings.fields[0].stored);
    EXPECT_EQ(settings.fields[1].name, "body");
  }
}

// An index whose settings file each test spoils.
class SettingsFileTest : public ::testing::Test {
 protected:
  SettingsFileTest() {
    Index::Create(folder_.path(), IdAndBody());
    settings_.fromFile(file());
  }

  std::string file() const { return folder_ / "quorelastic.json"; }
  JsonValue& settings() { return settings_; }

  // What opening says, without the settings file's path.
  std::string Problem() const {
    try {
      Index::Open(folder_.path());
    } catch (const IndexValueError& error) {
      ADD_FAILURE() << "blames the call: " << error.what();
    } catch (const IndexError& error) {
      EXPECT_THAT(error.what(), StartsWith(file() + ": "));
      return std::string(error.what()).substr(file().size() + 2);
    }
    return "";
  }

  std::string ProblemWithSettings() const {
    WriteFile(file(), settings_.toString());
    return Problem();
  }

 private:
  TemporaryFolder folder_;
  JsonValue settings_;
};

TEST_F(SettingsFileTest, IsReadWhereItIsAsWritten) {
  EXPECT_EQ(ProblemWithSettings(), "");
  EXPECT_EQ(settings()["version"].asInt(), 1);
}

TEST_F(SettingsFileTest, IsRefusedWhereItIsNoJsonOrNoObject) {
  for (const char* text : {"", "{", "{} trailing", "\xff"}) {
    WriteFile(file(), text);
    EXPECT_EQ(Problem(), "the settings are no JSON document") << text;
  }
  WriteFile(file(), "[]");
  EXPECT_EQ(Problem(), "settings file is no object");
  WriteFile(file(), std::string((size_t{16} << 20) + 1, ' '));
  EXPECT_EQ(Problem(), "too large for a settings file");
}

TEST_F(SettingsFileTest, IsRefusedWhereItIsMissingOrAFolder) {
  std::filesystem::remove(file());
  EXPECT_EQ(Problem(), "cannot open file: No such file or directory");
  std::filesystem::create_directory(file());
  EXPECT_EQ(Problem(), "cannot open file: Is a directory");
}

TEST_F(SettingsFileTest, OfAnotherVersionIsRefused) {
  settings()["version"] = 2;
  EXPECT_EQ(ProblemWithSettings(), "settings file is of an unknown version");
  settings()["version"] = "1";
  EXPECT_EQ(ProblemWithSettings(), "settings file is of an unknown version");
  settings().removeMember("version");
  EXPECT_EQ(ProblemWithSettings(), "settings file lacks the member \"version\"");
}

TEST_F(SettingsFileTest, WithAWrongMemberIsRefused) {
  settings()["fields"][1]["type"] = "number";
  EXPECT_EQ(ProblemWithSettings(), "field 2 member \"type\" has the unknown value \"number\"");
  settings()["fields"][1]["type"] = 7;
  EXPECT_EQ(ProblemWithSettings(), "field 2 member \"type\" is no string");
  settings()["fields"][1] = "body";
  EXPECT_EQ(ProblemWithSettings(), "field 2 is no object");
  settings()["fields"] = Json::objectValue;
  EXPECT_EQ(ProblemWithSettings(), "settings file member \"fields\" is no array");
  settings()["compound_files"] = 1;
  EXPECT_EQ(ProblemWithSettings(), "settings file member \"compound_files\" is neither true nor false");
}

TEST_F(SettingsFileTest, WithAnIdFieldThatIsNoneIsRefused) {
  settings()["id_field"] = "body";
  EXPECT_EQ(ProblemWithSettings(), "the id field \"body\" is no stored keyword");
  settings()["id_field"] = "key";
  EXPECT_EQ(ProblemWithSettings(), "the settings lack the id field \"key\"");
  settings().removeMember("id_field");
  EXPECT_EQ(ProblemWithSettings(), "settings file lacks the member \"id_field\"");
}

TEST_F(SettingsFileTest, WithAnUnknownMemberIsRefused) {
  settings()["fields"][0]["boost"] = 2;
  EXPECT_EQ(ProblemWithSettings(), "field 1 has the unknown member \"boost\"");
  settings()["fields"][0].removeMember("boost");
  settings()["owner"] = "me";
  EXPECT_EQ(ProblemWithSettings(), "settings file has the unknown member \"owner\"");
}

TEST_F(SettingsFileTest, WithFieldsThatContradictEachOtherIsRefused) {
  settings()["fields"].append(settings()["fields"][0]);
  EXPECT_EQ(ProblemWithSettings(), "the settings have two fields of the name \"id\"");
}

TEST_F(SettingsFileTest, WithAPreProcessorThatIsNoneIsRefused) {
  JsonValue step(Json::objectValue);
  step["name"] = "stem";
  step["argument"] = "";
  settings()["fields"][1]["pre_processors"].append(step);
  EXPECT_THAT(ProblemWithSettings(), StartsWith("field \"body\": "));
}

}  // namespace
}  // namespace vantrel::elastic

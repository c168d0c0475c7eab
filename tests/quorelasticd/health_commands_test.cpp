// "check" and "repair", asked of a real daemon about real damage.

#include <gmock/gmock.h>

#include <algorithm>
#include <chrono>
#include <filesystem>
#include <map>
#include <memory>
#include <string>
#include <thread>
#include <vector>

#include "served_index.h"
#include "support/byte_writer.h"
#include "support/files.h"
#include "vantrel/elastic/index.h"

namespace quorelastic::testing {
namespace {

namespace fs = std::filesystem;
using ::testing::Contains;
using ::testing::HasSubstr;
using ::testing::IsSupersetOf;
using vantrel::elastic::Index;

class HealthCommandsTest : public ::testing::Test {
 protected:
  // Three segments of ten documents each, in plain files: "00" to "29".
  HealthCommandsTest() {
    EXPECT_TRUE(daemon_.is_ready()) << daemon_.Log();
    const auto index = MakeIndex("books");
    for (int segment = 0; segment < 3; ++segment) {
      for (int number = 0; number < 10; ++number) {
        index->Add({{{"id", std::to_string(segment) + std::to_string(number)}, {"title", "a word"}}});
      }
      index->Commit();
    }
  }

  // The daemon would use compound files.
  std::shared_ptr<Index> MakeIndex(const std::string& name) const {
    return Index::Create(daemon_.data() + "/" + name,
                         {.fields = {{.name = "title"}}, .compound_files = false});
  }

  // As a request has it.
  static std::string Book(const std::string& id) {
    return std::string(R"({"id":")").append(id).append(R"(","title":"a word"})");
  }

  void Expect(const std::string& request) { EXPECT_EQ(client_.AskForError(request), "") << request; }

  std::string File(const std::string& name) const { return daemon_.data() + "/books/" + name; }

  void FlipNorm(const std::string& segment) const {
    std::string norms = ReadFile(File(segment + ".nrm"));
    norms.back() = static_cast<char>(norms.back() ^ 1);
    WriteFile(File(segment + ".nrm"), norms);
  }

  // The index library divides by this.
  void MakeUnsafe(const std::string& segment) const {
    const std::string file = File(segment + ".tis");
    WriteFile(file, ReadFile(file).replace(12, 4, ByteWriter().Int(0).bytes()));
  }

  std::map<std::string, std::string> Contents() const {
    std::map<std::string, std::string> files;
    for (const std::string& name : ListFolder(daemon_.data() + "/books")) files[name] = ReadFile(File(name));
    return files;
  }

  JsonValue Repair(const std::string& members = "") {
    return client_.Ask(R"({"command":"repair","data":{"id":"books")" + members + "}}");
  }

  // The final reply to "check", with the findings that were streamed before.
  JsonValue Check(std::vector<Json::Value>* findings = nullptr) {
    const std::vector<JsonValue> replies = client_.Exchange(R"({"command":"check","data":{"id":"books"}})");
    for (const JsonValue& reply : replies) {
      for (const Json::Value& finding : reply["progress"]["findings"]) {
        if (findings != nullptr) findings->push_back(finding);
      }
    }
    return replies.back();
  }

  int CountFound() {
    return client_
        .Ask(R"({"command":"search","data":{"indice":["books"],"query_string":{"query":"title:word"}}})")
            ["result"]["total"]
        .asInt();
  }

  TemporaryFolder folder_;
  DaemonProcess daemon_{folder_.path()};
  DaemonClient client_{daemon_.socket()};
};

TEST_F(HealthCommandsTest, AHealthyIndexIsCleanAndTheCoverageIsTold) {
  const JsonValue reply = Check();
  ASSERT_TRUE(reply["success"].asBool()) << reply.toString();
  EXPECT_TRUE(reply["result"]["clean"].asBool());
  EXPECT_EQ(reply["result"]["findings"].asInt(), 0);
  const Json::Value& coverage = reply["result"]["coverage"];
  EXPECT_EQ(coverage["manifest"].asString(), "compared");
  EXPECT_EQ(coverage["generation"].asInt(), 4);
  std::vector<std::string> files;
  for (const Json::Value& file : coverage["files"]) files.push_back(file.asString());
  EXPECT_THAT(files, IsSupersetOf({"_0.tis", "_1.frq", "_2.fdt", "segments_4"}));
  EXPECT_GT(coverage["bytes"].asInt(), 1000);
}

TEST_F(HealthCommandsTest, WhatIsWrongIsStreamedWithItsPlaceAndGrade) {
  FlipNorm("_0");
  MakeUnsafe("_1");
  std::vector<Json::Value> findings;
  const JsonValue reply = Check(&findings);
  EXPECT_TRUE(reply["success"].asBool());
  EXPECT_FALSE(reply["result"]["clean"].asBool());
  EXPECT_EQ(reply["result"]["findings"].asUInt64(), findings.size());
  ASSERT_GE(findings.size(), 2U);
  EXPECT_EQ(findings.front()["file"].asString(), "_0.nrm");
  EXPECT_EQ(findings.front()["grade"].asString(), "damaged");
  EXPECT_EQ(findings.front()["segment"].asString(), "_0");
  EXPECT_THAT(findings.front()["expected"].asString(), HasSubstr("digest"));
  EXPECT_TRUE(findings.front().isMember("offset") && findings.front().isMember("found"));
  std::vector<std::string> grades;
  grades.reserve(findings.size());
  for (const Json::Value& finding : findings)
    grades.push_back(finding["file"].asString() + finding["grade"].asString());
  EXPECT_THAT(grades, Contains("_1.tisunsafe"));
}

TEST_F(HealthCommandsTest, ManyFindingsComeInSeveralReplies) {
  {
    const auto index = MakeIndex("many");
    for (int number = 0; number < 9; ++number) {
      index->Add({{{"id", std::to_string(number)}, {"title", "a word"}}});
      index->Commit();
    }
  }
  for (const std::string& name : ListFolder(daemon_.data() + "/many")) {
    if (name.starts_with('_')) WriteFile(daemon_.data() + "/many/" + name, "nothing of this is an index");
  }
  size_t told = 0;
  size_t most = 0;
  std::vector<JsonValue> replies = client_.Exchange(R"({"command":"check","data":{"id":"many"}})");
  for (const JsonValue& reply : replies) {
    told += reply["progress"]["findings"].size();
    most = std::max<size_t>(most, reply["progress"]["findings"].size());
  }
  EXPECT_GT(told, 50U);
  EXPECT_LE(most, 50U);
  EXPECT_EQ(replies.back()["result"]["findings"].asUInt64(), told);
}

TEST_F(HealthCommandsTest, AnIndexThatCannotEvenBeOpenedIsChecked) {
  Expect(
      R"({"command":"index_create","data":{"id":"broken","settings":{"fields":[{"name":"t","type":"text"}]}}})");
  WriteFile(daemon_.data() + "/broken/segments_1", "nonsense");
  EXPECT_EQ(client_.AskForError(R"({"command":"commit","data":{"id":"broken"}})"), "corrupt");
  const JsonValue reply = client_.Ask(R"({"command":"check","data":{"id":"broken"}})");
  EXPECT_TRUE(reply["success"].asBool());
  EXPECT_FALSE(reply["result"]["clean"].asBool());
  EXPECT_EQ(reply["result"]["coverage"]["generation"].asInt(), -1);
  EXPECT_EQ(client_.AskForError(R"({"command":"repair","data":{"id":"broken","dry_run":false}})"), "corrupt");
  EXPECT_EQ(ReadFile(daemon_.data() + "/broken/segments_1"), "nonsense");
}

TEST_F(HealthCommandsTest, WithoutAManifestThatIsSaid) {
  fs::remove(File("quorelastic.manifest"));
  FlipNorm("_0");
  const JsonValue reply = Check();
  EXPECT_TRUE(reply["result"]["clean"].asBool());
  EXPECT_EQ(reply["result"]["coverage"]["manifest"].asString(), "none");
}

TEST_F(HealthCommandsTest, UnknownIndexesAreNotFound) {
  for (const std::string command : {"check", "repair"}) {
    for (const char* name : {"nothing", "", "..", "../books", "import"}) {
      EXPECT_EQ(client_.AskForError(R"({"command":")" + command + R"(","data":{"id":")" + name + R"("}})"),
                "index_not_found");
    }
    EXPECT_EQ(client_.AskForError(R"({"command":")" + command + R"("})"), "bad_request");
  }
  EXPECT_EQ(client_.AskForError(R"({"command":"repair","data":{"id":"books","dry_run":"no"}})"),
            "bad_request");
}

TEST_F(HealthCommandsTest, ARepairOnlyTellsUnlessItIsToldOtherwise) {
  fs::remove(File("_0.frq"));
  MakeUnsafe("_2");
  const auto before = Contents();
  const JsonValue reply = Repair();
  ASSERT_TRUE(reply["success"].asBool()) << reply.toString();
  const Json::Value& result = reply["result"];
  EXPECT_TRUE(result["dry_run"].asBool());
  EXPECT_FALSE(result["clean"].asBool());
  EXPECT_EQ(result["documents_lost"].asInt(), 20);
  ASSERT_EQ(result["lost"].size(), 2U);
  EXPECT_EQ(result["lost"][0]["segment"].asString(), "_0");
  EXPECT_EQ(result["lost"][0]["documents"].asInt(), 10);
  EXPECT_FALSE(result["lost"][0]["condemned"].asBool());
  EXPECT_EQ(result["lost"][1]["segment"].asString(), "_2");
  EXPECT_TRUE(result["lost"][1]["condemned"].asBool());
  EXPECT_EQ(Contents(), before);
}

TEST_F(HealthCommandsTest, ARepairedIndexIsServedAgain) {
  EXPECT_EQ(CountFound(), 30);
  fs::remove(File("_1.frq"));
  const JsonValue reply = Repair(R"(,"dry_run":false)");
  ASSERT_TRUE(reply["success"].asBool()) << reply.toString();
  EXPECT_FALSE(reply["result"]["dry_run"].asBool());
  EXPECT_EQ(reply["result"]["documents_lost"].asInt(), 10);
  EXPECT_EQ(CountFound(), 20);
  EXPECT_TRUE(Check()["result"]["clean"].asBool());
  EXPECT_EQ(Check()["result"]["coverage"]["manifest"].asString(), "compared");
  Expect(R"({"command":"document_bulk","data":{"id":"books","documents":[)" + Book("new") + "]}}");
  EXPECT_EQ(CountFound(), 21);
  EXPECT_TRUE(Repair(R"(,"dry_run":false)")["result"]["clean"].asBool());
}

TEST_F(HealthCommandsTest, ChangesThatWerePromisedSurviveARepair) {
  Expect(R"({"command":"document_bulk","data":{"id":"books","commit":false,"documents":[)" + Book("new") +
         "]}}");
  EXPECT_TRUE(Repair(R"(,"dry_run":false)")["result"]["clean"].asBool());
  EXPECT_EQ(CountFound(), 31);
}

TEST_F(HealthCommandsTest, AnIndexInUseIsNotRepairedButChecked) {
  const std::string words = ManyWords(50000);
  Expect(R"({"command":"document_bulk","data":{"id":"books","documents":[{"id":"x","title":")" + words +
         "\"}]}}");
  DaemonClient reader(daemon_.socket());  // and its replies fill the socket before they end
  ASSERT_TRUE(reader.Send(R"({"command":"terms","data":{"id":"books","max":1000000}})"));
  reader.Receive();
  EXPECT_EQ(Repair(R"(,"dry_run":false)")["error"]["code"].asString(), "locked");
  EXPECT_TRUE(Repair()["result"]["clean"].asBool());
  EXPECT_TRUE(Check()["result"]["clean"].asBool());
  while (!reader.Receive().isMember("success")) continue;
  EXPECT_TRUE(Repair(R"(,"dry_run":false)")["result"]["clean"].asBool());
}

TEST_F(HealthCommandsTest, ARepairWhoseClientHasGoneComesToItsEnd) {
  fs::remove(File("_1.frq"));
  {
    DaemonClient leaving(daemon_.socket());
    ASSERT_TRUE(leaving.Send(R"({"command":"repair","data":{"id":"books","dry_run":false}})"));
  }
  for (int tries = 0; tries < 1000 && !fs::exists(File("segments_5")); ++tries) {
    std::this_thread::sleep_for(std::chrono::milliseconds(10));
  }
  while (client_.AskForError(R"({"command":"commit","data":{"id":"books"}})") == "locked") continue;
  EXPECT_EQ(CountFound(), 20);
}

TEST_F(HealthCommandsTest, ADaemonEndsInOrderWhileARepairIsUnderWay) {
  MakeUnsafe("_1");
  ASSERT_TRUE(client_.Send(R"({"command":"repair","data":{"id":"books","dry_run":false}})"));
  EXPECT_EQ(daemon_.Stop(), 0);
}

}  // namespace
}  // namespace quorelastic::testing

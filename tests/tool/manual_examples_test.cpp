// Replays the examples of the tool's manual, and its way of recovering a damaged index, with the real daemon.

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <filesystem>
#include <optional>
#include <string>
#include <vector>

#include "support/files.h"
#include "support/manual_page.h"
#include "support/sandbox_test.h"
#include "support/text_search.h"
#include "support/tool_run.h"
#include "tool/sandboxed_daemon.h"

namespace quorelastic::testing {
namespace {

namespace fs = std::filesystem;

// A command as it is typed, and what the manual shows of its output.
struct Example {
  std::string command;
  std::vector<std::string> output;
};

std::vector<Example> ReadExamples(const ManualPage::Section& section) {
  std::vector<Example> examples;
  for (const std::string& line : section.displayed) {
    if (line.starts_with("$ ")) {
      examples.push_back({line.substr(2), {}});
    } else if (examples.empty()) {
      continue;
    } else if (line.starts_with("> ")) {
      examples.back().command.append("\n").append(line, 2);
    } else {
      examples.back().output.push_back(line);
    }
  }
  return examples;
}

void ReplaceAll(std::string& text, const std::string& what, const std::string& with) {
  for (size_t at = 0; (at = text.find(what, at)) != std::string::npos; at += with.size()) {
    text.replace(at, what.size(), with);
  }
}

class ManualExamplesTest : public SandboxTest {
 protected:
  void SetUp() override {
    SandboxTest::SetUp();
    if (IsSkipped()) return;
    fs::create_directory(sandbox_.folder() + "/bin");
    fs::create_directory(sandbox_.folder() + "/srv");
    fs::create_symlink(ToolPath(), sandbox_.folder() + "/bin/quorelastic");
    daemon_.emplace(sandbox_, QUORELASTICD_PROGRAM);
  }

  // Runs the commands in one shell, so that each finds the folder and the status that the one before left.
  void Replay(const std::vector<Example>& examples) const {
    static const std::string mark = "-- next --";
    std::string script = "exec 2>&1\n";
    for (const Example& example : examples) {
      script += example.command + "\nstatus=$?; echo '" + mark + "'; (exit $status)\n";
    }
    ReplaceAll(script, "/srv/", sandbox_.folder() + "/srv/");
    const RunResult run = sandbox_.RunCommand(
        {"bash", "-c", script}, {.environment = {"PATH=" + sandbox_.folder() + "/bin:/usr/bin:/bin"}});
    std::vector<std::vector<std::string>> outputs(1);
    for (const std::string& line : SplitLines(run.out)) {
      if (line == mark) {
        outputs.emplace_back();
      } else {
        outputs.back().push_back(line);
      }
    }
    ASSERT_EQ(outputs.size(), examples.size() + 1) << run;
    for (size_t i = 0; i < examples.size(); ++i) Compare(examples[i], outputs[i]);
  }

  static void Compare(const Example& example, const std::vector<std::string>& actual) {
    EXPECT_EQ(example.output.size(), actual.size()) << example.command << "\n"
                                                    << ::testing::PrintToString(actual);
    for (size_t i = 0; i < std::min(example.output.size(), actual.size()); ++i) {
      EXPECT_TRUE(IsAsShown(actual[i], example.output[i]))
          << example.command << "\nthe manual: " << example.output[i] << "\nthe tool:   " << actual[i];
    }
  }

  void DamageBooks() const {
    const std::string file = sandbox_.data_root() + "/books/_1.cfs";
    fs::resize_file(file, fs::file_size(file) - 96);
  }

  void PutTheCopyBack() const {
    fs::remove_all(sandbox_.data_root() + "/books");
    CopyFolder(sandbox_.folder() + "/srv/books-damaged", sandbox_.data_root() + "/books");
  }

  const ManualPage page_ = ReadManualPage("quorelastic.8");
  Sandbox sandbox_;
  std::optional<SandboxedDaemon> daemon_;
};

TEST_F(ManualExamplesTest, GoAsTheManualShowsThemAndSoDoesARecovery) {
  const std::vector<Example> examples = ReadExamples(page_.Find("EXAMPLES"));
  ASSERT_GE(examples.size(), 10u);
  Replay(examples);

  const std::vector<Example> recovery = ReadExamples(page_.Find("RECOVERY"));
  ASSERT_EQ(recovery.size(), 6u);
  DamageBooks();
  Replay({recovery.begin(), recovery.begin() + 4});  // through the daemon

  EXPECT_EQ(daemon_->Stop(), 0);
  PutTheCopyBack();
  Replay({recovery.begin() + 4, recovery.end()});  // without it
}

}  // namespace
}  // namespace quorelastic::testing

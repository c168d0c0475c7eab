// The units that systemd runs the daemon by, as they are installed under /usr.

#include <gmock/gmock.h>
#include <unistd.h>

#include <cstdlib>
#include <filesystem>
#include <regex>
#include <string>
#include <vector>

#include "packaging/command_output.h"
#include "support/files.h"
#include "support/temporary_folder.h"
#include "support/text_search.h"

namespace quorelastic::testing {
namespace {

using ::testing::HasSubstr;
using ::testing::MatchesRegex;
using ::testing::SizeIs;

class ServiceUnits : public ::testing::Test {
 protected:
  void SetUp() override {
    OutputOf({"cmake", "--install", BUILD_FOLDER, "--prefix", "/usr", "--component", "quorelasticd"},
             {.environment = {"DESTDIR=" + root_.path()}});
  }

  std::string Installed(const std::string& path) const { return ReadFile(root_ / path); }

  TemporaryFolder root_;
};

TEST_F(ServiceUnits, AreUnderstoodWholly) {
  // A program that is there, in the place of the one that is not installed on this machine.
  const std::string service = root_ / "quorelasticd.service";
  std::string text = Installed("usr/lib/systemd/system/quorelasticd.service");
  const size_t program = text.find("/usr/sbin/quorelasticd ");
  ASSERT_NE(program, std::string::npos) << text;
  text.replace(program, std::string("/usr/sbin/quorelasticd").size(), "/bin/true");
  WriteFile(service, text);
  const std::string socket = root_ / "quorelasticd.socket";
  WriteFile(socket, Installed("usr/lib/systemd/system/quorelasticd.socket"));
  const RunResult run = RunCommand({"systemd-analyze", "verify", "--man=no", service, socket});
  EXPECT_EQ(run.status, 0) << run;
  EXPECT_EQ(run.err, "");
}

TEST_F(ServiceUnits, LeaveTheDaemonLittleToDoHarmWith) {
  // From 0, locked up, to 10, at large; the threshold is in tenths. What is left is a group that may read the files,
  // and the socket itself.
  const RunResult run = RunCommand({"systemd-analyze", "security", "--offline=true", "--threshold=5",
                                    "--no-pager", root_ / "usr/lib/systemd/system/quorelasticd.service"});
  EXPECT_EQ(run.status, 0) << run;
  EXPECT_THAT(run.out, HasSubstr("Overall exposure level for quorelasticd.service: 0."));
}

TEST_F(ServiceUnits, DoNotStartADaemonAgainThatRefusesItsOptions) {
  const RunResult run = RunCommand({std::string(BUILD_FOLDER) + "/bin/quorelasticd", "--no-such-option"});
  EXPECT_THAT(SplitLines(Installed("usr/lib/systemd/system/quorelasticd.service")),
              ::testing::Contains("RestartPreventExitStatus=" + std::to_string(run.status)));
}

TEST_F(ServiceUnits, LeaveRoomForTheMostThreadsThatTheDaemonTakes) {
  const std::string unit = Installed("usr/lib/systemd/system/quorelasticd.service");
  const std::string key = "\nTasksMax=";
  const size_t place = unit.find(key);
  ASSERT_NE(place, std::string::npos);
  EXPECT_GT(std::atoi(unit.c_str() + place + key.size()), 3 * 256 + 16);
}

TEST_F(ServiceUnits, LetTheDaemonOutliveAProcessOfItsOwnThatMemoryRunsOutFor) {
  EXPECT_THAT(SplitLines(Installed("usr/lib/systemd/system/quorelasticd.service")),
              ::testing::Contains("OOMPolicy=continue"));
}

TEST_F(ServiceUnits, ListenWhereTheToolConnectsAndForTheGroupAlone) {
  const auto lines = SplitLines(Installed("usr/lib/systemd/system/quorelasticd.socket"));
  for (const char* line :
       {"ListenStream=/run/quorelasticd.sock", "SocketMode=0660", "SocketGroup=quorelastic"}) {
    EXPECT_THAT(lines, ::testing::Contains(line));
  }
}

TEST_F(ServiceUnits, UnderUsrReadTheConfigurationInEtc) {
  EXPECT_THAT(SplitLines(Installed("usr/lib/systemd/system/quorelasticd.service")),
              ::testing::Contains("EnvironmentFile=-/etc/default/quorelasticd"));
  EXPECT_TRUE(std::filesystem::exists(root_ / "etc/default/quorelasticd"));
}

TEST_F(ServiceUnits, ElsewhereRunTheDaemonAndReadTheConfigurationThatAreInstalledBesideThem) {
  const TemporaryFolder prefix;
  OutputOf({"cmake", "--install", BUILD_FOLDER, "--prefix", prefix.path(), "--component", "quorelasticd"});
  const auto lines = SplitLines(ReadFile(prefix / "lib/systemd/system/quorelasticd.service"));
  EXPECT_THAT(lines,
              ::testing::Contains("ExecStart=" + prefix.path() + "/sbin/quorelasticd $QUORELASTICD_OPTIONS"));
  EXPECT_THAT(lines, ::testing::Contains("EnvironmentFile=-" + prefix.path() + "/etc/default/quorelasticd"));
  EXPECT_TRUE(std::filesystem::exists(prefix / "etc/default/quorelasticd"));
}

TEST_F(ServiceUnits, AConfigurationThatIsThereAlreadyStays) {
  const TemporaryFolder prefix;
  const std::vector<std::string> install = {"cmake",       "--install",   BUILD_FOLDER,  "--prefix",
                                            prefix.path(), "--component", "quorelasticd"};
  OutputOf(install);
  WriteFile(prefix / "etc/default/quorelasticd", "QUORELASTICD_OPTIONS=--verbose\n");
  OutputOf(install);
  EXPECT_EQ(ReadFile(prefix / "etc/default/quorelasticd"), "QUORELASTICD_OPTIONS=--verbose\n");
}

TEST_F(ServiceUnits, TheFoldersAreTheGroupsAsFarAsItNeedsThemAndAChangedModeOfTheImportFolderStays) {
  // The file's lines with a user that there is on this machine, whose owner need not be set.
  const std::string root = root_.path();
  const std::string id = std::to_string(geteuid());
  std::string lines;
  for (const std::string& line : SplitLines(Installed("usr/lib/tmpfiles.d/quorelasticd.conf"))) {
    lines += std::regex_replace(line, std::regex("quorelastic quorelastic -"),
                                id + " " + std::to_string(getegid()) + " -") +
             "\n";
  }
  WriteFile(root_ / "folders.conf", lines);
  const std::vector<std::string> make = {"systemd-tmpfiles", "--create", "--root=" + root,
                                         root_ / "folders.conf"};
  const auto modes = [&] {
    return OutputOf(
        {"stat", "--format=%a", root + "/var/lib/quorelastic", root + "/var/lib/quorelastic/import"});
  };
  OutputOf(make);
  EXPECT_EQ(modes(), "750\n3770\n");
  std::filesystem::permissions(root + "/var/lib/quorelastic/import", std::filesystem::perms::owner_all);
  OutputOf(make);
  EXPECT_EQ(modes(), "750\n700\n");
}

TEST_F(ServiceUnits, TheUserIsASystemUserWithoutALogin) {
  const TemporaryFolder machine;
  std::filesystem::create_directory(machine / "etc");
  const RunResult run = RunCommand(
      {"systemd-sysusers", "--root=" + machine.path(), root_ / "usr/lib/sysusers.d/quorelasticd.conf"});
  ASSERT_EQ(run.status, 0) << run;
  const auto users = SplitLines(ReadFile(machine / "etc/passwd"));
  ASSERT_THAT(users, SizeIs(1));
  EXPECT_THAT(users[0],
              MatchesRegex("quorelastic:[^:]*:[0-9]+:[0-9]+:Full-text search daemon:/var/lib/quorelastic:.*"
                           "/nologin"));
  EXPECT_LT(std::atoi(users[0].substr(users[0].find(':', 12) + 1).c_str()), 1000);
  EXPECT_THAT(ReadFile(machine / "etc/group"), HasSubstr("quorelastic:"));
}

}  // namespace
}  // namespace quorelastic::testing

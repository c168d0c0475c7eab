// What the daemon's package does to a machine when it is installed, upgraded, removed and purged: its scripts run in a
// sandbox with state folders of their own, where the commands that would reach systemd only note how they are called.

#include <gmock/gmock.h>

#include <filesystem>
#include <string>
#include <vector>

#include "packaging/command_output.h"
#include "packaging/package_path.h"
#include "support/files.h"
#include "support/sandbox_test.h"
#include "support/temporary_folder.h"
#include "support/text_search.h"

namespace quorelastic::testing {
namespace {

namespace fs = std::filesystem;
using ::testing::ElementsAre;
using ::testing::HasSubstr;

// What the package manager calls, in its order.
constexpr char kInstall[] = "postinst configure ''";
constexpr char kUpgrade[] = "prerm upgrade 9; postrm upgrade 9; postinst configure 0.1";
constexpr char kRemove[] = "prerm remove; postrm remove";
constexpr char kPurge[] = "postrm purge";

constexpr char kForgetCalls[] = "rm -f \"$LOG\"";
constexpr char kLinks[] = "cd /etc/systemd/system; find . -type l | sort";

class MaintainerScripts : public SandboxTest {
 protected:
  void SetUp() override {
    SandboxTest::SetUp();
    if (IsSkipped()) return;
    OutputOf({"dpkg-deb", "--raw-extract", PathOf("quorelasticd"), folder_ / "package"});
    fs::create_directory(folder_ / "commands");
    const std::string note = "echo \"${0##*/} $*\" >>\"$LOG\"\n";
    AddCommand("deb-systemd-invoke", note);
    AddCommand("systemd-sysusers", note);
    AddCommand("systemd-tmpfiles", note);
    // Links to units are set without systemd.
    AddCommand("systemctl", "[ \"$1\" != --root=/ ] || exec /usr/bin/systemctl \"$@\"\n" + note);
  }

  void AddCommand(const std::string& name, const std::string& script) const {
    const std::string path = folder_ / "commands/" + name;
    WriteFile(path, "#!/bin/sh\n" + script);
    fs::permissions(path, fs::perms::owner_all);
  }

  // Runs steps in one sandbox, one after the other.
  RunResult Run(const std::vector<std::string>& steps) const {
    std::string script =
        "for name in postinst prerm postrm; do eval \"$name() { sh -e $0/$name \\\"\\$@\\\"; }\"; done\n";
    if (systemd_runs_) script += "mkdir -p /run/systemd/system\n";
    for (const std::string& step : steps) script += step + "\n";
    const std::string units = "/usr/lib/systemd/system";
    std::vector<std::string> command = {"bwrap",   "--ro-bind",    "/",       "/",
                                        "--dev",   "/dev",         "--tmpfs", "/var/lib",
                                        "--tmpfs", "/etc/systemd", "--dir",   "/etc/systemd/system",
                                        "--tmpfs", "/run"};
    for (const std::string& word :
         {std::string("--bind"), folder_.path(), folder_.path(), std::string("--ro-bind"),
          folder_ / "package" + units, units, std::string("sh"), std::string("-ec"), script,
          folder_ / "package/DEBIAN"}) {
      command.push_back(word);
    }
    return RunCommand(command,
                      {.environment = {"DPKG_MAINTSCRIPT_PACKAGE=quorelasticd", "LOG=" + Log(),
                                       "PATH=" + folder_ / "commands" + ":/usr/sbin:/usr/bin:/sbin:/bin"}});
  }

  std::string Log() const { return folder_ / "log"; }
  std::vector<std::string> Calls() const {
    return fs::exists(Log()) ? SplitLines(ReadFile(Log())) : std::vector<std::string>();
  }

  TemporaryFolder folder_;
  bool systemd_runs_ = true;
};

TEST_F(MaintainerScripts, AnInstallationMakesTheUserAndTheFoldersAndStartsTheService) {
  const RunResult run = Run({kInstall, kLinks});
  EXPECT_EQ(run.status, 0) << run;
  EXPECT_THAT(Calls(),
              ElementsAre("systemd-sysusers quorelasticd.conf", "systemd-tmpfiles --create quorelasticd.conf",
                          "systemctl --system daemon-reload", "deb-systemd-invoke start quorelasticd.socket",
                          "deb-systemd-invoke restart quorelasticd.service"));
  // At boot too.
  EXPECT_THAT(SplitLines(run.out), ElementsAre("./multi-user.target.wants/quorelasticd.service",
                                               "./sockets.target.wants/quorelasticd.socket"));
}

TEST_F(MaintainerScripts, WhereSystemdDoesNotRunNothingIsStartedOrStopped) {
  systemd_runs_ = false;
  const RunResult run = Run({kInstall, kRemove, kPurge});
  EXPECT_EQ(run.status, 0) << run;
  EXPECT_THAT(Calls(), ElementsAre("systemd-sysusers quorelasticd.conf",
                                   "systemd-tmpfiles --create quorelasticd.conf"));
}

TEST_F(MaintainerScripts, AnUpgradeRestartsTheDaemonAndStopsNothing) {
  const RunResult run = Run({kInstall, kForgetCalls, kUpgrade});
  EXPECT_EQ(run.status, 0) << run;
  EXPECT_THAT(Calls(),
              ElementsAre("systemd-sysusers quorelasticd.conf", "systemd-tmpfiles --create quorelasticd.conf",
                          "systemctl --system daemon-reload", "deb-systemd-invoke start quorelasticd.socket",
                          "deb-systemd-invoke restart quorelasticd.service"));
}

TEST_F(MaintainerScripts, AnUpgradeLeavesAServiceDisabledThatTheAdministratorDisabled) {
  const RunResult run = Run({kInstall, "rm /etc/systemd/system/*.wants/*", kUpgrade, kLinks});
  EXPECT_EQ(run.status, 0) << run;
  EXPECT_EQ(run.out, "");
}

TEST_F(MaintainerScripts, ARemovalStopsTheSocketToo) {
  const RunResult run = Run({kInstall, kForgetCalls, kRemove});
  EXPECT_EQ(run.status, 0) << run;
  EXPECT_THAT(Calls(), ElementsAre("deb-systemd-invoke stop quorelasticd.socket quorelasticd.service",
                                   "systemctl --system daemon-reload"));
}

TEST_F(MaintainerScripts, APurgeForgetsWhatIsStartedAtBoot) {
  const RunResult run = Run({kInstall, kRemove, kPurge, kLinks, "find /var/lib/systemd -type f"});
  EXPECT_EQ(run.status, 0) << run;
  EXPECT_EQ(run.out, "");
}

TEST_F(MaintainerScripts, APurgeLeavesNothingOfADaemonWithoutIndexes) {
  const RunResult run = Run({"mkdir -p /var/lib/quorelastic/import; touch /var/lib/quorelastic/daemon.lock",
                             kPurge, "test ! -e /var/lib/quorelastic"});
  EXPECT_EQ(run.status, 0) << run;
  EXPECT_EQ(run.err, "");
}

TEST_F(MaintainerScripts, APurgeKeepsIndexes) {
  const RunResult run =
      Run({"mkdir -p /var/lib/quorelastic/import /var/lib/quorelastic/mail",
           "echo precious >/var/lib/quorelastic/mail/file", kPurge, "cat /var/lib/quorelastic/mail/file"});
  EXPECT_EQ(run.out, "precious\n");
  EXPECT_THAT(run.err, HasSubstr("the indexes in /var/lib/quorelastic are kept"));
}

}  // namespace
}  // namespace quorelastic::testing

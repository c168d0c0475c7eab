// The development packages as their users have them: the examples are built in a folder of their own, against what the
// two components of a library install and nothing else of this project.

#include <gmock/gmock.h>

#include <filesystem>
#include <string>
#include <vector>

#include "daemon_process.h"
#include "packaging/command_output.h"
#include "support/files.h"
#include "support/manual_page.h"
#include "support/temporary_folder.h"

namespace quorelastic::testing {
namespace {

using ::testing::HasSubstr;
using ::testing::StartsWith;

class InstalledLibrary : public ::testing::Test {
 protected:
  explicit InstalledLibrary(const std::string& name) {
    for (const std::string& component : {"lib" + name + "0", "lib" + name + "-dev"}) {
      OutputOf({"cmake", "--install", BUILD_FOLDER, "--prefix", prefix_.path(), "--component", component});
    }
    CopyFolder(prefix_ / ("share/doc/lib" + name + "-dev/examples"), source_);
  }

  // Both ways give the path of the program.
  std::string BuildWithCMake(const std::string& program) const {
    const std::string build = work_ / "build";
    OutputOf({"cmake", "-S", source_, "-B", build, "-DCMAKE_PREFIX_PATH=" + prefix_.path(),
              std::string("-DCMAKE_CXX_COMPILER=") + CXX_COMPILER,
              "-DCMAKE_CXX_FLAGS=-Wall -Wextra -Werror"});
    OutputOf({"cmake", "--build", build}, {.time_limit = kBuildTime});
    return build + "/" + program;
  }
  std::string BuildWithPkgConfig(const std::string& name, const std::string& program) const {
    const std::string script = "\"$0\" -std=c++20 -Wall -Wextra -Werror " + program + ".cpp -o " + program +
                               " $(pkg-config --cflags --libs " + name + ")";
    OutputOf({"sh", "-ec", script, CXX_COMPILER},
             {.environment = {"PKG_CONFIG_PATH=" + prefix_.path() + "/" + LIBRARY_FOLDER + "/pkgconfig"},
              .folder = source_,
              .time_limit = kBuildTime});
    return source_ + "/" + program;
  }

  std::string Run(const std::vector<std::string>& command, const std::string& input = "") const {
    return OutputOf(command, {.environment = {"LD_LIBRARY_PATH=" + prefix_.path() + "/" + LIBRARY_FOLDER},
                              .input = input});
  }

  static constexpr std::chrono::seconds kBuildTime{240};
  TemporaryFolder prefix_;
  TemporaryFolder work_;
  std::string source_ = work_ / "example";
};

// A program of the manual's examples, counted from 0, with what stands in a place of its own put elsewhere.
std::string ManualProgram(size_t number, const std::string& place, const std::string& instead) {
  const ManualPage page = ReadManualPage("libquorelastic.3");
  std::vector<std::string> programs;
  for (const std::string& line : page.Find("EXAMPLES").displayed) {
    if (line == "#include <iostream>") programs.emplace_back();
    programs.back() += line + "\n";
  }
  std::string program = programs.at(number);
  return program.replace(program.find(place), place.size(), instead);
}

class InstalledEngine : public InstalledLibrary {
 protected:
  InstalledEngine() : InstalledLibrary("quorelastic") {}

  void ExpectToFindLines(const std::string& program) {
    EXPECT_EQ(Run({program, work_ / "index", "sea"}, "The old man\nand the sea\nby the sea, the sea\n"),
              "3: by the sea, the sea\n2: and the sea\n2 found\n");
  }
};

TEST_F(InstalledEngine, IsFoundByCMake) { ExpectToFindLines(BuildWithCMake("line_search")); }

TEST_F(InstalledEngine, IsFoundByPkgConfig) {
  ExpectToFindLines(BuildWithPkgConfig("quorelastic", "line_search"));
}

TEST_F(InstalledEngine, TheManualsProgramFindsWhatItHasAdded) {
  WriteFile(source_ + "/manual.cpp", ManualProgram(0, "/tmp/books", work_ / "books"));
  EXPECT_THAT(Run({BuildWithPkgConfig("quorelastic", "manual")}), StartsWith("1 0."));
}

TEST_F(InstalledEngine, IsNotFoundWhereALibraryOfItsHeadersIsMissing) {
  const RunResult run =
      RunCommand({"cmake", "-S", source_, "-B", work_ / "build", "-DCMAKE_PREFIX_PATH=" + prefix_.path(),
                  std::string("-DCMAKE_CXX_COMPILER=") + CXX_COMPILER},
                 // pkg-config looks nowhere.
                 {.environment = {"PKG_CONFIG_LIBDIR=" + prefix_ / "nowhere", "PKG_CONFIG_PATH="}});
  EXPECT_NE(run.status, 0);
  EXPECT_THAT(run.err, HasSubstr("pkg-config does not find LUCENE"));
}

class InstalledConnection : public InstalledLibrary {
 protected:
  InstalledConnection() : InstalledLibrary("quordaemon") {}

  void ExpectToAskADaemon(const std::string& program) {
    const TemporaryFolder folder;
    DaemonProcess daemon(folder.path());
    ASSERT_TRUE(daemon.is_ready()) << daemon.Log();
    EXPECT_THAT(Run({program, daemon.socket(), R"({"command":"status"})"}), HasSubstr(R"("success":true)"));
  }
};

TEST_F(InstalledConnection, TheManualsProgramAsksTheDaemon) {
  const TemporaryFolder folder;
  DaemonProcess daemon(folder.path());
  ASSERT_TRUE(daemon.is_ready()) << daemon.Log();
  WriteFile(source_ + "/manual.cpp", ManualProgram(1, "/var/run/quorelasticd.sock", daemon.socket()));
  EXPECT_THAT(Run({BuildWithPkgConfig("quordaemon", "manual")}), HasSubstr(R"("success":true)"));
}

TEST_F(InstalledConnection, IsFoundByCMake) { ExpectToAskADaemon(BuildWithCMake("ask")); }

TEST_F(InstalledConnection, IsFoundByPkgConfig) {
  ExpectToAskADaemon(BuildWithPkgConfig("quordaemon", "ask"));
}

}  // namespace
}  // namespace quorelastic::testing

// The Debian packages, as packaging/make-packages has made them.

#include <gmock/gmock.h>

#include <algorithm>
#include <filesystem>
#include <map>
#include <regex>
#include <string>
#include <vector>

#include "packaging/command_output.h"
#include "packaging/package_path.h"
#include "support/files.h"
#include "support/temporary_folder.h"
#include "support/text_search.h"

namespace quorelastic::testing {
namespace {

namespace fs = std::filesystem;
using ::testing::AllOf;
using ::testing::Contains;
using ::testing::ContainsRegex;
using ::testing::ElementsAre;
using ::testing::HasSubstr;
using ::testing::Not;
using ::testing::UnorderedElementsAreArray;

const std::vector<std::string> kPackages = {"libquordaemon-dev", "libquordaemon0", "libquorelastic-dev",
                                            "libquorelastic0",   "quorelastic",    "quorelasticd"};

std::string Field(const std::string& package, const std::string& field) {
  const auto lines = SplitLines(OutputOf({"dpkg-deb", "--field", PathOf(package), field}));
  return lines.empty() ? "" : lines[0];
}

std::string ControlFile(const std::string& package, const std::string& file) {
  return OutputOf({"dpkg-deb", "--info", PathOf(package), file});
}

struct Entry {
  std::string mode;  // as ls has it
  std::string owner;
};

// All files, links and folders by their paths.
std::map<std::string, Entry> Contents(const std::string& package) {
  static const std::regex line(R"((\S+) (\S+) +\d+ \S+ \S+ \.(/\S*?)( -> .*)?)");
  std::map<std::string, Entry> entries;
  for (const std::string& text : SplitLines(OutputOf({"dpkg-deb", "--contents", PathOf(package)}))) {
    std::smatch parts;
    if (std::regex_match(text, parts, line)) {
      entries[parts[3]] = {parts[1], parts[2]};
    } else {
      ADD_FAILURE() << text;
    }
  }
  return entries;
}

// The paths of files and links but for what every package has.
std::vector<std::string> OwnFiles(const std::string& package) {
  std::vector<std::string> files;
  for (const auto& [path, entry] : Contents(package)) {
    const bool is_common = path == "/usr/share/doc/" + package + "/copyright" ||
                           path == "/usr/share/doc/" + package + "/changelog.Debian.gz" ||
                           path.starts_with("/usr/share/lintian/") || path.starts_with("/usr/share/man/");
    if (!entry.mode.starts_with("d") && !is_common) files.push_back(path);
  }
  return files;
}

std::string LibraryPath(const std::string& name) {
  return std::string("/usr/") + LIBRARY_FOLDER + "/" + name;
}

// The files below a folder of the sources, each behind a prefix.
std::vector<std::string> SourceFiles(const std::string& folder, const std::string& prefix) {
  std::vector<std::string> files;
  const fs::path root = fs::path(SOURCE_FOLDER) / folder;
  for (const auto& entry : fs::recursive_directory_iterator(root)) {
    if (entry.is_regular_file()) files.push_back(prefix + entry.path().lexically_relative(root).string());
  }
  return files;
}

TEST(Packages, AreSixOfOneVersionEachOnlyOnce) {
  std::vector<std::string> names;
  for (const std::string& file : PackageFiles()) names.push_back(file.substr(0, file.find('_')));
  EXPECT_EQ(names, kPackages);
  for (const std::string& package : kPackages) {
    EXPECT_EQ(Field(package, "Version"), Field("quorelastic", "Version"));
    EXPECT_NE(Field(package, "Architecture"), "all");
    EXPECT_EQ(Field(package, "Source"), package == "quorelastic" ? "" : "quorelastic");
  }
}

TEST(Packages, HoldTheirPartOfTheInstallation) {
  EXPECT_THAT(OwnFiles("quorelastic"),
              ElementsAre("/usr/bin/quorelastic", "/usr/share/bash-completion/completions/quorelastic"));
  for (const char* path :
       {"/usr/sbin/quorelasticd", "/etc/default/quorelasticd", "/usr/lib/systemd/system/quorelasticd.service",
        "/usr/lib/systemd/system/quorelasticd.socket", "/usr/lib/sysusers.d/quorelasticd.conf",
        "/usr/lib/tmpfiles.d/quorelasticd.conf", "/usr/share/doc/quorelasticd/protocol.md"}) {
    EXPECT_THAT(OwnFiles("quorelasticd"), Contains(path));
  }
}

TEST(Packages, HoldTheManualsOfWhatIsInThem) {
  for (const auto& [package, manual] : {std::array{"quorelastic", "man8/quorelastic.8.gz"},
                                        std::array{"quorelasticd", "man8/quorelasticd.8.gz"},
                                        std::array{"quorelasticd", "man7/quorelastic-protocol.7.gz"},
                                        std::array{"libquorelastic-dev", "man3/libquorelastic.3.gz"}}) {
    EXPECT_TRUE(Contents(package).contains(std::string("/usr/share/man/") + manual))
        << package << ": " << manual;
  }
}

TEST(Packages, ALibraryPackageHoldsTheLibraryAlone) {
  const std::string version = Field("libquorelastic0", "Version");
  const std::string number = version.substr(0, version.find('-'));
  EXPECT_THAT(OwnFiles("libquorelastic0"),
              ElementsAre(LibraryPath("libquorelastic.so.0"), LibraryPath("libquorelastic.so." + number)));
  EXPECT_THAT(OwnFiles("libquordaemon0"),
              ElementsAre(LibraryPath("libquordaemon.so.0"), LibraryPath("libquordaemon.so." + number)));
}

TEST(Packages, ADevelopmentPackageHoldsAllHeadersAndTheExample) {
  for (const auto& [name, headers, example] : {std::array{"quorelastic", "vantrel", "engine"},
                                               std::array{"quordaemon", "quordaemon", "quordaemon"}}) {
    const std::string package = std::string("lib") + name + "-dev";
    std::vector<std::string> expected =
        SourceFiles(std::string("engine/include/") + headers, std::string("/usr/include/") + headers + "/");
    for (const auto& file :
         SourceFiles(std::string("examples/") + example, "/usr/share/doc/" + package + "/examples/")) {
      expected.push_back(file);
    }
    const std::string config = "cmake/" + std::string(name) + "/" + name;
    for (const std::string& file :
         {"lib" + std::string(name) + ".so", "pkgconfig/" + std::string(name) + ".pc",
          config + "Config.cmake", config + "ConfigVersion.cmake", config + "Targets.cmake",
          config + "Targets-release.cmake"}) {
      expected.push_back(LibraryPath(file));
    }
    EXPECT_THAT(OwnFiles(package), UnorderedElementsAreArray(expected));
  }
}

TEST(Packages, BelongToRootAndCanBeChangedByNobodyElse) {
  for (const std::string& package : kPackages) {
    for (const auto& [path, entry] : Contents(package)) {
      const bool is_program = path.find("bin/") != std::string::npos;
      const std::string expected = entry.mode[0] == 'd'               ? "drwxr-xr-x"
                                   : entry.mode[0] == 'l'             ? "lrwxrwxrwx"
                                   : is_program && path.back() != '/' ? "-rwxr-xr-x"
                                                                      : "-rw-r--r--";
      EXPECT_EQ(entry.mode, expected) << package << ": " << path;
      EXPECT_EQ(entry.owner, "root/root") << package << ": " << path;
    }
  }
}

TEST(Packages, DependOnTheLibrariesThatTheirBinariesNeed) {
  const std::string own = R"(libquorelastic0 \(>= [0-9.]+\))";
  const std::string connection = R"(libquordaemon0 \(>= [0-9.]+\))";
  EXPECT_THAT(Field("quorelastic", "Depends"),
              AllOf(ContainsRegex(own), ContainsRegex(connection), HasSubstr("liblucene++0v5"),
                    HasSubstr("libjsoncpp25"), HasSubstr("libc6 (>= "), HasSubstr("libstdc++6 (>= ")));
  EXPECT_THAT(Field("quorelasticd", "Depends"),
              AllOf(ContainsRegex(own), ContainsRegex(connection), HasSubstr("libsystemd0"),
                    HasSubstr("libboost-program-options1.74.0")));
  EXPECT_THAT(Field("libquorelastic0", "Depends"),
              AllOf(HasSubstr("libicu72"), HasSubstr("zlib1g"), Not(HasSubstr("libquor"))));
  EXPECT_THAT(Field("libquordaemon0", "Depends"), AllOf(HasSubstr("libc6"), Not(HasSubstr("lucene"))));
}

TEST(Packages, ADevelopmentPackageNeedsItsLibraryAndWhatItsHeadersInclude) {
  const std::string version = Field("quorelastic", "Version");
  EXPECT_THAT(Field("libquorelastic-dev", "Depends"),
              AllOf(HasSubstr("libquorelastic0 (= " + version + ")"), HasSubstr("liblucene++-dev"),
                    HasSubstr("libjsoncpp-dev"), HasSubstr("libboost-thread-dev"), HasSubstr("pkg-config")));
  EXPECT_EQ(Field("libquordaemon-dev", "Depends"), "libquordaemon0 (= " + version + ")");
}

TEST(Packages, TheLibrariesTellWhatProgramsLinkedWithThemNeed) {
  const std::string version = Field("quorelastic", "Version");
  const std::string number = version.substr(0, version.find('-'));
  for (const std::string name : {"libquorelastic", "libquordaemon"}) {
    EXPECT_EQ(ControlFile(name + "0", "shlibs"), name + " 0 " + name + "0 (>= " + number + ")\n");
    EXPECT_EQ(ControlFile(name + "0", "triggers"), "activate-noawait ldconfig\n");
  }
}

TEST(Packages, TellTheirCopyrightTheirChangesAndTheSumsOfTheirFiles) {
  for (const std::string& package : kPackages) {
    const TemporaryFolder folder;
    OutputOf({"dpkg-deb", "--raw-extract", PathOf(package), folder.path()});
    const std::string documents = folder / ("usr/share/doc/" + package);
    EXPECT_EQ(ReadFile(documents + "/copyright"),
              ReadFile(std::string(SOURCE_FOLDER) + "/packaging/debian/copyright"));
    EXPECT_EQ(OutputOf({"gzip", "--decompress", "--stdout", documents + "/changelog.Debian.gz"}),
              ReadFile(std::string(SOURCE_FOLDER) + "/packaging/debian/changelog"));
    OutputOf({"md5sum", "--check", "--strict", "--quiet", "DEBIAN/md5sums"}, {.folder = folder.path()});
  }
}

TEST(Packages, SayNothingOfTheFolderTheyWereBuiltIn) {
  for (const std::string& package : kPackages) {
    const TemporaryFolder folder;
    OutputOf({"dpkg-deb", "--raw-extract", PathOf(package), folder.path()});
    const RunResult run = RunCommand({"grep", "--recursive", "--text", "--files-with-matches",
                                      "--fixed-strings", SOURCE_FOLDER, folder.path()});
    EXPECT_EQ(run.status, 1) << run;  // nothing found
  }
}

TEST(Packages, HoldProgramsWithoutSymbolsAndSearchPaths) {
  const TemporaryFolder folder;
  for (const std::string& package : kPackages)
    OutputOf({"dpkg-deb", "--extract", PathOf(package), folder.path()});
  const std::string version = Field("quorelastic", "Version");
  for (const std::string& file : {std::string("/usr/bin/quorelastic"), std::string("/usr/sbin/quorelasticd"),
                                  LibraryPath("libquorelastic.so." + version.substr(0, version.find('-')))}) {
    EXPECT_THAT(OutputOf({"readelf", "--dynamic", folder.path() + file}),
                Not(ContainsRegex("RPATH|RUNPATH")));
    EXPECT_THAT(OutputOf({"readelf", "--sections", folder.path() + file}), Not(HasSubstr(".symtab")));
  }
}

TEST(Packages, TheConfigurationIsTheAdministrators) {
  EXPECT_EQ(ControlFile("quorelasticd", "conffiles"), "/etc/default/quorelasticd\n");
}

TEST(Packages, AnOverrideOfTheCheckersHasAReason) {
  for (const std::string& package : kPackages) {
    const TemporaryFolder folder;
    OutputOf({"dpkg-deb", "--extract", PathOf(package), folder.path()});
    const std::string path = folder / ("usr/share/lintian/overrides/" + package);
    std::string before;
    for (const std::string& line : SplitLines(ReadFile(path))) {
      EXPECT_TRUE(line.starts_with("#") || before.starts_with("#")) << package << ": " << line;
      before = line;
    }
  }
}

TEST(Packages, AreTheSameWhoeverMakesThemAndWhen) {
  const TemporaryFolder folder;
  OutputOf({"sh", "-ec", "umask 077; exec \"$0\" \"$@\"",
            std::string(SOURCE_FOLDER) + "/packaging/make-packages", BUILD_FOLDER, folder.path()},
           {.environment = {"LANG=C.UTF-8", "TZ=Asia/Tokyo", "SOURCE_DATE_EPOCH=1"}});
  for (const std::string& package : kPackages) {
    const std::string file = fs::path(PathOf(package)).filename();
    EXPECT_TRUE(ReadFile(PathOf(package)) == ReadFile(folder / file)) << file;
  }
}

TEST(Packages, AreNotMadeOfABuildThatIsNotToBeShipped) {
  const std::string cache = ReadFile(std::string(BUILD_FOLDER) + "/CMakeCache.txt");
  for (const auto& [setting, other, complaint] :
       {std::array{"CMAKE_BUILD_TYPE:STRING=Release", "CMAKE_BUILD_TYPE:STRING=Debug", "not a Release build"},
        std::array{"QUORELASTIC_SANITIZE:STRING=", "QUORELASTIC_SANITIZE:STRING=address", "has sanitizers"},
        std::array{"QUORELASTIC_DATA_ROOT:STRING=/var/lib/quorelastic", "QUORELASTIC_DATA_ROOT:STRING=/srv",
                   "has its indexes in /srv"},
        std::array{"CMAKE_PROJECT_VERSION:STATIC=", "CMAKE_PROJECT_VERSION:STATIC=9", "the build at 9"}}) {
    const TemporaryFolder build;
    std::string changed = cache;
    const size_t place = changed.find(std::string("\n").append(setting));
    ASSERT_NE(place, std::string::npos) << setting;
    changed.replace(place + 1, std::string(setting).size(), other);
    WriteFile(build / "CMakeCache.txt", changed);
    const RunResult run = RunCommand(
        {std::string(SOURCE_FOLDER) + "/packaging/make-packages", build.path(), build / "packages"});
    EXPECT_EQ(run.status, 1);
    EXPECT_THAT(run.err, HasSubstr(complaint));
  }
}

}  // namespace
}  // namespace quorelastic::testing

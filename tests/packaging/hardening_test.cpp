// How the programs and libraries are linked and compiled against attacks on a mistake in them.

#include <gmock/gmock.h>

#include <algorithm>
#include <fstream>
#include <initializer_list>
#include <string>

#include "packaging/command_output.h"

namespace quorelastic::testing {
namespace {

using ::testing::ContainsRegex;
using ::testing::HasSubstr;
using ::testing::Not;

class Hardening : public ::testing::TestWithParam<const char*> {
 protected:
  static std::string ReadElf(const std::string& what) {
    return OutputOf({"readelf", "--wide", what, std::string(BUILD_FOLDER) + "/" + GetParam()});
  }
};

TEST_P(Hardening, ItCanBeLoadedAtAnyAddress) {
  EXPECT_THAT(ReadElf("--file-header"), ContainsRegex("Type: +DYN "));
}

TEST_P(Hardening, ItsTablesAreReadOnlyOnceItRuns) {
  EXPECT_THAT(ReadElf("--program-headers"), HasSubstr("GNU_RELRO"));
  EXPECT_THAT(ReadElf("--dynamic"), ContainsRegex("FLAGS_1\\).*NOW"));
}

TEST_P(Hardening, ItsStackIsNotExecutable) {
  EXPECT_THAT(ReadElf("--program-headers"), ContainsRegex("GNU_STACK .* RW "));
}

bool ContainsAny(const std::string& line, std::initializer_list<const char*> parts) {
  return std::any_of(parts.begin(), parts.end(),
                     [&](const char* part) { return line.find(part) != std::string::npos; });
}

TEST_P(Hardening, NoSegmentCanBeBothWrittenAndExecuted) {
  EXPECT_THAT(ReadElf("--program-headers"), Not(ContainsRegex("LOAD .* RWE ")));
}

TEST_P(Hardening, AnOverrunStackIsNoticed) {
  EXPECT_THAT(ReadElf("--dyn-syms"), HasSubstr("__stack_chk_fail"));
}

INSTANTIATE_TEST_SUITE_P(Files, Hardening,
                         ::testing::Values("bin/quorelastic", "bin/quorelasticd", "lib/libquorelastic.so",
                                           "lib/libquordaemon.so"),
                         [](const auto& file) {
                           const std::string path = file.param;
                           return path.substr(4, path.find('.') - 4);
                         });

// The libraries are left out: the compiler proves each of their copies sound, or does not know the size of the target,
// so that none is checked as it runs.
TEST(Fortification, ProgramsCheckLengthsInTheCLibrary) {
  for (const char* file : {"bin/quorelastic", "bin/quorelasticd"}) {
    const std::string symbols =
        OutputOf({"readelf", "--wide", "--dyn-syms", std::string(BUILD_FOLDER) + "/" + file});
    EXPECT_THAT(symbols, ContainsRegex(" __(w?memcpy|sn?printf|syslog)_chk@")) << file;
  }
}

TEST(Fortification, EverySourceOfTheProductsIsCompiledWithIt) {
  std::ifstream file(std::string(BUILD_FOLDER) + "/compile_commands.json");
  int sources = 0;
  for (std::string line; std::getline(file, line);) {
    if (line.find("\"command\":") == std::string::npos) continue;
    const bool is_product =
        ContainsAny(line, {"/engine/elastic/", "/engine/quordaemon/", "/src/", "/quorelasticd/"});
    if (!is_product || ContainsAny(line, {"/tests/"})) continue;
    ++sources;
    EXPECT_THAT(line, HasSubstr("-D_FORTIFY_SOURCE=3"));
    EXPECT_THAT(line, Not(HasSubstr(" -O0")));
  }
  EXPECT_GT(sources, 10);
}

}  // namespace
}  // namespace quorelastic::testing

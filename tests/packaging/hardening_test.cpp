// How the programs and libraries are linked and compiled against attacks on a mistake in them.

#include <gmock/gmock.h>

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

// libquordaemon is left out: the compiler proves each of its copies sound, or does not know the size of the target, so
// that none is checked as it runs.
TEST(Fortification, LengthsAreCheckedInTheCLibrary) {
  for (const char* file : {"bin/quorelastic", "bin/quorelasticd", "lib/libquorelastic.so"}) {
    const std::string symbols =
        OutputOf({"readelf", "--wide", "--dyn-syms", std::string(BUILD_FOLDER) + "/" + file});
    EXPECT_THAT(symbols, ContainsRegex(" __(w?memcpy|sn?printf|syslog)_chk@")) << file;
  }
}

}  // namespace
}  // namespace quorelastic::testing

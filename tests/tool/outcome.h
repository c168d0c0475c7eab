#pragma once

#include <gmock/gmock.h>

#include <csignal>
#include <string>

#include "support/tool_run.h"

namespace quorelastic::testing {

// What the run-time prints as the type of an exception that leaves main.
inline constexpr char kErrorType[] = "vantrel::Error";
inline constexpr char kIoErrorType[] = "vantrel::elastic::IndexIoError";

inline constexpr char kUsageText[] =
    "Usage: quorelastic\n"
    "  -a, --action           allowed action: command, search, allterm, term, dump, doc_term, occupy_mem, "
    "check, "
    "repair, plugin, vmtouch\n"
    "  -s, --string           Json format string\n"
    "  -p, --path             Json data path\n"
    "  -d, --db_path          DB path\n"
    "  -I, --index            Index db id\n"
    "  -q, --query            Query string\n"
    "  -n, --doc_id           Doc id\n"
    "  -o, --offset           Query offset\n"
    "  -m, --max              Max results\n"
    "  -i, --info             Print more info\n"
    "  -f, --fields           Assign field you want, (string or json array)\n"
    "  -S, --size             Query size\n"
    "  -P, --Plugin           Filter plugin name\n"
    "  -h, --help             Show help\n";

// A run that ended by itself.
inline auto Ended(int status, const ::testing::Matcher<std::string>& out,
                  const ::testing::Matcher<std::string>& err) {
  return ::testing::AllOf(::testing::Field("signal", &RunResult::signal, 0),
                          ::testing::Field("status", &RunResult::status, status),
                          ::testing::Field("out", &RunResult::out, out),
                          ::testing::Field("err", &RunResult::err, err));
}

// A run that went well, and wrote nothing else than `out`.
inline auto Printed(const ::testing::Matcher<std::string>& out) { return Ended(0, out, ""); }

// A run whose options were understood, but that named no action.
inline auto ShowedUsage() { return Ended(1, "", kUsageText); }

// A run that ended at an option: the parser's diagnostic, then ours with the value it returned.
inline auto Rejected(int value, const ::testing::Matcher<std::string>& diagnostic) {
  const std::string ours = "Unknown argument: " + std::to_string(value) + "\n" + kUsageText;
  return Ended(1, "",
               ::testing::AllOf(::testing::EndsWith(ours),
                                ::testing::ResultOf(
                                    "the parser's diagnostic",
                                    [length = ours.size()](const std::string& err) {
                                      return err.substr(0, err.size() - std::min(err.size(), length));
                                    },
                                    diagnostic)));
}

// A run that an exception ended, having written `out` before.
inline auto Aborted(const ::testing::Matcher<std::string>& out, const std::string& exception_type,
                    const ::testing::Matcher<std::string>& what) {
  const std::string start =
      "terminate called after throwing an instance of '" + exception_type + "'\n  what():  ";
  return ::testing::AllOf(
      ::testing::Field("signal", &RunResult::signal, SIGABRT), ::testing::Field("out", &RunResult::out, out),
      ::testing::Field("err", &RunResult::err,
                       ::testing::AllOf(::testing::StartsWith(start), ::testing::EndsWith("\n"),
                                        ::testing::ResultOf(
                                            "what()",
                                            [length = start.size()](const std::string& err) {
                                              return err.size() <= length
                                                         ? std::string()
                                                         : err.substr(length, err.size() - length - 1);
                                            },
                                            what))));
}

}  // namespace quorelastic::testing

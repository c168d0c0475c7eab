#include "options.h"

#include <gtest/gtest.h>

#include <string>
#include <vector>

namespace quorelasticd {
namespace {

std::optional<Options> Parse(std::vector<const char*> arguments, std::string* text = nullptr) {
  arguments.insert(arguments.begin(), "quorelasticd");
  std::string ignored;
  return ParseOptions(static_cast<int>(arguments.size()), arguments.data(),
                      text == nullptr ? ignored : *text);
}

std::string OptionComplaint(const std::vector<const char*>& arguments) {
  try {
    Parse(arguments);
    return "";
  } catch (const OptionError& error) {
    return error.what();
  }
}

TEST(Options, HaveDefaults) {
  const auto options = Parse({});
  ASSERT_TRUE(options.has_value());
  EXPECT_EQ(options->socket, "/var/run/quorelasticd.sock");
  EXPECT_EQ(options->data, "/var/lib/quorelastic");
  EXPECT_EQ(options->log_level, "info");
}

TEST(Options, AreTakenInBothForms) {
  const auto options =
      Parse({"--socket", "/s", "--data=/d", "--threads", "2", "--log-level=debug", "--max-connections", "3",
             "--idle-timeout=4", "--stall-timeout=5", "--shutdown-timeout=6", "--max-open-indexes", "7"});
  ASSERT_TRUE(options.has_value());
  EXPECT_EQ(options->socket, "/s");
  EXPECT_EQ(options->data, "/d");
  EXPECT_EQ(options->threads, 2);
  EXPECT_EQ(options->log_level, "debug");
  EXPECT_EQ(options->max_connections, 3);
  EXPECT_EQ(options->idle_timeout, 4);
  EXPECT_EQ(options->stall_timeout, 5);
  EXPECT_EQ(options->shutdown_timeout, 6);
  EXPECT_EQ(options->max_open_indexes, 7);
}

TEST(Options, HelpAndVersionAreTextsOnly) {
  std::string text;
  EXPECT_FALSE(Parse({"--help", "--threads", "0"}, &text).has_value());
  for (const char* option :
       {"--socket", "--data", "--threads", "--log-level", "--max-connections", "--idle-timeout",
        "--stall-timeout", "--shutdown-timeout", "--max-open-indexes", "--help", "--version"}) {
    EXPECT_NE(text.find(option), std::string::npos) << option;
  }
  EXPECT_FALSE(Parse({"--version"}, &text).has_value());
  EXPECT_EQ(text.rfind("quorelasticd ", 0), 0u);
}

TEST(Options, WhatMakesNoSenseIsRefusedInOneLine) {
  EXPECT_EQ(OptionComplaint({"--threads", "0"}), "--threads: expected a number from 1 to 256, found 0");
  EXPECT_EQ(OptionComplaint({"--threads", "-1"}), "--threads: expected a number from 1 to 256, found -1");
  EXPECT_EQ(OptionComplaint({"--log-level", "loud"}),
            "--log-level: expected debug, info, warning or error, found \"loud\"");
  EXPECT_EQ(OptionComplaint({"--socket", ""}), "--socket: expected a path, found none");
  EXPECT_EQ(OptionComplaint({"--data", ""}), "--data: expected a folder, found none");
  for (const std::vector<const char*>& arguments :
       std::vector<std::vector<const char*>>{{"--bogus"},
                                             {"--thread", "1"},
                                             {"-s"},
                                             {"stray"},
                                             {"--threads", "x"},
                                             {"--threads", "1", "--threads", "2"},
                                             {"--threads", "99999999999999999999"},
                                             {"--socket"}}) {
    EXPECT_NE(OptionComplaint(arguments), "") << arguments.front();
    EXPECT_EQ(OptionComplaint(arguments).find('\n'), std::string::npos);
  }
}

}  // namespace
}  // namespace quorelasticd

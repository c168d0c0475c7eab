// The action "command": where the request comes from, and what is sent of it.

#include <fcntl.h>
#include <gmock/gmock.h>
#include <gtest/gtest.h>
#include <sys/stat.h>
#include <unistd.h>

#include <chrono>
#include <filesystem>
#include <fstream>
#include <sstream>
#include <string>
#include <thread>
#include <vector>

#include "support/files.h"
#include "tool/exchange.h"
#include "tool/outcome.h"

namespace quorelastic::testing {
namespace {

using namespace std::string_literals;
using ::testing::IsEmpty;

constexpr char kPrintedDone[] = "{\"success\":true}\n";

class RawCommandTest : public ExchangeTest {
 protected:
  static std::vector<std::string> Command(const std::vector<std::string>& options) {
    std::vector<std::string> arguments{"-a", "command"};
    arguments.insert(arguments.end(), options.begin(), options.end());
    return arguments;
  }

  std::string JsonFile(const std::string& content) const {
    const std::string path = sandbox_.folder() + "/request.json";
    WriteFile(path, content);
    return path;
  }
};

TEST_F(RawCommandTest, SendsTheStringByteForByte) {
  for (const std::string& text : {"{\"command\":\"status\"}"s, " { \"b\" : 1.0,\n\t\"a\" : \"\\u00e9\" }\n"s,
                                  "no json"s, "{"s, " "s, "\n"s, "\xff\xfe"s, "{\"q\":\"späte Wörter\"}"s,
                                  "--"s, "- "s, " -"s, "-a"s, std::string(120'000, '-')}) {
    EXPECT_THAT(Run(Command({"-st", text})), Sent(text, Printed(kPrintedDone)));
  }
}

TEST_F(RawCommandTest, LooksAtNoOptionButStringAndPath) {
  EXPECT_THAT(Run(Command({"-st", "{}", "-I", "idx", "-q",      "text", "-si",        "-1", "-o", "-1", "-P",
                           "p",   "-D", "{",  "-f",  "[\"a\"]", "-d",   "/no/folder", "-m", "0",  "-i"})),
              Sent("{}", Printed(kPrintedDone)));
}

TEST_F(RawCommandTest, PrefersTheStringToTheFile) {
  const std::string path = JsonFile("{\"from\":\"file\"}");
  EXPECT_THAT(Run(Command({"-p", path, "-st", "text"})), Sent("text", Printed(kPrintedDone)));
  EXPECT_THAT(Run(Command({"-st", "text", "-p", "/no/such/file"})), Sent("text", Printed(kPrintedDone)));
  EXPECT_THAT(Run(Command({"-st", "-", "-p", path}), {.input = "line\n"}),
              Sent("line", Printed(kPrintedDone)));
  EXPECT_THAT(Run(Command({"-st", "", "-p", path})), Sent("{\"from\":\"file\"}", Printed(kPrintedDone)));
}

TEST_F(RawCommandTest, ReadsStandardInputForASingleHyphenAlone) {
  const std::string path = sandbox_.folder() + "/input";
  WriteFile(path, "{\"from\":\"input\"}\n");
  const auto consumed = [&](const std::string& text) {
    const Descriptor input(open(path.c_str(), O_RDONLY | O_CLOEXEC));
    Run(Command({"-st", text}), {.input_descriptor = input.get()});
    return lseek(input.get(), 0, SEEK_CUR) != 0;
  };
  EXPECT_TRUE(consumed("-"));
  for (const char* text : {"--", "- ", " -", "{}"}) EXPECT_FALSE(consumed(text)) << text;
}

TEST_F(RawCommandTest, SendsAFileAsItWasUnderstood) {
  const std::string path = JsonFile(
      "\n{\n  \"command\" : \"index_list\",\n  \"data\" : {\n\t\"id\" : \"gr\\u00f6\\u00dfe\",\r\n"
      "    \"numbers\" : [ 1, -9223372036854775808, 18446744073709551615, 0.1 ] }\n}\n\n");
  EXPECT_THAT(Run(Command({"-p", path})),
              Sent("{\"command\":\"index_list\",\"data\":{\"id\":\"größe\","
                   "\"numbers\":[1,-9223372036854775808,18446744073709551615,0.10000000000000001]}}",
                   Printed(kPrintedDone)));
}

TEST_F(RawCommandTest, SendsAFileOfAnyKindOfJson) {
  for (const char* text : {"[1,\"two\",null]", "\"text\"", "17", "true", "null", "{}"}) {
    EXPECT_THAT(Run(Command({"-p", JsonFile(text)})), Sent(text, Printed(kPrintedDone)));
  }
}

TEST_F(RawCommandTest, FindsAFileByAnyPath) {
  std::filesystem::create_directory(sandbox_.folder() + "/späte \xff\xfe Wörter");
  WriteFile(sandbox_.folder() + "/späte \xff\xfe Wörter/-", "[1]");
  EXPECT_THAT(Run(Command({"-p", sandbox_.folder() + "/späte \xff\xfe Wörter/-"})),
              Sent("[1]", Printed(kPrintedDone)));
  EXPECT_THAT(Run(Command({"-p", "-"}), {.folder = sandbox_.folder() + "/späte \xff\xfe Wörter"}),
              Sent("[1]", Printed(kPrintedDone)));
  EXPECT_THAT(Run(Command({"-p", "/dev/stdin"}), {.input = "[\n2]"}), Sent("[2]", Printed(kPrintedDone)));
}

TEST_F(RawCommandTest, SendsTheLongestMessageAndNothingOfALongerOne) {
  const std::string longest = '"' + std::string(kLongestMessage - 2, 'x') + '"';
  EXPECT_THAT(Run(Command({"-p", JsonFile(longest)})), Sent(longest, Printed(kPrintedDone)));
  const Exchange refused = Run(Command({"-p", JsonFile("\"x" + longest.substr(1))}));
  EXPECT_THAT(refused.run, Ended(0, "", "Send to daemon fail\n"));
  EXPECT_THAT(refused.sent, IsEmpty());
}

// Each path is refused with an error that names it as it was typed; nothing is sent, nothing logged.
class UnloadableFileTest : public RawCommandTest {
 protected:
  void ExpectRefused(const std::string& path, const std::vector<std::string>& more = {},
                     const RunOptions& options = {}) {
    std::vector<std::string> arguments = Command({"-p", path});
    arguments.insert(arguments.end(), more.begin(), more.end());
    EXPECT_THAT(Run(arguments, options),
                SentNothing(Aborted("", "vantrel::Error", "Cannot load json: " + path)));
    EXPECT_THAT(sandbox_.Log(), IsEmpty());
  }
};

TEST_F(UnloadableFileTest, IsMissing) {
  ExpectRefused("/no such/file.json");
  ExpectRefused("");
  ExpectRefused("späte/\xff\xfe/Wörter%s");
  ExpectRefused(JsonFile("{}") + "/");
  EXPECT_THAT(Run(Command({})), SentNothing(Aborted("", "vantrel::Error", "Cannot load json: ")));
  EXPECT_THAT(sandbox_.Log(), IsEmpty());
}

TEST_F(UnloadableFileTest, IsNoFileToRead) {
  const std::string path = JsonFile("{}");
  ASSERT_EQ(chmod(path.c_str(), 0), 0);
  ExpectRefused(path);
  ExpectRefused(sandbox_.folder());
  ExpectRefused("/dev/null");
}

TEST_F(UnloadableFileTest, IsNoJson) {
  for (const std::string& content :
       {""s, " \n"s, "{"s, "no json"s, "{\"a\":1,}"s, "{'a':1}"s, "{\"a\":1} {\"a\":2}"s, "{}\0"s, "{} x"s,
        std::string(100'000, '[') + std::string(100'000, ']'), std::string(100'000, '{')}) {
    ExpectRefused(JsonFile(content));
  }
}

TEST_F(UnloadableFileTest, IsNamedWhereStandardInputGivesNoRequest) {
  for (const std::string& input :
       {""s, "{\"unterminated\":1}"s, "\n\n"s, "\0{}\n"s, std::string(1023, 'x')}) {
    ExpectRefused("/no/file", {"-st", "-"}, {.input = input});
  }
  EXPECT_THAT(Run(Command({"-st", "-"})), SentNothing(Aborted("", "vantrel::Error", "Cannot load json: ")));
}

TEST_F(UnloadableFileTest, IsNamedWhereStandardInputCannotBeRead) {
  for (const char* redirection : {"<&-", "</", ">&0 0>/dev/null"}) {
    const RunResult run = sandbox_.RunCommand(
        {"sh", "-c", "exec \"$@\" "s + redirection, "sh", ToolPath(), "-a", "command", "-st", "-"});
    EXPECT_THAT(run, Aborted("", "vantrel::Error", "Cannot load json: ")) << redirection;
  }
}

class StandardInputTest : public RawCommandTest {
 protected:
  // What is sent of `input`. A file that there always is shows where nothing came of it.
  void ExpectSent(const std::string& input, const std::string& request) {
    EXPECT_THAT(Run(Command({"-st", "-", "-p", JsonFile("\"the file\"")}), {.input = input}),
                Sent(request, Printed(kPrintedDone)));
  }
};

constexpr char kTheFile[] = "\"the file\"";

TEST_F(StandardInputTest, IsSentWithoutItsNewlines) {
  ExpectSent("{\"a\":1}\n", "{\"a\":1}");
  ExpectSent("{\n\"command\": \"status\",\n  \"data\": {} }\n", "{\"command\": \"status\",  \"data\": {} }");
  ExpectSent("{\"broken\nliteral\":\r\n1\t}\n", "{\"brokenliteral\":\r1\t}");
  ExpectSent("\n\n{\n\n}\n\n", "{}");
  ExpectSent("no json \xff\n-\n", "no json \xff-");
}

TEST_F(StandardInputTest, LosesALastLineThatIsNotTerminated) {
  ExpectSent("{\"a\":1,\n\"b\":2}", "{\"a\":1,");
  ExpectSent("first\n ", "first");
  ExpectSent("{\"a\":1}", kTheFile);
  ExpectSent("\n\n{\"a\":1}", kTheFile);
  ExpectSent("", kTheFile);
  ExpectSent(std::string(1023, 'x'), kTheFile);
  ExpectSent("first\n" + std::string(1023, 'x'), "first");
}

TEST_F(StandardInputTest, HasItsLinesCutAtANul) {
  ExpectSent("ab\0cd\nef\n"s, "abef");
  ExpectSent("\0ab\ncd\0\n\0\nef\0\0\n"s, "cdef");
  ExpectSent("\0\n"s, kTheFile);
  ExpectSent(std::string(1000, 'x') + '\0' + std::string(22, 'y') + "\nz\n", std::string(1000, 'x') + 'z');
}

TEST_F(StandardInputTest, IsReadWholeUpToLinesOf1023Characters) {
  const std::string line(1023, 'x');
  ExpectSent(line + '\n', line);
  ExpectSent(line + '\n' + line + "\n\n" + line + "\ny\n", line + line + line + 'y');
}

TEST_F(StandardInputTest, MayHaveManyLines) {
  std::string input;
  std::string request;
  for (int i = 0; i < 100'000; ++i) {
    const std::string line =
        "line " + std::to_string(i) + ' ' + std::string(static_cast<size_t>(i) % 100, '.');
    input += line + '\n';
    request += line;
  }
  ExpectSent(input, request);
}

TEST_F(StandardInputTest, IsWaitedForToItsEnd) {
  int ends[2];
  ASSERT_EQ(pipe2(ends, O_CLOEXEC), 0);
  const Descriptor reading(ends[0]);
  Descriptor writing(ends[1]);
  ScriptedPeer peer(SocketPath(), {kDone});
  Process run =
      sandbox_.Start({ToolPath(), "-a", "command", "-st", "-"}, {.input_descriptor = reading.get()});
  for (const std::string& piece : {"{\"a\""s, ":1\n"s, ",\n\"b\":"s, "2}\nlost"s}) {
    ASSERT_EQ(write(writing.get(), piece.data(), piece.size()), static_cast<ssize_t>(piece.size()));
    std::this_thread::sleep_for(std::chrono::milliseconds(30));
  }
  writing = Descriptor();
  EXPECT_THAT(run.Wait(), Printed(kPrintedDone));
  EXPECT_EQ(peer.Received(), Framed("{\"a\":1,\"b\":2}"));
}

// Lines that are too long keep the tool from its end.
class LongLineTest : public StandardInputTest {
 protected:
  // 'S' for the tool once it sleeps, 'R' while it computes; something else while it has not begun or is gone.
  char State() const {
    std::ifstream pid_file(sandbox_.folder() + "/pid");
    std::string pid;
    if (!(pid_file >> pid)) return '?';
    std::ifstream file("/proc/" + pid + "/stat");
    std::ostringstream text;
    text << file.rdbuf();
    const std::string name = "(quorelastic) ";
    const size_t at = text.str().find(name);
    return at == std::string::npos ? '?' : text.str()[at + name.size()];
  }

  // True where the tool sleeps, and still does so a while later.
  bool FallsAsleep() const {
    const auto deadline = std::chrono::steady_clock::now() + std::chrono::seconds(20);
    int asleep = 0;
    while (asleep < 30 && std::chrono::steady_clock::now() < deadline) {
      asleep = State() == 'S' ? asleep + 1 : 0;
      std::this_thread::sleep_for(std::chrono::milliseconds(10));
    }
    return asleep == 30;
  }

  void ExpectNoEnd(const std::string& input) const {
    ScriptedPeer peer(SocketPath(), {kDone});
    {
      const Process run =
          sandbox_.Start({ToolPath(), "-a", "command", "-st", "-", "-p", "/no/file"}, {.input = input});
      EXPECT_TRUE(FallsAsleep());
      EXPECT_EQ(run.Out(), "");
      EXPECT_EQ(run.Err(), "");
    }
    EXPECT_EQ(peer.Connections(), 0);
    std::filesystem::remove(sandbox_.folder() + "/pid");
  }
};

TEST_F(LongLineTest, NeverEndsAndUsesNoProcessor) {
  ExpectNoEnd(std::string(1024, 'x') + '\n');
  ExpectNoEnd("{}\n" + std::string(5000, 'x') + "\n{}\n");
}

TEST_F(LongLineTest, NeverEndsAlsoWhereTheLineIsNotTerminatedOrHoldsANul) {
  ExpectNoEnd(std::string(1024, 'x'));
  ExpectNoEnd(std::string(1024, '\0') + '\n');
}

}  // namespace
}  // namespace quorelastic::testing

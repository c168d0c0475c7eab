// quorelastic, the command-line companion of the search daemon quorelasticd.
//
// A run performs one action, named by --action, and ends. Client actions send one request to the daemon and
// print its replies; offline actions work on an index folder in this process:
//
//   command       sends a request that the user wrote by hand
//   search        searches an index, optionally through a search plugin
//   dump          asks for the index list entry of an index
//   allterm       prints the term dictionary of every segment
//   term          the same, but only the terms that a search can still find
//   position      prints where a term stands in a document
//   term_suggest  prints completions of a prefix
//   doc_term      prints the term vector of a document
//   occupy_mem    takes memory away from the rest of the system until it is killed
//   check         tells whether an index is damaged
//   repair        drops the segments of an index that cannot be read
//   plugin        nothing: the word is accepted, no more
//   vmtouch       brings the indexes into the page cache
//
// For example, what a search can still find in a field, what was indexed of one document, and whether the index
// is as it should be:
//
//   quorelastic -a term -d /var/lib/quorelastic/mail --info -f subject -m 20
//   quorelastic -a doc_term -d /var/lib/quorelastic/mail -f subject -n 7
//   quorelastic -a check -d /var/lib/quorelastic/mail
//
// How a run ends:
//
//   status 0      the action's body returned, whatever it printed: also where it reported an error itself
//   status 1      a command-line error, --help, or no known action word; standard error has the usage text
//   abort         an exception left a body; nothing catches it, the runtime names it on standard error
//
// The C library's parser reads the options and prints its own diagnostics. The last value of an option wins;
// other words are ignored. Values are checked by the action that uses them, not while options are parsed.
//
// A rejected option value is logged with the line of its check in this file. Scripts that read the system log
// know those lines; static assertions beside the checks hold them in place.

#include <getopt.h>

#include <cerrno>
#include <cstdint>
#include <cstdlib>
#include <iostream>
#include <string>
#include <string_view>

#include "daemon/send_to_daemon.h"
#include "daemon/stdin_text.h"
#include "error/error.h"
#include "error/fail_if.h"
#include "inspect/document_terms.h"
#include "inspect/term_dump.h"
#include "inspect/term_positions.h"
#include "memory/occupy_memory.h"
#include "option_set.h"
#include "suggest/term_suggestions.h"
#include "vantrel/elastic/index_health.h"
#include "vantrel/elastic/index_repair.h"
#include "vantrel/elastic/json_value.h"
#include "vantrel/elastic/vm_touch.h"

namespace {

using vantrel::elastic::JsonValue;

constexpr auto kInvalid = vantrel::Error::kInvalidInput;

// The parser returns the letter. There are no short options: a single dash introduces any unambiguous
// beginning of a long name, so that -s (--string or --size) and -S (neither) are rejected.
constexpr option kLongOptions[] = {
    {"action", required_argument, nullptr, 'a'},
    {"string", required_argument, nullptr, 's'},
    {"path", required_argument, nullptr, 'p'},
    {"db", required_argument, nullptr, 'd'},
    {"max", required_argument, nullptr, 'm'},
    {"field", required_argument, nullptr, 'f'},
    {"token", required_argument, nullptr, 't'},
    {"ndoc", required_argument, nullptr, 'n'},
    {"Index", required_argument, nullptr, 'I'},
    {"info", no_argument, nullptr, 'i'},
    {"query", required_argument, nullptr, 'q'},
    {"size", required_argument, nullptr, 'S'},
    {"offset", required_argument, nullptr, 'o'},
    {"Plugin", required_argument, nullptr, 'P'},
    {"Data", required_argument, nullptr, 'D'},
    {"help", no_argument, nullptr, 'h'},
    {nullptr, 0, nullptr, 0},
};

// The request comes from the first of these that gives a text:
//
//   --string, or standard input where --string is "-": passed on unread, whether it is JSON or not
//   the file --path: parsed, and written anew
//
// A file that cannot be loaded is no rejected option: it is thrown, but not logged.
void SendRawCommand(std::string string, const std::string& path) {
  if (string == "-") ReadStdinText(string);
  if (!string.empty()) {
    SendToDaemon(string);
    return;
  }
  JsonValue request;
  if (!request.fromFile(path)) {
    throw vantrel::Error(vantrel::Error::kUnloadableJson, "Cannot load json: " + path);
  }
  SendToDaemon(request.toString());
}

// The filter that hands a search to a plugin. It stands in every search: without a plugin its name is empty.
Json::Value PluginFilter(const std::string& plugin, const Json::Value& plugin_data) {
  Json::Value filter;
  filter["name"] = "plugin";
  filter["data"]["name"] = plugin;
  filter["data"]["data"] = plugin_data;
  return filter;
}

// The request, with every member that it can have:
//
//   {"command": "search",
//    "data": {"indice": [index], "query_string": {"query": text}, "from": offset, "size": size,
//             "filters": [{"name": "plugin", "data": {"name": plugin, "data": any JSON or null}}],
//             "load_field": [names]}}
//
// "load_field" stands there only where --field holds a JSON array.
//
// The checks run in the order below; the first that fails ends the action, and nothing is sent. Size and
// offset have no upper bound here: what is too much is for the daemon to say.
void DoSearch(const std::string& index_id, const std::string& query_string, int64_t size, int64_t offset,
              const std::string& plugin, const std::string& filter_data) {
  static_assert(__LINE__ == 132, "the system log names the lines of the checks below");
  FailIf(index_id.empty(), kInvalid, "index is required.");
  FailIf(query_string.empty(), kInvalid, "query string is required.");
  FailIf(0 > size, kInvalid, "Invalid size.");
  FailIf(0 > offset, kInvalid, "Invalid offset.");
  JsonValue js_filter_data;
  FailIf(!filter_data.empty() && !js_filter_data.fromString(filter_data), kInvalid, "Invalid filter data");
  static_assert(__LINE__ == 139, "the system log names the lines of the checks above");

  JsonValue request;
  request["command"] = "search";
  Json::Value& data = request["data"];
  data["indice"].append(index_id);
  data["query_string"]["query"] = query_string;
  data["from"] = Json::Int64{offset};
  data["size"] = Json::Int64{size};
  data["filters"].append(PluginFilter(plugin, js_filter_data));
  // Anything but an array is passed over in silence.
  JsonValue load_field;
  if (!OptionSet::field.empty() && load_field.fromString(OptionSet::field) && load_field.isArray()) {
    data["load_field"] = load_field;
  }

  SendToDaemon(request.toString());
}

// An index that does not exist is the daemon's to report. The request:
//
//   {"command": "index_list", "data": {"id": index}}
void DoDumpDB(const std::string& index_id) {
  static_assert(__LINE__ == 162, "the system log names the line of the check below");
  FailIf(index_id.empty(), kInvalid, "index is required.");

  JsonValue request;
  request["command"] = "index_list";
  request["data"]["id"] = index_id;
  SendToDaemon(request.toString());
}

// The text is at odds with what is accepted, and stays so, because scripts compare it:
//
//   shown, but not accepted   --db_path (for --db), --index (for --Index), --doc_id (for --ndoc),
//                             --fields (for --field), -s and -S (ambiguous, and unknown)
//   accepted, but not shown   --token, --Data, the actions "position" and "term_suggest"
//   shown as if it were one   --help, which is an unknown argument like any other and ends with status 1
constexpr std::string_view kUsage[] = {
    "Usage: quorelastic",
    ("  -a, --action           allowed action: "
     "command, search, allterm, term, dump, doc_term, occupy_mem, "
     "check, repair, plugin, vmtouch"),
    "  -s, --string           Json format string",
    "  -p, --path             Json data path",
    "  -d, --db_path          DB path",
    "  -I, --index            Index db id",
    "  -q, --query            Query string",
    "  -n, --doc_id           Doc id",
    "  -o, --offset           Query offset",
    "  -m, --max              Max results",
    "  -i, --info             Print more info",
    "  -f, --fields           Assign field you want, (string or json array)",
    "  -S, --size             Query size",
    "  -P, --Plugin           Filter plugin name",
    "  -h, --help             Show help",
};

void PrintUsage() {
  for (const std::string_view line : kUsage) std::cerr << line << std::endl;
}

// Decimal, with leading blanks and a sign allowed:
//
//   what follows the number is ignored, and what is no number is 0
//   what does not fit 64 bits becomes the nearest number that does
int64_t ToNumber(const char* text) { return std::strtoll(text, nullptr, 10); }

// A document number: the low 32 bits of what was given.
int32_t ToDocumentNumber(const char* text) { return static_cast<int32_t>(ToNumber(text)); }

// Stores one option by its letter; false for a letter that stands for none, --help's included.
bool StoreOption(int letter, const char* argument, OptionSet& options) {
  switch (letter) {
    case 'a':
      options.action = argument;
      return true;
    case 's':
      options.string = argument;
      return true;
    case 'p':
      options.path = argument;
      return true;
    case 'd':
      options.db = argument;
      return true;
    case 'm':
      OptionSet::max = ToNumber(argument);
      return true;
    case 'f':
      OptionSet::field = argument;
      return true;
    case 't':
      options.token = argument;
      return true;
    case 'n':
      options.ndoc = ToDocumentNumber(argument);
      return true;
    case 'I':
      options.Index = argument;
      return true;
    case 'i':
      OptionSet::info = true;
      return true;
    case 'q':
      options.query = argument;
      return true;
    case 'S':
      OptionSet::size = ToNumber(argument);
      return true;
    case 'o':
      OptionSet::offset = ToNumber(argument);
      return true;
    case 'P':
      options.Plugin = argument;
      return true;
    case 'D':
      options.Data = argument;
      return true;
    default:
      return false;
  }
}

// Parses all arguments, or up to the first that is not understood; false there, after saying so. The parser
// prints a diagnostic of its own ahead of ours.
bool ParseOptions(int argc, char** argv, OptionSet& options) {
  for (;;) {
    const int letter = getopt_long_only(argc, argv, "", kLongOptions, nullptr);
    if (letter == -1) return true;
    if (!StoreOption(letter, optarg, options)) {
      std::cerr << "Unknown argument: " << letter << std::endl;
      PrintUsage();
      return false;
    }
  }
}

// Defined at the end, where their checks have their lines.
void Check(const std::string& db_path);
void Repair(const std::string& db_path);

// Runs the body that belongs to the action word; false where there is none. Words are compared exactly, and
// in this order. An exception that leaves a body leaves main as well: the abort that follows is how a script
// tells that an action could not be carried out.
bool RunAction(const OptionSet& options) {
  const std::string& action = options.action;
  if (action == "command") {
    SendRawCommand(options.string, options.path);
  } else if (action == "search") {
    DoSearch(options.Index, options.query, OptionSet::size, OptionSet::offset, options.Plugin, options.Data);
  } else if (action == "dump") {
    DoDumpDB(options.Index);
  } else if (action == "allterm") {
    DumpTermDict(options.db, false);
  } else if (action == "term") {
    DumpTermDict(options.db, true);
  } else if (action == "position") {
    ShowTermPositions(options.db, OptionSet::field, options.token, options.ndoc);
  } else if (action == "term_suggest") {
    ShowSuggestions(options.db, OptionSet::field, options.token);
  } else if (action == "doc_term") {
    ShowDocTerms(options.db, OptionSet::field, options.ndoc);
  } else if (action == "occupy_mem") {
    OccupyMemory(static_cast<uint32_t>(OptionSet::size));
  } else if (action == "check") {
    Check(options.db);
  } else if (action == "repair") {
    Repair(options.db);
  } else if (action == "plugin") {
    // Accepted, and does nothing.
  } else if (action == "vmtouch") {
    vantrel::elastic::VMTouch();
  } else {
    return false;
  }
  return true;
}

// Prints a verdict, "clean" or "NOT clean"; both go to standard error.
void Check(const std::string& db_path) {
  static_assert(__LINE__ == 320, "the system log names the line of the check below");
  FailIf(db_path.empty(), kInvalid, "db_path is required.");

  std::cerr << (vantrel::elastic::IsIndexCorrupted(db_path) ? "NOT clean" : "clean") << std::endl;
}

// Prints what came of it, "clean" or "done"; both go to standard error.
//
// Only the index library's own checker decides here, never the engine's, and only what it finds unreadable is
// dropped.
void Repair(const std::string& db_path) {
  static_assert(__LINE__ == 331, "the system log names the line of the check below");
  FailIf(db_path.empty(), kInvalid, "db_path is required.");

  const bool was_clean = vantrel::elastic::RepairIndex(db_path).is_clean;
  std::cerr << (was_clean ? "clean" : "done") << std::endl;
}

}  // namespace

int main(int argc, char** argv) {
  errno = 0;                    // static initialisers may have left an error, which FailIf would log
  unsetenv("POSIXLY_CORRECT");  // the parser's, which would stop at the first word that is no option
  OptionSet options;
  if (!ParseOptions(argc, argv, options)) return 1;
  if (!RunAction(options)) {
    PrintUsage();
    return 1;
  }
  return 0;
}

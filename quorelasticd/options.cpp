#include "options.h"

#include <algorithm>
#include <array>
#include <boost/program_options/options_description.hpp>
#include <boost/program_options/parsers.hpp>
#include <boost/program_options/positional_options.hpp>
#include <boost/program_options/value_semantic.hpp>
#include <boost/program_options/variables_map.hpp>
#include <sstream>

#include "base/text.h"

namespace quorelasticd {
namespace {

namespace po = boost::program_options;

constexpr std::array kLogLevels = {"debug", "info", "warning", "error"};

po::typed_value<std::string>* Text(std::string& value, const char* name) {
  auto* option = po::value(&value)->value_name(name);
  return value.empty() ? option : option->default_value(value);
}

template <typename T>
po::typed_value<T>* Number(T& value, const char* name) {
  return po::value(&value)->value_name(name)->default_value(value);
}

po::options_description Describe(Options& options) {
  constexpr unsigned kLineLength = 100;
  po::options_description description("Options", kLineLength);
  description.add_options()                                                                          //
      ("socket", Text(options.socket, "PATH"), "the socket that clients connect to")                 //
      ("data", Text(options.data, "FOLDER"), "the folder that holds the indexes")                    //
      ("plugins", Text(options.plugins, "FOLDER"), "load the search plugins (*.so) in this folder")  //
      ("threads", Number(options.threads, "N"),
       "threads for connections, as many for searches, and as many for writing")                //
      ("max-connections", Number(options.max_connections, "N"), "clients connected at a time")  //
      ("max-open-indexes", Number(options.max_open_indexes, "N"),
       "close indexes that nobody uses when more are open")  //
      ("idle-timeout", Number(options.idle_timeout, "SECONDS"),
       "hang up on a client that asks for nothing")  //
      ("stall-timeout", Number(options.stall_timeout, "SECONDS"),
       "hang up on a client that stops within a message, or takes longer over it than that and 1 s/MiB")  //
      ("shutdown-timeout", Number(options.shutdown_timeout, "SECONDS"),
       "cut off requests that run on when the daemon is to end")  //
      ("search-timeout", Number(options.search_timeout, "SECONDS"),
       "give up a search that takes longer, such as 0.5")                                             //
      ("log-level", Text(options.log_level, "LEVEL"), "log debug, info, warning or error and above")  //
      ("help", "print this text")                                                                     //
      ("version", "print the version");
  return description;
}

template <typename T>
void CheckRange(const char* name, T value, T least, T most) {
  if (value >= least && value <= most) return;
  std::ostringstream problem;
  problem << "--" << name << ": expected a number from " << least << " to " << most << ", found " << value;
  throw OptionError(problem.str());
}

void Check(const Options& options) {
  constexpr int64_t kDay = int64_t{24} * 60 * 60;
  CheckRange<int64_t>("threads", options.threads, 1, 256);
  CheckRange<int64_t>("max-connections", options.max_connections, 1, 100000);
  CheckRange<int64_t>("max-open-indexes", options.max_open_indexes, 1, 100000);
  CheckRange<int64_t>("idle-timeout", options.idle_timeout, 1, kDay);
  CheckRange<int64_t>("stall-timeout", options.stall_timeout, 1, kDay);
  CheckRange<int64_t>("shutdown-timeout", options.shutdown_timeout, 1, kDay);
  CheckRange<double>("search-timeout", options.search_timeout, 0.001, kDay);
  if (std::find(kLogLevels.begin(), kLogLevels.end(), options.log_level) == kLogLevels.end()) {
    throw OptionError("--log-level: expected debug, info, warning or error, found " +
                      Quoted(options.log_level));
  }
  if (options.socket.empty()) throw OptionError("--socket: expected a path, found none");
  if (options.data.empty()) throw OptionError("--data: expected a folder, found none");
}

}  // namespace

std::optional<Options> ParseOptions(int argc, const char* const* argv, std::string& text) {
  Options options;
  const po::options_description description = Describe(options);
  try {
    po::variables_map chosen;
    // An abbreviation that works today could mean another option tomorrow.
    constexpr int kStyle = po::command_line_style::allow_long | po::command_line_style::long_allow_next |
                           po::command_line_style::long_allow_adjacent;
    po::store(po::command_line_parser(argc, argv)
                  .options(description)
                  .positional(po::positional_options_description())
                  .style(kStyle)
                  .run(),
              chosen);
    if (chosen.count("help") > 0 || chosen.count("version") > 0) {
      std::ostringstream out;
      out << "quorelasticd " << kVersion << "\n";
      if (chosen.count("help") > 0)
        out << "Serves full-text indexes on a Unix domain socket.\n\n" << description;
      text = out.str();
      return std::nullopt;
    }
    po::notify(chosen);
  } catch (const po::too_many_positional_options_error&) {
    throw OptionError("expected options only, found something else");
  } catch (const po::error& error) {
    throw OptionError(ToOneLine(error.what()));
  }
  Check(options);
  return options;
}

}  // namespace quorelasticd

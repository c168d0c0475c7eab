#include "commands/command_table.h"

#include <algorithm>

#include "commands/commands.h"

namespace quorelasticd {

const std::vector<Command>& CommandTable() {
  static const std::vector<Command> table = {
      IndexCreateCommand(),    IndexListCommand(), IndexDeleteCommand(), DocumentBulkCommand(),
      DocumentDeleteCommand(), CommitCommand(),    OptimizeCommand(),    SearchCommand(),
      SuggestCommand(),        AnalyzeCommand(),   TermsCommand(),       PluginListCommand(),
      StatusCommand(),         CheckCommand(),     RepairCommand(),      HelpCommand(),
  };
  return table;
}

const Command* FindCommand(std::string_view name) {
  const std::vector<Command>& table = CommandTable();
  const auto found =
      std::find_if(table.begin(), table.end(), [&](const Command& command) { return command.name == name; });
  return found == table.end() ? nullptr : &*found;
}

}  // namespace quorelasticd

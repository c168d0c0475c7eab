#pragma once

#include "commands/command.h"

// The commands themselves, each beside what runs it.
namespace quorelasticd {

Command IndexCreateCommand();
Command IndexListCommand();
Command IndexDeleteCommand();
Command DocumentBulkCommand();
Command DocumentDeleteCommand();
Command CommitCommand();
Command OptimizeCommand();
Command SearchCommand();
Command SuggestCommand();
Command AnalyzeCommand();
Command TermsCommand();
Command PluginListCommand();
Command StatusCommand();
Command CheckCommand();
Command RepairCommand();
Command HelpCommand();

}  // namespace quorelasticd

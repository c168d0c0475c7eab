#pragma once

#include <cstdint>
#include <memory>
#include <vector>

#include "vantrel/elastic/field_pre_proc.h"
#include "vantrel/elastic/index_settings.h"

namespace vantrel::elastic {

// The pre-processors that a field asks for, each wrapping the one before it; empty where it asks for none. Throws
// std::invalid_argument, which says what is wrong: more than eight of them, an unknown name, a bad argument.
std::shared_ptr<const FieldPreProc> BuildPreProcChain(const std::vector<PreProcSettings>& settings);

// Whether no capital gets past a chain that can be built.
bool LowersCase(const std::vector<PreProcSettings>& settings);

// Whether what a chain that can be built makes of one word may be several terms, which are found as a phrase.
bool MakesPhrases(const std::vector<PreProcSettings>& settings);

// How many times as much text at most comes out of a chain that can be built as goes in; stops at 2^32.
uint64_t MostGrowth(const std::vector<PreProcSettings>& settings);

}  // namespace vantrel::elastic

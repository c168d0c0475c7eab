#include "memory/mem_info_keys.h"

const std::string MemInfoKeys[5] = {"MemTotal", "MemFree", "Cached", "SwapTotal", "SwapFree"};

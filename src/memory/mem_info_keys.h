#pragma once

#include <string>

// The lines of the system's memory statistics that tell how much memory there is and how much is free.
extern const std::string MemInfoKeys[5];

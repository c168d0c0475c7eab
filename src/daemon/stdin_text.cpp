#include "daemon/stdin_text.h"

#include <stdexcept>

void ReadStdinText(std::string&) { throw std::logic_error("not built yet"); }

#pragma once

#include <string>

// Sends one request, a JSON text, to the daemon and prints every reply on standard output until one holds the
// member "success". Failures of the exchange are reported on standard error; nothing is returned.
void SendToDaemon(const std::string& request);

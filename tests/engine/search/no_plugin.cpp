// A shared object that is no search plugin.

#include "vantrel/elastic/export.h"

extern "C" VANTREL_ELASTIC_EXPORT int Seven() { return 7; }

#pragma once

// Marks what libquorelastic offers to its users; everything else is hidden in the library.
#define VANTREL_ELASTIC_EXPORT __attribute__((visibility("default")))

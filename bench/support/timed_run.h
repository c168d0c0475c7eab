#pragma once

#include <sys/types.h>

#include <cstdint>
#include <string>
#include <vector>

namespace quorelastic::bench {

// What one run of a program took, as the operating system accounts for it.
struct Usage {
  double wall_seconds = 0;
  double cpu_seconds = 0;
  int64_t peak_bytes = 0;
  uint64_t output_bytes = 0;
};

// Starts a program, with the standard streams of this one.
pid_t Start(const std::vector<std::string>& command);

// Runs a program to its end, with its standard output into a pipe that is read and thrown away. Throws
// std::runtime_error where it cannot be started or does not end with status 0.
Usage Run(const std::vector<std::string>& command);

// Runs a program with its standard output into a file.
void RunIntoFile(const std::vector<std::string>& command, const std::string& path);

// The medians of several runs of two programs in turn (A B A B ...), after one warm-up of each, so that a
// machine whose speed drifts treats both alike. The ratio is the median of A/B, pair by pair, of wall seconds.
struct Comparison {
  Usage ours;
  Usage peer;
  double ratio = 0;
  double difference_seconds = 0;  // the median of A - B, pair by pair
};

Comparison Compare(const std::vector<std::string>& ours, const std::vector<std::string>& peer, int runs);

}  // namespace quorelastic::bench

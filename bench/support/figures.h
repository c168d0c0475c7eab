#pragma once

#include <string>

#include "support/timed_run.h"

namespace quorelastic::bench {

// Prints rows of a Markdown table, each a figure against its target, and remembers whether all were met.
class Figures {
 public:
  // Prints the table's head.
  Figures();

  // A ratio of times; `most` is the target.
  void AddRatio(const std::string& name, const Comparison& comparison, double most);

  // What one takes longer than the other.
  void AddDifference(const std::string& name, const Comparison& comparison, double most_milliseconds);

  // How many times the work that the peer does in the same time, an inverse ratio of times; `least` is the target.
  void AddThroughput(const std::string& name, const Comparison& comparison, double least);

  // A peak of memory.
  void AddPeak(const std::string& name, int64_t bytes, int64_t most_bytes);

  // A comparison that has no target, for the reader.
  void AddInformation(const std::string& name, const Comparison& comparison);

  bool all_met() const { return all_met_; }

 private:
  void Row(const std::string& name, const std::string& ours, const std::string& peer,
           const std::string& figure, const std::string& target, const std::string& verdict);
  std::string Verdict(bool met);

  bool all_met_ = true;
};

}  // namespace quorelastic::bench

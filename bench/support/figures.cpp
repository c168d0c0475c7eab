#include "support/figures.h"

#include <iomanip>
#include <iostream>
#include <sstream>

namespace quorelastic::bench {
namespace {

std::string Fixed(double value, int decimals) {
  std::ostringstream text;
  text << std::fixed << std::setprecision(decimals) << value;
  return text.str();
}

std::string Milliseconds(const Usage& usage) { return Fixed(usage.wall_seconds * 1e3, 1) + " ms"; }

std::string Mebibytes(int64_t bytes) { return Fixed(static_cast<double>(bytes) / (1 << 20), 1) + " MiB"; }

}  // namespace

Figures::Figures() {
  Row("figure", "ours", "peer", "value", "target", "");
  Row("---", "---", "---", "---", "---", "---");
}

void Figures::AddRatio(const std::string& name, const Comparison& comparison, double most) {
  Row(name, Milliseconds(comparison.ours), Milliseconds(comparison.peer), Fixed(comparison.ratio, 2),
      "at most " + Fixed(most, 2), Verdict(comparison.ratio <= most));
}

void Figures::AddDifference(const std::string& name, const Comparison& comparison, double most_milliseconds) {
  const double milliseconds = comparison.difference_seconds * 1e3;
  Row(name, Milliseconds(comparison.ours), Milliseconds(comparison.peer), Fixed(milliseconds, 2) + " ms",
      "at most " + Fixed(most_milliseconds, 2) + " ms", Verdict(milliseconds <= most_milliseconds));
}

void Figures::AddThroughput(const std::string& name, const Comparison& comparison, double least) {
  Row(name, Milliseconds(comparison.ours), Milliseconds(comparison.peer), Fixed(1 / comparison.ratio, 2),
      "at least " + Fixed(least, 2), Verdict(1 / comparison.ratio >= least));
}

void Figures::AddPeak(const std::string& name, int64_t bytes, int64_t most_bytes) {
  Row(name, "", "", Mebibytes(bytes), "under " + Mebibytes(most_bytes), Verdict(bytes < most_bytes));
}

void Figures::AddInformation(const std::string& name, const Comparison& comparison) {
  Row(name, Milliseconds(comparison.ours), Milliseconds(comparison.peer), Fixed(comparison.ratio, 2), "", "");
}

void Figures::Row(const std::string& name, const std::string& ours, const std::string& peer,
                  const std::string& figure, const std::string& target, const std::string& verdict) {
  std::cout << "| " << name << " | " << ours << " | " << peer << " | " << figure << " | " << target << " | "
            << verdict << " |" << std::endl;
}

std::string Figures::Verdict(bool met) {
  all_met_ = all_met_ && met;
  return met ? "met" : "MISSED";
}

}  // namespace quorelastic::bench

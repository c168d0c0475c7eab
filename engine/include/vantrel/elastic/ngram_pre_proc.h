#pragma once

#include <cstdint>
#include <memory>
#include <string>
#include <utility>
#include <vector>

#include "vantrel/elastic/export.h"
#include "vantrel/elastic/field_pre_proc.h"

namespace vantrel::elastic {

// Cuts each token into its n-grams: every run of n characters (code points) in it. What is shorter than n has none.
// Where n-grams of several lengths are wanted, those that begin at the same character come together, the shortest
// first, and share a position.
class VANTREL_ELASTIC_EXPORT NgramPreProc : public FieldPreProc {
 public:
  // The argument is what GramLengths() takes.
  NgramPreProc(std::shared_ptr<FieldPreProc> wrapped, std::string argument)
      : FieldPreProc(std::move(wrapped)), argument_(std::move(argument)) {
    GramLengths(argument_);
  }

  std::unique_ptr<FieldTokens> Process(const std::string& text) const override;

  // The lengths that an argument asks for: one to eight numbers from 1 to 255, ascending, with commas between
  // them, such as "2" or "2,3". Throws std::invalid_argument.
  static std::vector<uint32_t> GramLengths(const std::string& argument);

 private:
  std::string argument_;
};

}  // namespace vantrel::elastic

#pragma once

#include <memory>
#include <string>
#include <utility>

#include "vantrel/elastic/export.h"
#include "vantrel/elastic/field_pre_proc.h"

namespace vantrel::elastic {

// Makes letters lower-case by Unicode, each for itself and whatever the locale: what the words of texts are made.
class VANTREL_ELASTIC_EXPORT ToLowerPreProc : public FieldPreProc {
 public:
  // The argument is to be empty; else std::invalid_argument is thrown.
  ToLowerPreProc(std::shared_ptr<FieldPreProc> wrapped, std::string argument)
      : FieldPreProc(std::move(wrapped)), argument_(std::move(argument)) {
    CheckArgument(argument_);
  }

  std::unique_ptr<FieldTokens> Process(const std::string& text) const override;

 private:
  static void CheckArgument(const std::string& argument);

  std::string argument_;
};

}  // namespace vantrel::elastic

#pragma once

#include <memory>
#include <string>
#include <utility>

#include "vantrel/elastic/export.h"
#include "vantrel/elastic/field_pre_proc.h"

namespace vantrel::elastic {

// Makes letters lower-case by Unicode, code point by code point and whatever the locale: each becomes the one that
// Unicode gives as its simple mapping, so that a text keeps its length. "I" with a dot above becomes a plain "i".
//
// What was indexed stays as the Unicode of that day had it: a newer one may know of lower case where there was none,
// and then a query no longer meets what was indexed before, until that is indexed anew.
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

#include "vantrel/elastic/to_lower_pre_proc.h"

#include <stdexcept>

#include "elastic/common/quoted.h"
#include "elastic/preproc/lower_case.h"

namespace vantrel::elastic {
namespace {

class LowerTokens : public FieldTokens {
 public:
  explicit LowerTokens(std::unique_ptr<FieldTokens> wrapped) : wrapped_(std::move(wrapped)) {}

  bool Next(FieldToken& token) override {
    if (!wrapped_->Next(token)) return false;
    token.text = LowerCase(token.text);
    return true;
  }

 private:
  std::unique_ptr<FieldTokens> wrapped_;
};

}  // namespace

std::unique_ptr<FieldTokens> ToLowerPreProc::Process(const std::string& text) const {
  return std::make_unique<LowerTokens>(ProcessWrapped(text));
}

void ToLowerPreProc::CheckArgument(const std::string& argument) {
  if (!argument.empty()) {
    throw std::invalid_argument("\"tolower\" takes no argument, but got " + Quoted(argument));
  }
}

}  // namespace vantrel::elastic

#include "vantrel/elastic/field_pre_proc.h"

#include "elastic/preproc/characters.h"

namespace vantrel::elastic {
namespace {

class WholeText : public FieldTokens {
 public:
  explicit WholeText(std::string text) : text_(std::move(text)) {}

  bool Next(FieldToken& token) override {
    if (is_taken_) return false;
    is_taken_ = true;
    token = {.text = std::move(text_), .position = 0, .start = 0, .end = 0};
    token.end = CountCharacters(token.text);
    return true;
  }

 private:
  std::string text_;
  bool is_taken_ = false;
};

}  // namespace

std::unique_ptr<FieldTokens> FieldPreProc::ProcessWrapped(const std::string& text) const {
  if (wrapped_ != nullptr) return wrapped_->Process(text);
  return std::make_unique<WholeText>(text);
}

}  // namespace vantrel::elastic

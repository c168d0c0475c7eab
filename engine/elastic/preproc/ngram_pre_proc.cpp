#include "vantrel/elastic/ngram_pre_proc.h"

#include <charconv>
#include <stdexcept>
#include <string_view>

#include "elastic/common/quoted.h"
#include "elastic/preproc/characters.h"

namespace vantrel::elastic {
namespace {

constexpr size_t kMostLengths = 8;
constexpr uint32_t kLongestGram = 255;

class Grams : public FieldTokens {
 public:
  Grams(std::unique_ptr<FieldTokens> wrapped, std::vector<uint32_t> lengths)
      : wrapped_(std::move(wrapped)), lengths_(std::move(lengths)) {}

  bool Next(FieldToken& token) override {
    for (;;) {
      if (next_length_ < lengths_.size() && TakeGram(lengths_[next_length_], token)) {
        ++next_length_;
        return true;
      }
      // A gram that does not fit leaves no room for longer ones.
      if (!MoveOn()) return false;
    }
  }

 private:
  // The gram of this length that begins at begin_, where there is one.
  bool TakeGram(uint32_t length, FieldToken& token) {
    for (; reached_ < length; ++reached_) {
      if (end_ == whole_.text.size()) return false;
      end_ += FirstCharacterLength(std::string_view(whole_.text).substr(end_));
    }
    if (!has_gram_here_) {
      position_ = has_gram_ ? position_ + 1 : 0;
      has_gram_ = has_gram_here_ = true;
    }
    token.text.assign(whole_.text, begin_, end_ - begin_);
    token.position = position_;
    token.start = start_;
    token.end = start_ + length;
    return true;
  }

  // To the next character of the token, or to the next token.
  bool MoveOn() {
    next_length_ = 0;
    has_gram_here_ = false;
    reached_ = 0;
    if (begin_ < whole_.text.size()) {
      begin_ += FirstCharacterLength(std::string_view(whole_.text).substr(begin_));
      ++start_;
    } else {
      if (!wrapped_->Next(whole_)) return false;
      begin_ = 0;
      start_ = whole_.start;
    }
    end_ = begin_;
    return true;
  }

  std::unique_ptr<FieldTokens> wrapped_;
  std::vector<uint32_t> lengths_;
  FieldToken whole_;      // what is cut
  size_t begin_ = 0;      // where grams begin now, in bytes of it,
  uint64_t start_ = 0;    // and in characters of the text
  size_t end_ = 0;        // behind the last character looked at,
  uint32_t reached_ = 0;  // which is so many after begin_
  size_t next_length_ = 0;
  bool has_gram_here_ = false;
  bool has_gram_ = false;
  uint64_t position_ = 0;
};

[[noreturn]] void Refuse(const std::string& argument) {
  throw std::invalid_argument(
      "\"ngram\" takes lengths from 1 to 255, at most 8 and ascending, such as \"2\" or \"2,3\", but got " +
      Quoted(argument));
}

}  // namespace

std::unique_ptr<FieldTokens> NgramPreProc::Process(const std::string& text) const {
  return std::make_unique<Grams>(ProcessWrapped(text), GramLengths(argument_));
}

std::vector<uint32_t> NgramPreProc::GramLengths(const std::string& argument) {
  std::vector<uint32_t> lengths;
  const char* next = argument.data();
  const char* const end = next + argument.size();
  for (;;) {
    uint32_t length = 0;
    const auto [behind, error] = std::from_chars(next, end, length);
    if (error != std::errc() || length == 0 || length > kLongestGram) Refuse(argument);
    if (!lengths.empty() && length <= lengths.back()) Refuse(argument);
    lengths.push_back(length);
    if (behind == end) break;
    if (*behind != ',' || lengths.size() == kMostLengths) Refuse(argument);
    next = behind + 1;
  }
  return lengths;
}

}  // namespace vantrel::elastic

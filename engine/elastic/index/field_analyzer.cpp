#include "elastic/index/field_analyzer.h"

// Not without the index library's main header.
#include <lucene++/OffsetAttribute.h>
#include <lucene++/PositionIncrementAttribute.h>
#include <lucene++/TermAttribute.h>

#include <algorithm>
#include <map>
#include <memory>
#include <string>
#include <utility>

#include "elastic/common/text.h"
#include "elastic/index/text_analyzer.h"
#include "elastic/preproc/pre_proc_chain.h"

namespace vantrel::elastic {
namespace {

using Lucene::newLucene;
using Lucene::String;
using Lucene::StringUtils;

struct Chain {
  FieldType type;
  std::shared_ptr<const FieldPreProc> steps;
};

std::wstring ReadAll(const Lucene::ReaderPtr& reader) {
  constexpr int32_t kPiece = 1 << 16;
  std::wstring text;
  for (;;) {
    const size_t before = text.size();
    text.resize(before + kPiece);
    const int32_t got = reader->read(text.data() + before, 0, kPiece);
    text.resize(before + static_cast<size_t>(std::max(got, 0)));
    if (got <= 0) return text;
  }
}

// The value of a keyword, one token.
class WholeValue : public Lucene::TokenStream {
 public:
  explicit WholeValue(const Lucene::ReaderPtr& reader) : reader_(reader) {}

  void initialize() override {
    term_ = addAttribute<Lucene::TermAttribute>();
    offsets_ = addAttribute<Lucene::OffsetAttribute>();
  }

  bool incrementToken() override {
    if (is_taken_) return false;
    is_taken_ = true;
    clearAttributes();
    const std::wstring value = ReadAll(reader_);
    length_ = static_cast<int32_t>(value.size());
    term_->setTermBuffer(value);
    offsets_->setOffset(0, length_);
    return true;
  }

  void end() override { offsets_->setOffset(length_, length_); }

 private:
  Lucene::ReaderPtr reader_;
  Lucene::TermAttributePtr term_;
  Lucene::OffsetAttributePtr offsets_;
  bool is_taken_ = false;
  int32_t length_ = 0;
};

// What a chain makes of each token of another stream. A token that it leaves nothing of also leaves no gap.
class ChainedTokens : public Lucene::TokenStream {
 public:
  ChainedTokens(Lucene::TokenStreamPtr whole, std::shared_ptr<const FieldPreProc> steps)
      : whole_(std::move(whole)), steps_(std::move(steps)) {}

  void initialize() override {
    term_ = addAttribute<Lucene::TermAttribute>();
    offsets_ = addAttribute<Lucene::OffsetAttribute>();
    position_ = addAttribute<Lucene::PositionIncrementAttribute>();
    whole_term_ = whole_->getAttribute<Lucene::TermAttribute>();
    whole_offsets_ = whole_->getAttribute<Lucene::OffsetAttribute>();
  }

  bool incrementToken() override {
    while (tokens_ == nullptr || !tokens_->Next(token_)) {
      if (!whole_->incrementToken()) return false;
      tokens_ = steps_->Process(StringUtils::toUTF8(whole_term_->term()));
      is_first_ = true;
    }
    ShowToken();
    return true;
  }

  void end() override {
    whole_->end();
    offsets_->setOffset(whole_offsets_->startOffset(), whole_offsets_->endOffset());
  }

 private:
  void ShowToken() {
    clearAttributes();
    text_.clear();
    AppendCodePoints(token_.text, text_);
    term_->setTermBuffer(text_);
    // A word may be shorter than what it stands for in the value: an acronym loses its dots.
    const int32_t end = whole_offsets_->endOffset();
    const auto place = [&](uint64_t at) {
      return std::min(whole_offsets_->startOffset() + static_cast<int32_t>(at), end);
    };
    offsets_->setOffset(place(token_.start), place(token_.end));
    position_->setPositionIncrement(is_first_ || token_.position != last_position_ ? 1 : 0);
    last_position_ = token_.position;
    is_first_ = false;
  }

  Lucene::TokenStreamPtr whole_;
  Lucene::TermAttributePtr whole_term_;
  Lucene::OffsetAttributePtr whole_offsets_;
  std::shared_ptr<const FieldPreProc> steps_;
  std::unique_ptr<FieldTokens> tokens_;  // of one token of `whole_`
  FieldToken token_;
  std::wstring text_;
  bool is_first_ = true;
  uint64_t last_position_ = 0;
  Lucene::TermAttributePtr term_;
  Lucene::OffsetAttributePtr offsets_;
  Lucene::PositionIncrementAttributePtr position_;
};

class FieldAnalyzer : public Lucene::Analyzer {
 public:
  explicit FieldAnalyzer(const IndexSettings& settings) : texts_(NewTextAnalyzer()) {
    for (const FieldSettings& field : settings.fields) {
      if (field.pre_processors.empty()) continue;
      chains_[StringUtils::toUnicode(field.name)] = {field.type, BuildPreProcChain(field.pre_processors)};
    }
  }

  Lucene::TokenStreamPtr tokenStream(const String& field, const Lucene::ReaderPtr& reader) override {
    const auto chain = chains_.find(field);
    if (chain == chains_.end()) return texts_->tokenStream(field, reader);
    const Lucene::TokenStreamPtr whole = chain->second.type == FieldType::kText
                                             ? texts_->tokenStream(field, reader)
                                             : newLucene<WholeValue>(reader);
    return newLucene<ChainedTokens>(whole, chain->second.steps);
  }

  Lucene::TokenStreamPtr reusableTokenStream(const String& field, const Lucene::ReaderPtr& reader) override {
    return chains_.contains(field) ? tokenStream(field, reader) : texts_->reusableTokenStream(field, reader);
  }

  int32_t getPositionIncrementGap(const String& field) override {
    return texts_->getPositionIncrementGap(field);
  }

 private:
  Lucene::AnalyzerPtr texts_;
  std::map<String, Chain> chains_;
};

}  // namespace

bool IsAnalyzed(const FieldSettings& field) {
  return field.type == FieldType::kText || !field.pre_processors.empty();
}

Lucene::AnalyzerPtr NewFieldAnalyzer(const IndexSettings& settings) {
  return newLucene<FieldAnalyzer>(settings);
}

}  // namespace vantrel::elastic

#pragma once

#include <cstdint>
#include <memory>
#include <string>
#include <utility>
#include <vector>

#include "vantrel/elastic/export.h"
#include "vantrel/elastic/json_value.h"

namespace vantrel::elastic {

// The classes of suggestions are made by programs themselves, from these headers: what members they have, in which
// order, and which virtual operations is fixed.

// Something to offer to who is typing.
class VANTREL_ELASTIC_EXPORT Suggestion {
 public:
  Suggestion(std::string type, JsonValue payload) : type_(std::move(type)), payload_(std::move(payload)) {}
  Suggestion(const Suggestion&) = default;
  Suggestion& operator=(const Suggestion&) = default;
  Suggestion(Suggestion&&) noexcept = default;
  Suggestion& operator=(Suggestion&&) noexcept = default;
  virtual ~Suggestion() = default;

  // Who suggests it, such as "prefix".
  const std::string& type() const { return type_; }

  // What is suggested, an object. Its member "doc_freq" is what suggestions are sorted by; where it is no whole
  // number of 0 or more, it counts as 0. A "prefix" is {"doc_freq": documents that hold the term, "term": the term}.
  const JsonValue& payload() const { return payload_; }

 private:
  std::string type_;
  JsonValue payload_;
};

// A back-end: one way to come to suggestions.
class VANTREL_ELASTIC_EXPORT TermSuggesterImpl {
 public:
  TermSuggesterImpl() = default;
  TermSuggesterImpl(const TermSuggesterImpl&) = delete;
  TermSuggesterImpl& operator=(const TermSuggesterImpl&) = delete;
  virtual ~TermSuggesterImpl() = default;

  // The `most` best suggestions for what was typed in a field, or as many as it can offer, best first. What it
  // cannot do, it throws.
  virtual std::vector<Suggestion> Suggest(const std::string& field, const std::string& prefix,
                                          uint64_t most) const = 0;
};

// Asks its back-ends. Any number of threads may ask at once, once all back-ends are there.
class VANTREL_ELASTIC_EXPORT TermSuggester {
 public:
  TermSuggester() = default;
  TermSuggester(const TermSuggester&) = delete;
  TermSuggester& operator=(const TermSuggester&) = delete;
  virtual ~TermSuggester() = default;

  // The back-end is shared with the caller; an empty pointer is passed over.
  void AddBackEnd(const std::shared_ptr<TermSuggesterImpl>& back_end) { back_ends_.push_back(back_end); }

  // What all back-ends suggest, the most frequent first, equally frequent ones in the order of their terms' bytes;
  // of that, without the first `skip`, at most `limit`. Nothing where `limit` is 0 or less. What a back-end throws
  // passes on.
  std::vector<Suggestion> GetSuggest(const std::string& field, const std::string& prefix, unsigned int skip,
                                     int limit) const;

 private:
  std::vector<std::shared_ptr<TermSuggesterImpl>> back_ends_;
};

}  // namespace vantrel::elastic

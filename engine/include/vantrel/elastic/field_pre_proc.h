#pragma once

#include <cstdint>
#include <memory>
#include <string>
#include <utility>

#include "vantrel/elastic/export.h"

namespace vantrel::elastic {

// A piece of a text.
struct FieldToken {
  std::string text;       // UTF-8
  uint64_t position = 0;  // among the tokens of the text, from 0; those that begin at one place may share one
  uint64_t start = 0;     // where it stands in the text, in characters (code points)
  uint64_t end = 0;       // behind its last character
};

// The tokens of a text, one after the other. For one thread at a time.
class VANTREL_ELASTIC_EXPORT FieldTokens {
 public:
  FieldTokens() = default;
  FieldTokens(const FieldTokens&) = delete;
  FieldTokens& operator=(const FieldTokens&) = delete;
  virtual ~FieldTokens() = default;

  // Puts the next token, at first the first one, in the place of `token`; false when there is none.
  virtual bool Next(FieldToken& token) = 0;
};

// A step in turning a text into tokens. Steps make a chain by wrapping: each works on the tokens of the one that it
// wraps, the first one on the text as a whole. A chain does not change, and may be used by any number of threads.
class VANTREL_ELASTIC_EXPORT FieldPreProc {
 public:
  // `wrapped` may be empty.
  explicit FieldPreProc(std::shared_ptr<FieldPreProc> wrapped) : wrapped_(std::move(wrapped)) {}
  FieldPreProc(const FieldPreProc&) = delete;
  FieldPreProc& operator=(const FieldPreProc&) = delete;
  virtual ~FieldPreProc() = default;

  // The tokens of a text in UTF-8. They may outlive the text, but not the chain. They come as they are asked for:
  // memory goes with the text, not with their number.
  virtual std::unique_ptr<FieldTokens> Process(const std::string& text) const = 0;

 protected:
  // What comes in: the tokens of the wrapped step, or the whole text as one.
  std::unique_ptr<FieldTokens> ProcessWrapped(const std::string& text) const;

 private:
  std::shared_ptr<FieldPreProc> wrapped_;
};

// Wraps `previous` in a step of its own, with an argument. Throws std::invalid_argument where the argument is none
// for this step.
template <typename T>
std::shared_ptr<FieldPreProc> PreProcFactoryT(std::shared_ptr<FieldPreProc> previous,
                                              const std::string& argument) {
  return std::make_shared<T>(std::move(previous), argument);
}

}  // namespace vantrel::elastic

#include "vantrel/elastic/term_dict.h"

#include <limits>
#include <utility>

#include "elastic/terms/term_walk.h"
#include "vantrel/elastic/index_error.h"

namespace vantrel::elastic {

TermDict::TermDict(std::unique_ptr<TermWalk> walk) : walk_(std::move(walk)) {}

TermDict::~TermDict() = default;

std::string TermDict::GetName() const { return walk_->segment_name(); }

int TermDict::GetTermsCount() const {
  const uint64_t count = walk_->Count();
  if (count > static_cast<uint64_t>(std::numeric_limits<int>::max())) {
    throw IndexError(walk_->dictionary_name(), "dictionary has more terms than can be counted in 32 bits");
  }
  return static_cast<int>(count);
}

bool TermDict::Next() { return walk_->Next(); }

Lucene::TermPtr TermDict::Term() const { return walk_->Term(); }

}  // namespace vantrel::elastic

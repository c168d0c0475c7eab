#pragma once

#include <memory>
#include <optional>
#include <string>
#include <vector>

#include "vantrel/elastic/index_info.h"

namespace quorelasticd {

struct TermSelection {
  std::optional<std::string> field;  // all fields without
  std::string prefix;
};

// Walks the terms of all segments of an index together: in the dictionary's order, by field and then by text, each
// term once. Where a field is selected, the walk begins near what is selected. The files stay open, so that
// nothing written meanwhile disturbs the walk. For one thread at a time. Throws IndexError.
class MergedTerms {
 public:
  MergedTerms(const std::string& path, bool live_only, TermSelection selection);

  enum class Move {
    kTerm,        // a term that was selected
    kPassedOver,  // another one; worth knowing, as it takes time as well
    kEnd,
  };
  Move Next();

  // The term that Next() came to, in UTF-8.
  const std::string& field() const { return field_; }
  const std::string& text() const { return text_; }

 private:
  struct Segment {
    std::shared_ptr<vantrel::elastic::TermDict> terms;
    Lucene::TermPtr term;  // where it stands
  };

  void Advance(Segment& segment);
  bool IsPastSelection() const;

  TermSelection selection_;
  std::shared_ptr<vantrel::elastic::IndexInfo> info_;
  std::vector<Segment> segments_;  // a heap, the smallest term first; those at their end are gone
  Lucene::TermPtr last_;
  std::string field_;
  std::string text_;
};

}  // namespace quorelasticd

#pragma once

#include <lucene++/LuceneHeaders.h>

#include <cstddef>
#include <optional>
#include <string>
#include <vector>

#include "vantrel/elastic/index_settings.h"
#include "vantrel/elastic/search.h"

namespace vantrel::elastic {

// Loads what hits hand back of the documents of one index.
class StoredFields {
 public:
  // `wanted` are the names of the fields to load; when nothing, all.
  StoredFields(const IndexSettings& settings, const std::optional<std::vector<std::string>>& wanted);

  // Fills in the id and the fields of a hit, and returns how many bytes they take. May throw the library's
  // exceptions.
  size_t Load(Lucene::IndexReader& reader, int32_t document, SearchHit& hit) const;

 private:
  struct Field {
    std::string name;
    std::wstring wide_name;
  };

  std::wstring id_field_;
  std::vector<Field> fields_;  // the ones to load, in the settings' order
  Lucene::FieldSelectorPtr selector_;
};

}  // namespace vantrel::elastic

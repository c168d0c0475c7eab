#include "elastic/search/stored_fields.h"

// Not without the index library's main header.
#include <lucene++/MapFieldSelector.h>

#include <algorithm>
#include <utility>

namespace vantrel::elastic {

using Lucene::StringUtils;

StoredFields::StoredFields(const IndexSettings& settings,
                           const std::optional<std::vector<std::string>>& wanted)
    : id_field_(StringUtils::toUnicode(settings.id_field)) {
  auto selected = Lucene::Collection<Lucene::String>::newInstance();
  selected.add(id_field_);
  for (const FieldSettings& field : settings.fields) {
    const bool is_wanted =
        !wanted.has_value() || std::find(wanted->begin(), wanted->end(), field.name) != wanted->end();
    if (!field.stored || !is_wanted) continue;
    fields_.push_back({field.name, StringUtils::toUnicode(field.name)});
    selected.add(fields_.back().wide_name);
  }
  selector_ = Lucene::newLucene<Lucene::MapFieldSelector>(selected);
}

size_t StoredFields::Load(Lucene::IndexReader& reader, int32_t document, SearchHit& hit) const {
  const Lucene::DocumentPtr loaded = reader.document(document, selector_);
  hit.id = StringUtils::toUTF8(loaded->get(id_field_));
  size_t bytes = hit.id.size();
  for (const Field& field : fields_) {
    FieldValues values{field.name, {}};
    for (const Lucene::String& value : loaded->getValues(field.wide_name)) {
      values.values.push_back(StringUtils::toUTF8(value));
      bytes += values.values.back().size();
    }
    if (!values.values.empty()) hit.fields.push_back(std::move(values));
  }
  return bytes;
}

}  // namespace vantrel::elastic

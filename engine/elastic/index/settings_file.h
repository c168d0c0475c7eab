#pragma once

#include <string>

#include "vantrel/elastic/index_settings.h"

namespace vantrel::elastic {

// The settings of an index, kept beside its files as JSON:
//
//   {"version": 1, "compound_files": true, "id_field": "id",
//    "fields": [{"name": "id", "type": "keyword", "stored": true, "term_vector": "none", "norms": false,
//                "frequencies": false, "pre_processors": [{"name": "ngram", "argument": "2"}, ...]}, ...]}
//
// type: "text", "keyword". term_vector: "none", "terms", "positions", "offsets", "positions_offsets". Every
// member is there, but for "pre_processors" where there are none. A file of another version, or with a member unknown,
// is refused: to pass over what it asks for would index documents differently from those that are there.
inline constexpr const char* kSettingsFileName = "quorelastic.json";  // no name of the index library's files

// Throws IndexValueError, about the folder, where settings cannot be honoured: no field, two of one name, a
// name that is empty or not valid UTF-8, pre-processors that cannot be, an id field that is missing or no stored
// keyword.
void CheckSettings(const std::string& folder, const IndexSettings& settings);

// Durable on return. Throws IndexIoError.
void WriteSettings(const std::string& folder, const IndexSettings& settings);

// Throws IndexIoError where there is no such file or it cannot be read, IndexError where it makes no sense.
IndexSettings ReadSettings(const std::string& folder);

}  // namespace vantrel::elastic

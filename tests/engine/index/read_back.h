#pragma once

#include <string>
#include <vector>

#include "vantrel/elastic/document.h"
#include "vantrel/elastic/index.h"
#include "vantrel/elastic/library_types.h"

namespace quorelastic::testing {

// What stands in an index, read through the index library alone, in UTF-8.

Lucene::IndexReaderPtr OpenReader(const std::string& path);

// The terms of a field, in the dictionary's order.
std::vector<std::string> Terms(const std::string& path, const std::string& field);

// The documents, by number, that hold a term and are not deleted.
std::vector<int> DocumentsWith(const std::string& path, const std::string& field, const std::string& term);

// The stored values of a field of a document.
std::vector<std::string> StoredValues(const std::string& path, int document, const std::string& field);

// Settings with a keyword "id" and a text "body", and a document of these two.
vantrel::elastic::IndexSettings IdAndBody();
vantrel::elastic::Document MakeDocument(const std::string& id, const std::string& body);

}  // namespace quorelastic::testing

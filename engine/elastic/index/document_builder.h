#pragma once

#include <lucene++/LuceneHeaders.h>

#include <map>
#include <string>
#include <string_view>

#include "vantrel/elastic/document.h"
#include "vantrel/elastic/index_settings.h"

namespace vantrel::elastic {

// Checks documents against an index's settings and turns them into the library's. All that the library would
// silently drop, cut or empty is refused here, before it sees any of the document.
class DocumentBuilder {
 public:
  // `folder` is what error messages begin with.
  DocumentBuilder(std::string folder, const IndexSettings& settings);

  // Throws IndexValueError.
  Lucene::DocumentPtr Build(const Document& document) const;

  // The one id of a document, as a term. Throws IndexValueError where there is none, or more than one.
  Lucene::TermPtr BuildId(const Document& document) const;
  Lucene::TermPtr BuildId(std::string_view id) const { return BuildTerm(id_field_, id); }

  // What Add would index of a value. Throws IndexValueError.
  std::wstring CheckValue(std::string_view field, std::string_view value) const;

  // How many times as much text at most the field's pre-processors make of a value. Throws IndexValueError.
  uint64_t MostGrowthOf(std::string_view field) const { return Find(field).most_growth; }

  // A term to look for in the index. Throws IndexValueError: no such field, no valid UTF-8.
  Lucene::TermPtr BuildTerm(std::string_view field, std::string_view value) const;

 private:
  struct Field {
    FieldSettings settings;
    std::wstring wide_name;
    uint64_t most_growth;
  };

  const Field& Find(std::string_view name) const;
  void CheckSize(const std::string& what, size_t size) const;
  std::wstring CheckedValue(const Field& field, std::string_view value) const;
  [[noreturn]] void Refuse(std::string_view field, const std::string& problem) const;

  std::string folder_;
  std::string id_field_;
  std::map<std::string, Field, std::less<>> fields_;
};

}  // namespace vantrel::elastic

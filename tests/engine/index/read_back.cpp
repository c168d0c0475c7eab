#include "read_back.h"

#include <lucene++/LuceneHeaders.h>

#include "vantrel/elastic/library_setup.h"

namespace quorelastic::testing {

using Lucene::newLucene;
using Lucene::StringUtils;

Lucene::IndexReaderPtr OpenReader(const std::string& path) {
  vantrel::elastic::PrepareIndexLibrary();
  return Lucene::IndexReader::open(Lucene::FSDirectory::open(StringUtils::toUnicode(path)), true);
}

std::vector<std::string> Terms(const std::string& path, const std::string& field) {
  std::vector<std::string> terms;
  const auto reader = OpenReader(path);
  const auto walk = reader->terms();
  while (walk->next()) {
    if (StringUtils::toUTF8(walk->term()->field()) != field) continue;
    terms.push_back(StringUtils::toUTF8(walk->term()->text()));
  }
  return terms;
}

std::vector<int> DocumentsWith(const std::string& path, const std::string& field, const std::string& term) {
  std::vector<int> documents;
  const auto reader = OpenReader(path);
  const auto walk =
      reader->termDocs(newLucene<Lucene::Term>(StringUtils::toUnicode(field), StringUtils::toUnicode(term)));
  while (walk->next()) documents.push_back(walk->doc());
  return documents;
}

std::vector<std::string> StoredValues(const std::string& path, int document, const std::string& field) {
  std::vector<std::string> values;
  for (const Lucene::String& value :
       OpenReader(path)->document(document)->getValues(StringUtils::toUnicode(field))) {
    values.push_back(StringUtils::toUTF8(value));
  }
  return values;
}

vantrel::elastic::IndexSettings IdAndBody() {
  vantrel::elastic::IndexSettings settings;
  settings.fields = {{.name = "id", .type = vantrel::elastic::FieldType::kKeyword}, {.name = "body"}};
  return settings;
}

vantrel::elastic::Document MakeDocument(const std::string& id, const std::string& body) {
  return {{{"id", id}, {"body", body}}};
}

}  // namespace quorelastic::testing

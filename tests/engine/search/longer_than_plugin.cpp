// A search plugin of somebody else's: keeps the documents with a term longer than so many characters.

#include <lucene++/LuceneHeaders.h>

// Not without the headers above.
#include <lucene++/Filter.h>
#include <lucene++/OpenBitSet.h>

#include "vantrel/elastic/search_error.h"
#include "vantrel/elastic/search_plugin.h"

namespace {

using vantrel::elastic::SearchPlugin;
using vantrel::elastic::SearchPluginContext;

class LongerThanFilter : public Lucene::Filter {
 public:
  LongerThanFilter(Lucene::String field, size_t length) : field_(std::move(field)), length_(length) {}

  Lucene::DocIdSetPtr getDocIdSet(const Lucene::IndexReaderPtr& reader) override {
    const auto bits = Lucene::newLucene<Lucene::OpenBitSet>(reader->maxDoc());
    const auto documents = reader->termDocs();
    const auto walk = reader->terms(Lucene::newLucene<Lucene::Term>(field_, L""));
    for (Lucene::TermPtr term = walk->term(); term && term->field() == field_; term = walk->term()) {
      if (term->text().size() > length_) {
        documents->seek(walk);
        while (documents->next()) bits->set(static_cast<int64_t>(documents->doc()));
      }
      if (!walk->next()) break;
    }
    return bits;
  }

 private:
  Lucene::String field_;
  size_t length_;
};

class LongerThan : public SearchPlugin {
 public:
  std::string name() const override { return "longer_than"; }
  std::string summary() const override {
    return "a term of the field is longer: {\"field\": name, \"length\": n}";
  }

  Lucene::FilterPtr MakeFilter(const SearchPluginContext& /*context*/,
                               const Json::Value& data) const override {
    if (!data.isObject() || !data["field"].isString() || !data["length"].isUInt()) {
      throw vantrel::elastic::PluginDataError(name(), "expected is {\"field\": name, \"length\": n}");
    }
    return Lucene::newLucene<LongerThanFilter>(Lucene::StringUtils::toUnicode(data["field"].asString()),
                                               size_t{data["length"].asUInt()});
  }
};

SearchPlugin* Create() { return new LongerThan; }

}  // namespace

extern "C" VANTREL_ELASTIC_EXPORT const vantrel::elastic::SearchPluginEntry* quorelastic_search_plugin() {
  static const vantrel::elastic::SearchPluginEntry entry = {vantrel::elastic::kSearchPluginVersion, Create};
  return &entry;
}

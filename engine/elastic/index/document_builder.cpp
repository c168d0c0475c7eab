#include "elastic/index/document_builder.h"

#include <utility>

#include "elastic/common/quoted.h"
#include "elastic/index/field_analyzer.h"
#include "elastic/index/index_text.h"
#include "elastic/index/text_analyzer.h"
#include "elastic/preproc/pre_proc_chain.h"
#include "vantrel/elastic/index_error.h"

namespace vantrel::elastic {
namespace {

using Lucene::AbstractField;

// The library counts the characters of a document in 32 bits; this stays far from that.
constexpr size_t kLargestDocument = size_t{256} << 20;

AbstractField::TermVector ToLibrary(TermVector vector) {
  switch (vector) {
    case TermVector::kNone:
      return AbstractField::TERM_VECTOR_NO;
    case TermVector::kTerms:
      return AbstractField::TERM_VECTOR_YES;
    case TermVector::kPositions:
      return AbstractField::TERM_VECTOR_WITH_POSITIONS;
    case TermVector::kOffsets:
      return AbstractField::TERM_VECTOR_WITH_OFFSETS;
    case TermVector::kPositionsAndOffsets:
      return AbstractField::TERM_VECTOR_WITH_POSITIONS_OFFSETS;
  }
  return AbstractField::TERM_VECTOR_NO;
}

Lucene::FieldPtr NewField(const FieldSettings& settings, const std::wstring& name,
                          const std::wstring& value) {
  const auto field = Lucene::newLucene<Lucene::Field>(
      name, value, settings.stored ? AbstractField::STORE_YES : AbstractField::STORE_NO,
      IsAnalyzed(settings) ? AbstractField::INDEX_ANALYZED : AbstractField::INDEX_NOT_ANALYZED,
      ToLibrary(settings.term_vector));
  field->setOmitNorms(!settings.norms);
  field->setOmitTermFreqAndPositions(!settings.frequencies);
  return field;
}

}  // namespace

DocumentBuilder::DocumentBuilder(std::string folder, const IndexSettings& settings)
    : folder_(std::move(folder)), id_field_(settings.id_field) {
  for (const FieldSettings& field : settings.fields) {
    std::wstring wide_name;
    ToIndexText(field.name, wide_name);
    fields_.emplace(field.name, Field{field, std::move(wide_name), MostGrowth(field.pre_processors)});
  }
}

Lucene::DocumentPtr DocumentBuilder::Build(const Document& document) const {
  size_t size = 0;
  for (const DocumentField& value : document.fields) size += value.value.size();
  CheckSize("a document of ", size);
  size_t indexed_size = 0;
  const auto built = Lucene::newLucene<Lucene::Document>();
  for (const DocumentField& value : document.fields) {
    const Field& field = Find(value.name);
    indexed_size += value.value.size() * field.most_growth;
    CheckSize("a document whose pre-processors may make of it ", indexed_size);
    built->add(NewField(field.settings, field.wide_name, CheckedValue(field, value.value)));
  }
  return built;
}

Lucene::TermPtr DocumentBuilder::BuildId(const Document& document) const {
  const DocumentField* id = nullptr;
  for (const DocumentField& value : document.fields) {
    if (value.name != id_field_) continue;
    if (id != nullptr) Refuse(id_field_, "the document has more than one id");
    id = &value;
  }
  if (id == nullptr || id->value.empty()) Refuse(id_field_, "the document has no id");
  return BuildId(id->value);
}

std::wstring DocumentBuilder::CheckValue(std::string_view field, std::string_view value) const {
  return CheckedValue(Find(field), value);
}

Lucene::TermPtr DocumentBuilder::BuildTerm(std::string_view field, std::string_view value) const {
  const Field& found = Find(field);
  std::wstring wide;
  if (const char* problem = ToIndexText(value, wide)) Refuse(field, std::string("the value ") + problem);
  return Lucene::newLucene<Lucene::Term>(found.wide_name, wide);
}

const DocumentBuilder::Field& DocumentBuilder::Find(std::string_view name) const {
  const auto found = fields_.find(name);
  if (found == fields_.end()) throw IndexValueError(folder_, "there is no field " + Quoted(name));
  return found->second;
}

std::wstring DocumentBuilder::CheckedValue(const Field& field, std::string_view value) const {
  std::wstring wide;
  if (const char* problem = ToIndexText(value, wide)) {
    Refuse(field.settings.name, std::string("the value ") + problem);
  }
  const bool is_keyword = field.settings.type == FieldType::kKeyword;
  if (is_keyword && wide.size() > kMostWordCharacters) {
    Refuse(field.settings.name, "the value has " + std::to_string(wide.size()) +
                                    " characters; a keyword has at most " +
                                    std::to_string(kMostWordCharacters));
  }
  if (IsAnalyzed(field.settings) && wide.find(L'\0') != std::wstring::npos) {
    Refuse(field.settings.name, "the value holds U+0000, after which a text is not indexed");
  }
  if (is_keyword) return wide;
  if (const size_t length = FindTooLongWord(wide); length > 0) {
    Refuse(field.settings.name, "the value holds a word of " + std::to_string(length) +
                                    " characters; a word has at most " + std::to_string(kMostWordCharacters));
  }
  return wide;
}

void DocumentBuilder::CheckSize(const std::string& what, size_t size) const {
  if (size <= kLargestDocument) return;
  throw IndexValueError(folder_, what + std::to_string(size) + " bytes is larger than " +
                                     std::to_string(kLargestDocument) + ", the most that is taken");
}

void DocumentBuilder::Refuse(std::string_view field, const std::string& problem) const {
  throw IndexValueError(folder_, "field " + Quoted(field) + ": " + problem);
}

}  // namespace vantrel::elastic

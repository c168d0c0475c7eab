#include "commands/document_source.h"

#include <utility>

#include "base/limits.h"
#include "base/text.h"
#include "data_root/import_file.h"
#include "errors/request_error.h"
#include "vantrel/elastic/json_value.h"

namespace quorelasticd {
namespace {

class InlineSource : public DocumentSource {
 public:
  explicit InlineSource(Json::Value documents) : documents_(std::move(documents)) {}

  std::optional<Item> Next() override {
    if (next_ >= documents_.size()) return std::nullopt;
    Item item;
    item.json.swap(documents_[next_]);
    item.position = ++next_;
    return item;
  }

  void DescribeProgress(Json::Value& progress) const override { progress["total"] = documents_.size(); }

 private:
  Json::Value documents_;
  Json::ArrayIndex next_ = 0;
};

class ImportSource : public DocumentSource {
 public:
  ImportSource(const std::string& folder, const std::string& name) : file_(folder, name) {}

  std::optional<Item> Next() override {
    for (;;) {
      const std::optional<ImportFile::Line> line = file_.Next();
      if (!line.has_value()) return std::nullopt;
      const bool is_blank = line->text.find_first_not_of(" \t\r") == std::string_view::npos;
      if (!is_blank || line->is_too_long) return ToItem(*line);
    }
  }

  void DescribeProgress(Json::Value& progress) const override {
    progress["bytes"] = static_cast<Json::UInt64>(file_.bytes_read());
    progress["total_bytes"] = static_cast<Json::UInt64>(file_.total_bytes());
  }

 private:
  static Item ToItem(const ImportFile::Line& line) {
    Item item;
    item.position = line.number;
    vantrel::elastic::JsonValue json;
    if (line.is_too_long) {
      item.problem = "the line is longer than " + std::to_string(kLongestImportLine) + " bytes";
    } else if (FindInvalidUtf8(line.text) != std::string_view::npos) {
      item.problem = "the line is no valid UTF-8";
    } else if (!json.fromString(std::string(line.text))) {
      item.problem = "the line is no JSON document";
    }
    item.json.swap(json);
    return item;
  }

  ImportFile file_;
};

}  // namespace

vantrel::elastic::Document DocumentSource::Item::ToDocument() const {
  if (!problem.empty()) throw RequestError(ErrorCode::kBadRequest, problem);
  return quorelasticd::ToDocument(json);
}

std::unique_ptr<DocumentSource> InlineDocuments(Json::Value documents) {
  return std::make_unique<InlineSource>(std::move(documents));
}

std::unique_ptr<DocumentSource> ImportedDocuments(const std::string& folder, const std::string& name) {
  return std::make_unique<ImportSource>(folder, name);
}

}  // namespace quorelasticd

#include "commands/document_source.h"

#include <utility>

#include "base/limits.h"
#include "base/memory_use.h"
#include "commands/json_text.h"
#include "data_root/import_file.h"
#include "errors/request_error.h"

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
      memory_use_.Note(line->text.size());
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
    if (line.is_too_long) {
      item.problem = "the line is longer than " + std::to_string(kLongestImportLine) + " bytes";
      return item;
    }
    try {
      item.json = ParseJson(std::string(line.text), "the line");
    } catch (const RequestError& error) {
      item.problem = error.reason();
    }
    return item;
  }

  MemoryUse memory_use_;  // of what follows
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

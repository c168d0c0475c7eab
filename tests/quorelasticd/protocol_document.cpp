#include "protocol_document.h"

#include <sstream>

#include "support/files.h"

namespace quorelastic::testing {
namespace {

std::string Trimmed(const std::string& text) {
  const size_t begin = text.find_first_not_of(' ');
  return begin == std::string::npos ? "" : text.substr(begin, text.find_last_not_of(' ') - begin + 1);
}

std::vector<std::string> Cells(const std::string& row) {
  std::vector<std::string> cells;
  std::istringstream stream(row.substr(1));
  for (std::string cell; std::getline(stream, cell, '|');) cells.push_back(Trimmed(cell));
  return cells;
}

class Reader {
 public:
  explicit Reader(const std::string& text) : stream_(text) { document_.text = text; }

  ProtocolDocument Read() {
    while (Next()) {
      if (line_.starts_with("```")) {
        ReadFence();
      } else if (line_.starts_with("#")) {
        section_ = &document_.sections[line_.substr(line_.find(' ') + 1)];
        is_past_paragraph_ = false;
      } else if (section_ != nullptr) {
        ReadBody();
      }
    }
    return std::move(document_);
  }

 private:
  bool Next() {
    ++number_;
    return static_cast<bool>(std::getline(stream_, line_));
  }

  void ReadFence() {
    const std::string kind = line_.substr(3);
    ProtocolDocument::Transcript fence{number_ + 1, {}};
    while (Next() && line_ != "```") fence.lines.push_back(line_);
    if (kind == "transcript") document_.transcripts.push_back(fence);
    if (!kind.starts_with("ndjson ")) return;
    std::string& file = document_.import_files[kind.substr(7)];
    for (const std::string& line : fence.lines) file += line + "\n";
  }

  void ReadBody() {
    if (line_.starts_with("|---")) return ReadTable();
    if (line_.empty()) is_past_paragraph_ = is_past_paragraph_ || !section_->paragraph.empty();
    if (line_.empty() || is_past_paragraph_ || line_.starts_with("|")) return;
    section_->paragraph.push_back(line_);
  }

  void ReadTable() {
    const bool is_first = section_->table.empty();
    while (Next() && line_.starts_with("|")) {
      if (is_first) section_->table.push_back(Cells(line_));
    }
  }

  std::istringstream stream_;
  std::string line_;
  int number_ = 0;
  ProtocolDocument document_;
  ProtocolDocument::Section* section_ = nullptr;
  bool is_past_paragraph_ = false;
};

}  // namespace

ProtocolDocument ReadProtocolDocument() { return Reader(ReadFile(QUORELASTICD_PROTOCOL)).Read(); }

}  // namespace quorelastic::testing

#include "commands/document_source.h"

#include <condition_variable>
#include <deque>
#include <exception>
#include <mutex>
#include <optional>
#include <thread>
#include <utility>
#include <vector>

#include "base/limits.h"
#include "base/memory_use.h"
#include "commands/json_text.h"
#include "data_root/import_file.h"
#include "errors/request_error.h"

namespace quorelasticd {
namespace {

// Sets the item's document, or its problem.
void Take(const Json::Value& json, DocumentSource::Item& item) {
  try {
    item.document = ToDocument(json);
  } catch (const RequestError& error) {
    item.problem = error.reason();
  }
}

class InlineSource : public DocumentSource {
 public:
  explicit InlineSource(Json::Value documents) : documents_(std::move(documents)) {}

  Move Next(std::chrono::milliseconds /*most*/, Item& item) override {
    if (next_ >= documents_.size()) return Move::kEnd;
    Json::Value json;
    json.swap(documents_[next_]);
    item = {};
    item.position = ++next_;
    Take(json, item);
    return Move::kItem;
  }

  void DescribeProgress(Json::Value& progress) const override { progress["total"] = documents_.size(); }

 private:
  Json::Value documents_;
  Json::ArrayIndex next_ = 0;
};

// The documents of a file, and how far one has read when one has them.
class ImportReader {
 public:
  ImportReader(const std::string& folder, const std::string& name) : file_(folder, name) {}

  struct Read {
    DocumentSource::Item item;
    uint64_t bytes_read = 0;
    size_t size = 0;  // of the line
  };

  std::optional<Read> Next() {
    for (;;) {
      const std::optional<ImportFile::Line> line = file_.Next();
      if (!line.has_value()) return std::nullopt;
      memory_use_.Note(line->text.size());
      const bool is_blank = line->text.find_first_not_of(" \t\r") == std::string_view::npos;
      if (!is_blank || line->is_too_long) return Read{ToItem(*line), file_.bytes_read(), line->text.size()};
    }
  }

  // Lets Next() end soon. For any thread.
  void GiveUp() { file_.GiveUp(); }

  uint64_t total_bytes() const { return file_.total_bytes(); }

 private:
  static DocumentSource::Item ToItem(const ImportFile::Line& line) {
    DocumentSource::Item item;
    item.position = line.number;
    if (line.is_too_long) {
      item.problem = "the line is longer than " + std::to_string(kLongestImportLine) + " bytes";
      return item;
    }
    try {
      Take(ParseJson(std::string(line.text), "the line"), item);
    } catch (const RequestError& error) {
      item.problem = error.reason();
    }
    return item;
  }

  MemoryUse memory_use_;  // of what follows
  ImportFile file_;
};

// Parsing takes a good part of the time that indexing takes: each has a thread. They hand over whole batches, a few
// of which may wait.
class ImportSource : public DocumentSource {
 public:
  ImportSource(const std::string& folder, const std::string& name)
      : reader_(folder, name), total_bytes_(reader_.total_bytes()) {}
  ~ImportSource() override {
    {
      const std::lock_guard lock(mutex_);
      is_given_up_ = true;
    }
    reader_.GiveUp();
    changed_.notify_all();
    if (thread_.joinable()) thread_.join();
  }

  Move Next(std::chrono::milliseconds most, Item& item) override {
    if (!thread_.joinable()) thread_ = std::thread([this] { ReadAhead(); });
    if (next_ == batch_.read.size()) {
      if (const Move move = TakeBatch(most); move != Move::kItem) return move;
    }
    ImportReader::Read& read = batch_.read[next_++];
    bytes_read_ = read.bytes_read;
    item = std::move(read.item);
    return Move::kItem;
  }

  void DescribeProgress(Json::Value& progress) const override {
    progress["bytes"] = static_cast<Json::UInt64>(bytes_read_);
    progress["total_bytes"] = static_cast<Json::UInt64>(total_bytes_);
  }

 private:
  struct Batch {
    std::vector<ImportReader::Read> read;
    size_t bytes = 0;  // of the lines
  };

  static constexpr size_t kBatchDocuments = 100;
  static constexpr size_t kBatchBytes = size_t{256} << 10;
  static constexpr size_t kWaitingBytes = size_t{1} << 20;  // of batches; with so many, nothing is added

  void ReadAhead() {
    try {
      while (HandOver(ReadBatch())) continue;
    } catch (...) {
      const std::lock_guard lock(mutex_);
      failure_ = std::current_exception();
    }
    {
      const std::lock_guard lock(mutex_);
      is_over_ = true;
    }
    changed_.notify_all();
  }

  // Empty at the end of the file.
  Batch ReadBatch() {
    Batch batch;
    while (batch.read.size() < kBatchDocuments && batch.bytes < kBatchBytes) {
      std::optional<ImportReader::Read> read = reader_.Next();
      if (!read.has_value()) break;
      batch.bytes += read->size;
      batch.read.push_back(std::move(*read));
    }
    return batch;
  }

  // False where no further one is wanted.
  bool HandOver(Batch batch) {
    if (batch.read.empty()) return false;
    std::unique_lock lock(mutex_);
    changed_.wait(lock, [&] { return is_given_up_ || waiting_bytes_ < kWaitingBytes; });
    if (is_given_up_) return false;
    waiting_bytes_ += batch.bytes;
    waiting_.push_back(std::move(batch));
    lock.unlock();
    changed_.notify_all();
    return true;
  }

  // Throws what the reading threw.
  Move TakeBatch(std::chrono::milliseconds most) {
    std::unique_lock lock(mutex_);
    if (!changed_.wait_for(lock, most, [&] { return is_over_ || !waiting_.empty(); })) return Move::kNotYet;
    if (waiting_.empty()) {
      if (failure_ != nullptr) std::rethrow_exception(failure_);
      return Move::kEnd;
    }
    batch_ = std::move(waiting_.front());
    next_ = 0;
    waiting_.pop_front();
    waiting_bytes_ -= batch_.bytes;
    lock.unlock();
    changed_.notify_all();
    return Move::kItem;
  }

  ImportReader reader_;  // the thread's, from its start
  const uint64_t total_bytes_;
  uint64_t bytes_read_ = 0;
  Batch batch_;  // what is being taken
  size_t next_ = 0;

  std::mutex mutex_;  // for what follows
  std::condition_variable changed_;
  std::deque<Batch> waiting_;
  size_t waiting_bytes_ = 0;
  std::exception_ptr failure_;
  bool is_over_ = false;      // nothing more is handed over
  bool is_given_up_ = false;  // nothing more is taken
  std::thread thread_;
};

}  // namespace

std::unique_ptr<DocumentSource> InlineDocuments(Json::Value documents) {
  return std::make_unique<InlineSource>(std::move(documents));
}

std::unique_ptr<DocumentSource> ImportedDocuments(const std::string& folder, const std::string& name) {
  return std::make_unique<ImportSource>(folder, name);
}

}  // namespace quorelasticd

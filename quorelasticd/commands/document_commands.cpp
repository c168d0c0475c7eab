#include <chrono>
#include <limits>
#include <utility>

#include "base/limits.h"
#include "commands/commands.h"
#include "commands/daemon.h"
#include "commands/document_source.h"
#include "vantrel/elastic/index_error.h"

namespace quorelasticd {
namespace {

using vantrel::elastic::Index;

// A step ends, and others get their turn, after so many documents or so long.
constexpr size_t kDocumentsPerStep = 1000;
constexpr std::chrono::milliseconds kLongestBulkStep{200};

class DocumentBulk : public RunningCommand {
 public:
  DocumentBulk(const Daemon& daemon, Json::Value data)
      : open_(daemon.registry().Use(data["id"].asString())),
        changes_(open_),
        commits_(data.get("commit", true).asBool()),
        source_(MakeSource(daemon, data)) {}

  boost::asio::any_io_executor executor() const override { return open_->writing_turn(); }

  Outcome Step() override {
    bool is_committed = false;
    try {
      if (!at_end_) return AddSome();
      commits_ ? changes_.Commit() : changes_.Promise();
      is_committed = commits_;
      return Finish();
    } catch (...) {
      throw ToRequestError(is_committed);
    }
  }

 private:
  static std::unique_ptr<DocumentSource> MakeSource(const Daemon& daemon, Json::Value& data) {
    if (data.isMember("documents") == data.isMember("file")) {
      throw RequestError(ErrorCode::kBadRequest, "data: expected either documents or file");
    }
    if (data.isMember("documents")) return InlineDocuments(std::move(data["documents"]));
    return ImportedDocuments(daemon.registry().root().import_path(), data["file"].asString());
  }

  Outcome AddSome() {
    const auto start = std::chrono::steady_clock::now();
    for (size_t i = 0; i < kDocumentsPerStep; ++i) {
      if (std::chrono::steady_clock::now() - start > kLongestBulkStep) break;
      DocumentSource::Item item;
      const DocumentSource::Move move = source_->Next(kLongestBulkStep, item);
      if (move == DocumentSource::Move::kNotYet) break;
      if (move == DocumentSource::Move::kEnd) {
        at_end_ = true;
        return Nothing();
      }
      Add(item);
    }
    Json::Value progress(Json::objectValue);
    AddTallies(progress);
    source_->DescribeProgress(progress);
    return Progress(std::move(progress));
  }

  void Add(const DocumentSource::Item& item) {
    if (!item.problem.empty()) return NoteFailure(item.position, item.problem);
    try {
      changes_.Apply([&](Index& index) { index.Update(item.document); });
      ++indexed_;
    } catch (...) {
      const RequestError error = ToRequestError();
      if (error.code() != ErrorCode::kBadRequest) throw error;
      NoteFailure(item.position, error.reason());
    }
  }

  void NoteFailure(uint64_t position, const std::string& reason) {
    if (++failed_ > kFailuresReported) return;
    Json::Value& failure = failures_.append(Json::objectValue);
    failure["position"] = static_cast<Json::UInt64>(position);
    failure["reason"] = reason;
  }

  void AddTallies(Json::Value& object) const {
    object["indexed"] = static_cast<Json::UInt64>(indexed_);
    object["failed"] = static_cast<Json::UInt64>(failed_);
  }

  Outcome Finish() {
    Json::Value result(Json::objectValue);
    AddTallies(result);
    result["committed"] = commits_;
    if (failed_ == 0) return Result(std::move(result));
    const Json::Value& first = failures_[0];
    const RequestError error(ErrorCode::kBadRequest,
                             std::to_string(failed_) + " of " + std::to_string(failed_ + indexed_) +
                                 " documents were refused; the first, at position " +
                                 first["position"].asString() + ": " + first["reason"].asString());
    result["failures"] = failures_;
    return PartialResult(std::move(result), error);
  }

  std::shared_ptr<OpenIndex> open_;
  Changes changes_;
  bool commits_;
  std::unique_ptr<DocumentSource> source_;
  bool at_end_ = false;
  uint64_t indexed_ = 0;
  uint64_t failed_ = 0;
  Json::Value failures_ = Json::arrayValue;
};

class DocumentDelete : public RunningCommand {
 public:
  DocumentDelete(const Daemon& daemon, Json::Value data)
      : open_(daemon.registry().Use(data["id"].asString())),
        changes_(open_),
        commits_(data.get("commit", true).asBool()),
        ids_(std::move(data["ids"])) {}

  boost::asio::any_io_executor executor() const override { return open_->writing_turn(); }

  Outcome Step() override {
    for (size_t i = 0; i < kDocumentsPerStep && next_ < ids_.size(); ++i) {
      const std::string id = ids_[next_++].asString();
      Delete(id);
    }
    if (next_ < ids_.size()) return Nothing();
    commits_ ? changes_.Commit() : changes_.Promise();
    Json::Value result(Json::objectValue);
    result["ids"] = ids_.size();
    result["committed"] = commits_;
    return Result(std::move(result));
  }

 private:
  void Delete(const std::string& id) {
    try {
      changes_.Apply([&](Index& index) { index.DeleteById(id); });
    } catch (const vantrel::elastic::IndexValueError&) {
      // No document can have such an id: it is not there, like others that are passed over.
    }
  }

  std::shared_ptr<OpenIndex> open_;
  Changes changes_;
  bool commits_;
  Json::Value ids_;
  Json::ArrayIndex next_ = 0;
};

constexpr const char* kCommitMeaning = "Whether to commit at the end; true by default.";

}  // namespace

Command DocumentBulkCommand() {
  return {"document_bulk", "Adds documents; one whose id is there already takes its place.",
          Object({
              {"id", true, Text(), "The index's name."},
              {"documents", false, ArrayOf(Any(), std::numeric_limits<int64_t>::max()),
               "The documents: objects of fields, each a string or an array of strings."},
              {"file", false, String(kLongestFileName),
               "Instead of documents: a file in the import folder that holds one document a line."},
              {"commit", false, Boolean(), kCommitMeaning},
          }),
          Begin<DocumentBulk>};
}

Command DocumentDeleteCommand() {
  return {"document_delete", "Deletes documents by their ids; ids that are not there are passed over.",
          Object({
              {"id", true, Text(), "The index's name."},
              {"ids", true, ArrayOf(String(kLongestDocumentId), kMostIds), "The ids of the documents."},
              {"commit", false, Boolean(), kCommitMeaning},
          }),
          Begin<DocumentDelete>};
}

}  // namespace quorelasticd

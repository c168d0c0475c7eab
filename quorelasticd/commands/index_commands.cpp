#include <utility>

#include "base/text.h"
#include "commands/commands.h"
#include "commands/counts_json.h"
#include "commands/daemon.h"
#include "commands/settings_json.h"
#include "data_root/index_name.h"

namespace quorelasticd {
namespace {

class IndexCreate : public RunningCommand {
 public:
  IndexCreate(const Daemon& daemon, const Json::Value& data)
      : daemon_(daemon), name_(data["id"].asString()), settings_(ToSettings(data["settings"])) {
    if (IsIndexName(name_)) return;
    throw RequestError(ErrorCode::kBadRequest,
                       std::string("data.id: expected ") + kIndexNameRule + ", found " + Quoted(name_));
  }

  boost::asio::any_io_executor executor() const override { return daemon_.registry().slow_executor(); }

  Outcome Step() override {
    Json::Value result(Json::objectValue);
    result["settings"] = ToJson(daemon_.registry().Create(name_, settings_));
    result["id"] = name_;
    return Result(std::move(result));
  }

 private:
  const Daemon& daemon_;
  std::string name_;
  vantrel::elastic::IndexSettings settings_;
};

// One index a step: there may be many.
class IndexList : public RunningCommand {
 public:
  IndexList(const Daemon& daemon, const Json::Value& data) : daemon_(daemon), is_one_(data.isMember("id")) {
    if (is_one_) {
      names_ = {data["id"].asString()};
      daemon_.registry().PathOf(names_.front());
    } else {
      names_ = daemon_.registry().root().ListIndexes();
    }
  }

  boost::asio::any_io_executor executor() const override { return daemon_.registry().slow_executor(); }

  Outcome Step() override {
    if (next_ < names_.size()) Describe(names_[next_++]);
    if (next_ < names_.size()) return Nothing();
    Json::Value result(Json::objectValue);
    result["indexes"] = std::move(entries_);
    return Result(std::move(result));
  }

 private:
  void Describe(const std::string& name) {
    Json::Value entry(Json::objectValue);
    entry["id"] = name;
    try {
      const std::shared_ptr<vantrel::elastic::Index> index = daemon_.registry().Look(name);
      const vantrel::elastic::IndexStatistics statistics = index->Statistics();
      AddCounts(statistics.documents, entry);
      entry["segments"] = static_cast<Json::UInt64>(statistics.segments);
      entry["size_bytes"] = static_cast<Json::UInt64>(statistics.bytes);
      entry["settings"] = ToJson(index->settings());
    } catch (...) {
      const RequestError error = ToRequestError();
      if (is_one_) {
        daemon_.registry().PathOf(name);  // throws where it has been deleted since
        throw error;
      }
      if (!daemon_.registry().root().HasIndex(name)) return;  // deleted since
      entry["error"] = error.ToJson();
    }
    entries_.append(std::move(entry));
  }

  const Daemon& daemon_;
  bool is_one_;
  std::vector<std::string> names_;
  size_t next_ = 0;
  Json::Value entries_ = Json::arrayValue;
};

class IndexDelete : public RunningCommand {
 public:
  IndexDelete(const Daemon& daemon, const Json::Value& data) : daemon_(daemon), name_(data["id"].asString()) {
    if (data["confirm"].asString() == name_) return;
    throw RequestError(ErrorCode::kBadRequest,
                       "data.confirm: expected the same name as data.id, " + Quoted(name_));
  }

  boost::asio::any_io_executor executor() const override { return daemon_.registry().slow_executor(); }

  Outcome Step() override {
    daemon_.registry().Delete(name_);
    Json::Value result(Json::objectValue);
    result["id"] = name_;
    return Result(std::move(result));
  }

 private:
  const Daemon& daemon_;
  std::string name_;
};

class Commit : public RunningCommand {
 public:
  Commit(const Daemon& daemon, const Json::Value& data)
      : open_(daemon.registry().Use(data["id"].asString())), changes_(open_) {}

  boost::asio::any_io_executor executor() const override { return open_->writing_turn(); }

  Outcome Step() override {
    // What fails after the commit does not undo it.
    bool is_committed = false;
    try {
      Prepare(changes_);
      changes_.Commit();
      is_committed = true;
      changes_.ReportBrokenPromise();
      Json::Value result(Json::objectValue);
      result["committed"] = true;
      AddCounts(open_->index().CountDocuments(), result);
      return Result(std::move(result));
    } catch (...) {
      throw ToRequestError(is_committed);
    }
  }

 protected:
  virtual void Prepare(Changes& /*changes*/) {}

 private:
  std::shared_ptr<OpenIndex> open_;
  Changes changes_;
};

class Optimize : public Commit {
 public:
  using Commit::Commit;

 protected:
  void Prepare(Changes& changes) override {
    changes.Apply([](vantrel::elastic::Index& index) { index.Optimize(); });
  }
};

}  // namespace

Command IndexCreateCommand() {
  return {"index_create", "Makes an empty index.",
          Object({
              {"id", true, Text(), std::string("The index's name: ") + kIndexNameRule + "."},
              {"settings", true, SettingsShape(), "Its fields, settled for good."},
          }),
          Begin<IndexCreate>};
}

Command IndexListCommand() {
  return {"index_list", "Describes the indexes, or one of them.",
          Object({{"id", false, Text(), "The only index to describe; all by default."}}), Begin<IndexList>};
}

Command IndexDeleteCommand() {
  return {"index_delete", "Removes an index and all its documents, for good.",
          Object({
              {"id", true, Text(), "The index's name."},
              {"confirm", true, Text(), "The same name once more, lest a slip costs an index."},
          }),
          Begin<IndexDelete>};
}

Command CommitCommand() {
  return {"commit", "Makes all changes of an index durable.",
          Object({{"id", true, Text(), "The index's name."}}), Begin<Commit>};
}

Command OptimizeCommand() {
  return {"optimize", "Merges an index into one segment without its deleted documents, and commits.",
          Object({{"id", true, Text(), "The index's name."}}), Begin<Optimize>};
}

}  // namespace quorelasticd

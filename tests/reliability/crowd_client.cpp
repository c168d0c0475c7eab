#include "crowd_client.h"

#include <sys/socket.h>

#include <iterator>
#include <stdexcept>
#include <utility>

namespace quorelastic::testing {
namespace {

constexpr int kMostAtATime = 4;

JsonValue Request(const char* command) {
  JsonValue request(Json::objectValue);
  request["command"] = command;
  return request;
}

JsonValue RequestOfIndex(const char* command) {
  JsonValue request = Request(command);
  request["data"]["id"] = "crowd";
  return request;
}

JsonValue SearchFor(const std::string& query) {
  JsonValue request = Request("search");
  request["data"]["indice"].append("crowd");
  request["data"]["query_string"]["query"] = query;
  return request;
}

}  // namespace

CrowdClient::CrowdClient(const std::string& socket, int number, uint32_t seed)
    : client_(socket), owner_("o"), random_(seed) {
  owner_ += std::to_string(number);
}

void CrowdClient::Run(int requests) {
  try {
    while (sent_ < requests) {
      const int together = std::min(Pick(1, kMostAtATime), requests - sent_);
      for (int i = 0; i < together; ++i) SendRandomRequest();
      ReadReplies();
    }
    shutdown(client_.descriptor(), SHUT_WR);
    if (!client_.IsHungUp()) problems_.push_back("more replies than requests");
  } catch (const std::exception& error) {
    problems_.push_back(error.what());
  }
}

int CrowdClient::Pick(int least, int most) {
  return std::uniform_int_distribution<int>(least, most)(random_);
}

void CrowdClient::SendRandomRequest() {
  const int choice = Pick(0, 99);
  if (choice < 35) return SendChange();
  if (choice < 70) return SendSearch();
  if (choice < 85) return SendQuickRequest();
  SendWrongRequest();
}

void CrowdClient::SendChange() {
  const int choice = Pick(0, 99);
  if (choice < 60) return SendLoad();
  if (choice < 80) return SendDelete();
  Send(RequestOfIndex(choice < 98 ? "commit" : "optimize"));
}

void CrowdClient::SendLoad() {
  JsonValue request = RequestOfIndex("document_bulk");
  request["data"]["commit"] = Pick(0, 3) == 0;
  for (int i = Pick(1, 10); i > 0; --i) {
    Json::Value& document = request["data"]["documents"].append(Json::objectValue);
    const std::string id = owner_ + "-" + std::to_string(Pick(0, 99));
    document["id"] = id;
    document["owner"] = owner_;
    document["text"] = "word" + std::to_string(Pick(0, 20)) + " of everybody";
    documents_.insert(id);
  }
  Send(std::move(request));
}

void CrowdClient::SendDelete() {
  JsonValue request = RequestOfIndex("document_delete");
  request["data"]["commit"] = Pick(0, 3) == 0;
  request["data"]["ids"].append("nobody's");
  if (!documents_.empty()) {
    const auto victim = std::next(documents_.begin(), Pick(0, static_cast<int>(documents_.size()) - 1));
    request["data"]["ids"].append(*victim);
    documents_.erase(victim);
  }
  Send(std::move(request));
}

void CrowdClient::SendSearch() {
  const bool by_filter = Pick(0, 1) == 0;
  JsonValue request = SearchFor(by_filter ? "text:word" + std::to_string(Pick(0, 20)) + " everybody"
                                          : "+owner:" + owner_ + " word*");
  Json::Value& data = request["data"];
  data["from"] = Pick(0, 5);
  data["size"] = Pick(0, 50);
  if (Pick(0, 1) == 0) data["load_field"].append("owner");
  if (by_filter) {
    Json::Value& filter = data["filters"].append(Json::objectValue);
    filter["name"] = "plugin";
    filter["data"]["name"] = "term";
    filter["data"]["data"]["field"] = "owner";
    filter["data"]["data"]["values"].append(owner_);
  }
  Send(std::move(request), "", true);
}

void CrowdClient::SendQuickRequest() {
  switch (Pick(0, 5)) {
    case 0:
      return Send(Request("status"));
    case 1:
      return Send(RequestOfIndex("terms"));
    case 2:
      return Send(RequestOfIndex("index_list"));
    case 3:
      return Send(Request("plugin_list"));
    case 4:
      return Send(Request("help"));
    default: {
      JsonValue request = RequestOfIndex("analyze");
      request["data"]["field"] = "text";
      request["data"]["text"] = "One Two Three";
      return Send(std::move(request));
    }
  }
}

void CrowdClient::SendWrongRequest() {
  JsonValue request;
  switch (Pick(0, 5)) {
    case 0:
      return Send(Request("frobnicate"), "unknown_command");
    case 1:
      return Send(Request("commit"), "bad_request");
    case 2:
      return Send(SearchFor("(text"), "query_syntax");
    case 3:
      request = Request("commit");
      request["data"]["id"] = "no-such-index";
      return Send(std::move(request), "index_not_found");
    case 4:
      request = SearchFor("text");
      request["data"]["from"] = 1'000'000;
      return Send(std::move(request), "limit_exceeded");
    default:
      return SendText(R"({"command":"status",)", {{}, "", "bad_request"});
  }
}

void CrowdClient::Send(JsonValue request, const std::string& error, bool only_own_hits) {
  Expectation expectation{{}, request["command"].asString(), error, only_own_hits};
  if (error == "unknown_command") expectation.command.clear();
  const std::string id = owner_ + "/" + std::to_string(sent_);
  expectation.request_id = JsonValue(id);
  request["request_id"] = id;
  SendText(request.toString(), std::move(expectation));
}

void CrowdClient::SendText(const std::string& text, Expectation expectation) {
  if (!client_.Send(text)) throw std::runtime_error("cannot send a request");
  ++sent_;
  awaited_.push_back(std::move(expectation));
}

void CrowdClient::ReadReplies() {
  for (const Expectation& expectation : std::exchange(awaited_, {})) {
    JsonValue reply;
    do {
      reply = client_.Receive();
      Check(expectation, reply);
    } while (!reply.isMember("success"));
  }
}

void CrowdClient::Check(const Expectation& expectation, const JsonValue& reply) {
  bool is_right = reply["request_id"] == expectation.request_id;
  is_right =
      is_right && reply["command"] == (expectation.command.empty() ? Json::Value() : expectation.command);
  is_right = is_right && reply["error"]["code"].asString() == expectation.error;
  if (expectation.only_own_hits) {
    for (const Json::Value& hit : reply["result"]["hits"]) {
      is_right = is_right && hit["fields"]["owner"] == owner_;
    }
  }
  if (!is_right) problems_.push_back("to " + expectation.request_id.toString() + ": " + reply.toString());
}

}  // namespace quorelastic::testing

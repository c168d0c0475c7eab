#include "errors/request_error.h"

#include <new>
#include <system_error>
#include <utility>

#include "base/text.h"
#include "vantrel/elastic/index_error.h"
#include "vantrel/elastic/search_error.h"

namespace quorelasticd {
namespace {

// What is wrong with a request does not depend on where the index lies.
std::string WithoutPath(const vantrel::elastic::IndexError& error) {
  const std::string text = error.what();
  const std::string prefix = error.path() + ": ";
  return text.starts_with(prefix) ? text.substr(prefix.size()) : text;
}

RequestError SyntaxRequestError(const vantrel::elastic::QuerySyntaxError& error) {
  Json::Value details(Json::objectValue);
  details["position"] = static_cast<Json::UInt64>(error.position());
  return RequestError(ErrorCode::kQuerySyntax, error.what(), std::move(details));
}

Json::Value LimitDetails(const std::string& limit, int64_t most) {
  Json::Value details(Json::objectValue);
  details["limit"] = limit;
  details["most"] = static_cast<Json::Int64>(most);
  return details;
}

}  // namespace

RequestError::RequestError(ErrorCode code, const std::string& reason, Json::Value details)
    : code_(code), reason_(ToOneLine(reason)), details_(std::move(details)) {}

Json::Value RequestError::ToJson() const {
  Json::Value error = details_;
  error["code"] = ToText(code_);
  error["reason"] = reason_;
  return error;
}

RequestError LimitExceeded(const std::string& limit, int64_t most, const std::string& unit) {
  return RequestError(ErrorCode::kLimitExceeded, limit + ": at most " + std::to_string(most) + " " + unit,
                      LimitDetails(limit, most));
}

RequestError ToRequestError() {
  using namespace vantrel::elastic;
  try {
    throw;
  } catch (const RequestError& error) {
    return error;
  } catch (const IndexLockedError& error) {
    return RequestError(ErrorCode::kLocked, error.what());
  } catch (const IndexExistsError& error) {
    return RequestError(ErrorCode::kIndexExists, error.what());
  } catch (const IndexValueError& error) {
    return RequestError(ErrorCode::kBadRequest, WithoutPath(error));
  } catch (const IndexIoError& error) {
    return RequestError(ErrorCode::kIoError, error.what());
  } catch (const IndexChangesLostError& error) {
    return RequestError(ErrorCode::kIoError, error.what());
  } catch (const IndexError& error) {
    return RequestError(ErrorCode::kCorrupt, error.what());
  } catch (const QuerySyntaxError& error) {
    return SyntaxRequestError(error);
  } catch (const LimitExceededError& error) {
    return RequestError(ErrorCode::kLimitExceeded, error.what(),
                        LimitDetails(error.limit(), static_cast<int64_t>(error.most())));
  } catch (const UnknownPluginError& error) {
    return RequestError(ErrorCode::kUnknownPlugin,
                        std::string(error.what()) + "; the command \"plugin_list\" lists those there are");
  } catch (const SearchTimeoutError& error) {
    return RequestError(ErrorCode::kTimeout, error.what());
  } catch (const SearchError& error) {
    return RequestError(ErrorCode::kBadRequest, error.what());
  } catch (const std::system_error& error) {
    return RequestError(ErrorCode::kIoError, error.what());
  } catch (const std::bad_alloc&) {
    return RequestError(ErrorCode::kInternal, "out of memory");
  } catch (const std::exception& error) {
    return RequestError(ErrorCode::kInternal, error.what());
  } catch (...) {
    return RequestError(ErrorCode::kInternal, "an unknown failure");
  }
}

RequestError ToRequestError(bool is_committed) {
  const RequestError error = ToRequestError();
  Json::Value details = error.details();
  details["committed"] = is_committed;
  return RequestError(error.code(), error.reason(), std::move(details));
}

}  // namespace quorelasticd

#pragma once

#include <gtest/gtest.h>

#include <boost/asio/thread_pool.hpp>
#include <functional>

#include "data_root/index_registry.h"
#include "errors/request_error.h"
#include "support/temporary_folder.h"
#include "vantrel/elastic/index_settings.h"

namespace quorelasticd {

// A data root with no index yet, and its registry.
class RegistryTest : public ::testing::Test {
 protected:
  static vantrel::elastic::IndexSettings Settings() {
    vantrel::elastic::IndexSettings settings;
    settings.fields = {{.name = "id", .type = vantrel::elastic::FieldType::kKeyword}};
    return settings;
  }

  static ErrorCode Failure(const std::function<void()>& action) {
    try {
      action();
    } catch (...) {
      return ToRequestError().code();
    }
    ADD_FAILURE() << "nothing failed";
    return ErrorCode::kInternal;
  }

  quorelastic::testing::TemporaryFolder folder_;
  DataRoot root_{folder_.path()};
  boost::asio::thread_pool threads_{2};
  static constexpr size_t kMostOpen = 4;
  IndexRegistry registry_{root_, threads_.get_executor(), kMostOpen};
};

}  // namespace quorelasticd

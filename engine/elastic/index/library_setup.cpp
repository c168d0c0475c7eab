#include "vantrel/elastic/library_setup.h"

#include <lucene++/LuceneHeaders.h>
#include <lucene++/SegmentInfos.h>

#include <boost/filesystem/path.hpp>
#include <cstdlib>
#include <locale>
#include <mutex>
#include <optional>
#include <string>

#include "elastic/index/path_codecvt.h"

namespace vantrel::elastic {
namespace {

// Holds an environment variable at a value for as long as it lives.
class EnvironmentOverride {
 public:
  EnvironmentOverride(const char* name, const char* value) : name_(name) {
    if (const char* before = std::getenv(name)) before_ = before;
    setenv(name, value, 1);
  }
  EnvironmentOverride(const EnvironmentOverride&) = delete;
  EnvironmentOverride& operator=(const EnvironmentOverride&) = delete;
  ~EnvironmentOverride() {
    if (before_.has_value()) {
      setenv(name_, before_->c_str(), 1);
    } else {
      unsetenv(name_);
    }
  }

 private:
  const char* name_;
  std::optional<std::string> before_;
};

void Prepare() {
  // Boost's path type looks up the user's locale before it takes another, and throws where that is invalid.
  const EnvironmentOverride plain_locale("LC_ALL", "C");
  boost::filesystem::path::imbue(std::locale(std::locale::classic(), new PathCodecvt));
  Lucene::SegmentInfos::setDefaultGenFileRetryPauseMsec(0);
}

}  // namespace

void PrepareIndexLibrary() {
  static std::once_flag once;
  std::call_once(once, Prepare);
}

}  // namespace vantrel::elastic

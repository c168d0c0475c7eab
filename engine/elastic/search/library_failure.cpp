#include "elastic/search/library_failure.h"

#include <new>

#include "vantrel/elastic/index_error.h"
#include "vantrel/elastic/search_error.h"

namespace vantrel::elastic {

void RunReading(const std::string& folder, const boost::shared_ptr<DiskDirectory>& directory,
                const char* purpose, const std::function<void()>& operation) {
  std::string reason;
  try {
    return operation();
  } catch (const IndexError&) {
    throw;
  } catch (const SearchError&) {
    throw;
  } catch (const std::bad_alloc&) {
    throw;
  } catch (const Lucene::LuceneException& error) {
    reason = Lucene::StringUtils::toUTF8(error.getError());
  } catch (const std::exception& error) {
    reason = error.what();
  }
  if (reason.empty()) reason = directory->last_read_problem();
  if (reason.empty()) reason = "the index library gives no reason";
  throw IndexError(folder, std::string(purpose) + ": " + reason);
}

}  // namespace vantrel::elastic

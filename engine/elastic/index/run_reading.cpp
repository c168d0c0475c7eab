#include "elastic/index/run_reading.h"

#include <new>
#include <string>

#include "vantrel/elastic/index_error.h"
#include "vantrel/elastic/search_error.h"

namespace vantrel::elastic {

void RunReading(const boost::shared_ptr<DiskDirectory>& directory, const char* purpose,
                const std::function<void()>& operation) {
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
  directory->ThrowFailure(purpose, reason);
}

}  // namespace vantrel::elastic

#pragma once

#include <map>
#include <memory>
#include <mutex>
#include <string>

#include "vantrel/elastic/export.h"

namespace vantrel::elastic {

class Index;

// The folder that holds the daemon's indexes, each in a folder of its own: fixed when this is built.
VANTREL_ELASTIC_EXPORT const std::string& IndexRoot();

// The indexes that a process has in its hands. For any number of threads.
class VANTREL_ELASTIC_EXPORT IndexContainer {
 public:
  // The one of the process.
  static std::shared_ptr<IndexContainer> Instance();

  // The index of a name: one with a slash is the path of an index's folder, any other is an index under
  // IndexRoot(). Never empty. The index is not looked for before it is used, and what is the matter with it told
  // only then; see Index::OpenLater. As long as somebody holds an index, it is the same for everybody.
  std::shared_ptr<Index> IndexGet(const std::string& name);

 private:
  std::mutex mutex_;
  std::map<std::string, std::weak_ptr<Index>> indexes_;  // by path
};

}  // namespace vantrel::elastic

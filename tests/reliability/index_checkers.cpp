#include "index_checkers.h"

#include <gmock/gmock.h>
#include <lucene++/LuceneHeaders.h>
#include <sys/wait.h>
#include <unistd.h>

// Not without the headers above.
#include <lucene++/CheckIndex.h>
#include <lucene++/InfoStream.h>

#include <algorithm>
#include <memory>
#include <stdexcept>

#include "support/files.h"
#include "support/temporary_folder.h"
#include "vantrel/elastic/class_init.h"
#include "vantrel/elastic/index.h"
#include "vantrel/elastic/index_info.h"
#include "vantrel/elastic/library_setup.h"

namespace quorelastic::testing {
namespace {

using Lucene::newLucene;
using Lucene::StringUtils;

enum CheckerStatus { kClean = 0, kDamaged = 1, kThrew = 2 };

CheckerStatus RunLibraryChecker(const std::string& path, const std::string& report) {
  try {
    vantrel::elastic::PrepareIndexLibrary();
    const auto checker =
        newLucene<Lucene::CheckIndex>(Lucene::FSDirectory::open(StringUtils::toUnicode(path)));
    checker->setInfoStream(newLucene<Lucene::InfoStreamFile>(StringUtils::toUnicode(report)));
    return checker->checkIndex()->clean ? kClean : kDamaged;
  } catch (...) {
    return kThrew;
  }
}

}  // namespace

std::string FindDamageByLibrary(const std::string& path) {
  const TemporaryFolder folder;
  const std::string report = folder / "report";
  const pid_t pid = fork();
  if (pid == -1) throw std::runtime_error("cannot fork");
  if (pid == 0) _exit(RunLibraryChecker(path, report));
  int status = 0;
  waitpid(pid, &status, 0);
  if (WIFEXITED(status) && WEXITSTATUS(status) == kClean) return "";
  const std::string verdict = WIFSIGNALED(status)               ? "the checker crashed"
                              : WEXITSTATUS(status) == kDamaged ? "the index is damaged"
                                                                : "the checker could not go on";
  return verdict + "\n" + ReadFile(report);
}

std::vector<std::string> WalkLiveIds(const std::string& path) {
  std::vector<std::string> ids;
  const auto info = vantrel::newClassInit<vantrel::elastic::IndexInfo>(path);
  for (int segment = 0; segment < info->GetSegmentNum(); ++segment) {
    const auto terms = info->GetTermDict(segment, true);
    while (terms->Next()) {
      const Lucene::TermPtr term = terms->Term();
      if (term->field() == L"id") ids.push_back(StringUtils::toUTF8(term->text()));
    }
  }
  std::sort(ids.begin(), ids.end());
  return ids;
}

void ExpectCleanIndex(const std::string& path) {
  EXPECT_EQ(FindDamageByLibrary(path), "");
  try {
    const std::vector<std::string> ids = WalkLiveIds(path);
    const auto twice = std::adjacent_find(ids.begin(), ids.end());
    EXPECT_TRUE(twice == ids.end()) << *twice << " is there twice";
    EXPECT_EQ(vantrel::elastic::Index::Open(path)->CountDocuments().live, ids.size());
  } catch (const std::exception& error) {
    ADD_FAILURE() << error.what();
  }
}

}  // namespace quorelastic::testing

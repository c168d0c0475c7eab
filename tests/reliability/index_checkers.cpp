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
#include <string>
#include <vector>

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

constexpr int kClean = 0;
constexpr int kDamaged = 1;

bool IsCleanByLibrary(const std::string& path, const std::string& report) {
  const auto checker = newLucene<Lucene::CheckIndex>(Lucene::FSDirectory::open(StringUtils::toUnicode(path)));
  checker->setInfoStream(newLucene<Lucene::InfoStreamFile>(StringUtils::toUnicode(report)));
  return checker->checkIndex()->clean;
}

// The ids of the documents that are not deleted, sorted; one that two segments hold comes twice.
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

// What the engine's reading finds wrong; "" where it finds nothing.
std::string FindDamageByEngine(const std::string& path) {
  const std::vector<std::string> ids = WalkLiveIds(path);
  const auto twice = std::adjacent_find(ids.begin(), ids.end());
  if (twice != ids.end()) return *twice + " is there twice";
  const auto live = vantrel::elastic::Index::Open(path)->CountDocuments().live;
  if (live == ids.size()) return "";
  return std::to_string(ids.size()) + " ids of " + std::to_string(live) + " documents";
}

// Leaves what there is to say in a file.
int RunCheckers(const std::string& path, const std::string& report) {
  try {
    vantrel::elastic::PrepareIndexLibrary();
    if (!IsCleanByLibrary(path, report)) return kDamaged;
    const std::string damage = FindDamageByEngine(path);
    if (damage.empty()) return kClean;
    WriteFile(report, damage);
  } catch (const Lucene::LuceneException& error) {
    WriteFile(report, StringUtils::toUTF8(error.getError()));
  } catch (const std::exception& error) {
    WriteFile(report, error.what());
  }
  return kDamaged;
}

}  // namespace

void ExpectCleanIndex(const std::string& path) {
  const TemporaryFolder folder;
  const std::string report = folder / "report";
  WriteFile(report, "");
  const pid_t pid = fork();
  ASSERT_NE(pid, -1);
  if (pid == 0) _exit(RunCheckers(path, report));
  int status = 0;
  waitpid(pid, &status, 0);
  EXPECT_FALSE(WIFSIGNALED(status)) << "a checker crashed over " << path;
  EXPECT_EQ(status, 0) << path << ":\n" << ReadFile(report);
}

}  // namespace quorelastic::testing

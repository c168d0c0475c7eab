// Search plugins that are loaded from a folder.

#include <gmock/gmock.h>
#include <gtest/gtest.h>
#include <sys/stat.h>
#include <unistd.h>

#include <filesystem>
#include <string>

#include "search_fixture.h"
#include "support/files.h"
#include "support/temporary_folder.h"
#include "vantrel/elastic/index.h"
#include "vantrel/elastic/search_error.h"
#include "vantrel/elastic/search_plugin.h"

namespace vantrel::elastic {
namespace {

using ::quorelastic::testing::Filter;
using ::quorelastic::testing::OwnIndex;
using ::quorelastic::testing::Request;
using ::quorelastic::testing::SortedIds;
using ::quorelastic::testing::TemporaryFolder;
using ::quorelastic::testing::Thrown;
using ::quorelastic::testing::WriteFile;
using ::testing::ElementsAre;
using ::testing::HasSubstr;
using ::testing::StartsWith;

class PluginFolderTest : public ::testing::Test {
 protected:
  PluginFolderTest() { chmod(folder_.path().c_str(), 0755); }

  void Put(const char* plugin, const std::string& name, mode_t mode = 0644) {
    std::filesystem::copy_file(plugin, folder_ / name);
    chmod((folder_ / name).c_str(), mode);
  }

  // What loading the folder says, which begins with the path of `name` in it.
  std::string Problem(const std::string& name) {
    const std::string what = Thrown<PluginLoadError>([&] { registry_.LoadFolder(folder_.path()); }).what();
    EXPECT_THAT(what, StartsWith((name.empty() ? folder_.path() : folder_ / name) + ": "));
    return what;
  }

  TemporaryFolder folder_;
  SearchPluginRegistry registry_;
};

TEST_F(PluginFolderTest, WithoutPluginsAddsNone) {
  WriteFile(folder_ / "README", "no plugin");
  WriteFile(folder_ / "plugin.so.bak", "no plugin either");
  EXPECT_EQ(registry_.LoadFolder(folder_.path()), 0U);
  EXPECT_EQ(registry_.List().size(), SearchPluginRegistry::BuiltIn().List().size());
}

TEST_F(PluginFolderTest, APluginInItFiltersLikeAnyOther) {
  Put(GOOD_PLUGIN, "longer.so");
  ASSERT_EQ(registry_.LoadFolder(folder_.path()), 1U);
  // The file may go: what is loaded stays.
  std::filesystem::remove(folder_ / "longer.so");
  OwnIndex index({{.name = "body"}});
  index.Add({"id=long", "body=one veryverylong word"});
  index.Add({"id=short", "body=one short word"});
  SearchRequest request = Request("word");
  request.filters = {Filter("longer_than", R"({"field":"body","length":5})")};
  EXPECT_THAT(SortedIds(index->Search(request, registry_)), ElementsAre("long"));
  request.filters = {Filter("longer_than", R"({"field":"body","length":4})")};
  EXPECT_THAT(SortedIds(index->Search(request, registry_)), ElementsAre("long", "short"));
  request.filters = {Filter("longer_than", R"({"field":7})")};
  EXPECT_EQ(Thrown<PluginDataError>([&] { index->Search(request, registry_); }).plugin(), "longer_than");
}

TEST_F(PluginFolderTest, TwoFilesAreTwoPluginsAlsoWhereTheyHaveOneName) {
  Put(GOOD_PLUGIN, "a.so");
  Put(GOOD_PLUGIN, "b.so");
  EXPECT_THAT(Thrown<PluginLoadError>([&] { registry_.LoadFolder(folder_.path()); }).what(),
              StartsWith("search plugin \"longer_than\": there is one"));
  EXPECT_NE(registry_.Find("longer_than"), nullptr);
}

TEST_F(PluginFolderTest, APluginOfAnotherVersionIsRefused) {
  Put(FUTURE_PLUGIN, "future.so");
  EXPECT_THAT(Problem("future.so"), HasSubstr("version 2"));
}

TEST_F(PluginFolderTest, WhatIsNoPluginIsRefused) {
  Put(NO_PLUGIN, "no.so");
  EXPECT_THAT(Problem("no.so"), HasSubstr("quorelastic_search_plugin"));
  std::filesystem::remove(folder_ / "no.so");
  WriteFile(folder_ / "text.so", "not even a shared object");
  EXPECT_THAT(Problem("text.so"), HasSubstr("cannot load it"));
  std::filesystem::remove(folder_ / "text.so");
  std::filesystem::create_directory(folder_ / "folder.so");
  EXPECT_THAT(Problem("folder.so"), HasSubstr("wrong kind"));
}

TEST_F(PluginFolderTest, AFileThatOthersCanWriteIsRefused) {
  for (const mode_t mode : {0664u, 0646u, 0666u}) {
    Put(GOOD_PLUGIN, "longer.so", mode);
    EXPECT_THAT(Problem("longer.so"), HasSubstr("can be written by others"));
    std::filesystem::remove(folder_ / "longer.so");
  }
}

TEST_F(PluginFolderTest, AFolderThatOthersCanWriteIsRefused) {
  Put(GOOD_PLUGIN, "longer.so");
  for (const mode_t mode : {0775u, 0757u, 01777u}) {
    chmod(folder_.path().c_str(), mode);
    EXPECT_THAT(Problem(""), HasSubstr("can be written by others"));
  }
}

TEST_F(PluginFolderTest, SymbolicLinksAreNotFollowed) {
  Put(GOOD_PLUGIN, "longer");
  std::filesystem::create_symlink(folder_ / "longer", folder_ / "longer.so");
  EXPECT_THAT(Problem("longer.so"), HasSubstr("cannot open the file"));
  const TemporaryFolder other;
  std::filesystem::create_directory_symlink(folder_.path(), other / "link");
  EXPECT_THROW(registry_.LoadFolder(other / "link"), PluginLoadError);
}

TEST_F(PluginFolderTest, AFileOrAFolderOfAnotherUserIsRefused) {
  if (geteuid() != 0) GTEST_SKIP() << "only root can give a file to another user";
  constexpr uid_t kNobody = 65534;
  Put(GOOD_PLUGIN, "longer.so");
  ASSERT_EQ(chown((folder_ / "longer.so").c_str(), kNobody, kNobody), 0);
  EXPECT_THAT(Problem("longer.so"), HasSubstr("belongs to neither root"));
  ASSERT_EQ(chown((folder_ / "longer.so").c_str(), 0, 0), 0);
  ASSERT_EQ(chown(folder_.path().c_str(), kNobody, kNobody), 0);
  EXPECT_THAT(Problem(""), HasSubstr("belongs to neither root"));
  ASSERT_EQ(chown(folder_.path().c_str(), 0, 0), 0);
  EXPECT_EQ(registry_.LoadFolder(folder_.path()), 1U);
}

TEST_F(PluginFolderTest, AFolderThatIsNotThereIsNamed) {
  EXPECT_THAT(Thrown<PluginLoadError>([&] { registry_.LoadFolder(folder_ / "none"); }).what(),
              StartsWith(folder_ / "none: cannot open the folder"));
}

}  // namespace
}  // namespace vantrel::elastic

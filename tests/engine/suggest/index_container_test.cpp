#include "vantrel/elastic/index_container.h"

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <filesystem>

#include "support/expect_damage.h"
#include "support/files.h"
#include "support/temporary_folder.h"
#include "vantrel/elastic/index.h"

namespace vantrel::elastic {
namespace {

using ::quorelastic::testing::ExpectIndexError;
using ::quorelastic::testing::ListFolder;
using ::quorelastic::testing::TemporaryFolder;
using ::testing::IsEmpty;

SearchRequest Query(const std::string& query) {
  SearchRequest request;
  request.query = query;
  return request;
}

TEST(IndexContainerTest, IsOneForTheProcess) {
  ASSERT_NE(IndexContainer::Instance(), nullptr);
  EXPECT_EQ(IndexContainer::Instance(), IndexContainer::Instance());
}

TEST(IndexContainerTest, ANameWithASlashIsAPathAndAnyOtherStandsUnderTheRoot) {
  const auto get = [](const std::string& name) { return IndexContainer::Instance()->IndexGet(name)->path(); };
  EXPECT_EQ(get("/some/where/"), "/some/where/");
  EXPECT_EQ(get("some/where"), "some/where");
  EXPECT_EQ(get("./where"), "./where");
  EXPECT_EQ(get("mail"), IndexRoot() + "/mail");
  EXPECT_EQ(get(""), IndexRoot() + "/");
}

TEST(IndexContainerTest, AnIndexIsTheSameAsLongAsSomebodyHoldsIt) {
  const auto container = IndexContainer::Instance();
  const auto held = container->IndexGet("a/b");
  EXPECT_EQ(container->IndexGet("a/b"), held);
  EXPECT_NE(container->IndexGet("a/c"), held);
  EXPECT_EQ(held.use_count(), 1) << "the container holds it too";
}

TEST(IndexContainerTest, WhatIsTheMatterWithAnIndexIsToldWhenItIsUsed) {
  const TemporaryFolder folder;
  const auto index = IndexContainer::Instance()->IndexGet(folder / "later");
  EXPECT_THAT(ListFolder(folder.path()), IsEmpty());
  ExpectIndexError(folder / "later: cannot open index folder", [&] { index->settings(); });
  ExpectIndexError(folder / "later: cannot open index folder", [&] { index->Add({}); });
  ExpectIndexError(folder / "later: cannot open index folder", [&] { index->Search(Query("a")); });
  EXPECT_THAT(ListFolder(folder.path()), IsEmpty()) << "something was created";

  Index::Create(folder / "later", {.fields = {{.name = "f"}}})->Commit();
  EXPECT_EQ(index->settings().fields.size(), 2U) << "f, and the id";
  index->Add({{{"f", "text"}}});
  index->Commit();
  EXPECT_EQ(index->Search(Query("text")).total, 1U);
}

}  // namespace
}  // namespace vantrel::elastic

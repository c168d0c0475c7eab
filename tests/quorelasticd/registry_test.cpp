#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <boost/asio/post.hpp>
#include <cerrno>
#include <chrono>
#include <filesystem>
#include <future>
#include <map>
#include <memory>
#include <string>
#include <thread>
#include <vector>

#include "registry_fixture.h"
#include "support/files.h"
#include "vantrel/elastic/index_error.h"

namespace quorelasticd {
namespace {

namespace fs = std::filesystem;
using quorelastic::testing::ListFolder;
using ::testing::ElementsAre;
using vantrel::elastic::Index;
using vantrel::elastic::IndexIoError;
using vantrel::elastic::IndexSettings;

std::string Name(int number) { return std::string("x").append(std::to_string(number)); }

TEST_F(RegistryTest, AnIndexIsOpenedOnce) {
  registry_.Create("x", Settings());
  EXPECT_EQ(registry_.open_count(), 0u);
  const auto first = registry_.Use("x");
  EXPECT_EQ(registry_.Use("x"), first);
  EXPECT_EQ(registry_.open_count(), 1u);
  EXPECT_EQ(first->index().path(), root_.IndexPath("x"));
}

TEST_F(RegistryTest, WhatNobodyUsesIsClosedTheLongestUnusedFirst) {
  const std::vector<std::string> names = {"a", "b", "c", "d", "e", "f"};
  for (const std::string& name : names) registry_.Create(name, Settings());
  std::map<std::string, std::weak_ptr<OpenIndex>> opened;
  for (const char* name : {"a", "b", "c", "d"}) opened[name] = registry_.Use(name);
  registry_.Use("a");
  registry_.Use("e");
  EXPECT_TRUE(opened["b"].expired());
  EXPECT_FALSE(opened["a"].expired());
  registry_.Use("f");
  EXPECT_TRUE(opened["c"].expired());
  EXPECT_FALSE(opened["a"].expired());
  EXPECT_EQ(registry_.open_count(), kMostOpen);
  EXPECT_EQ(registry_.Use("b")->name(), "b");
  EXPECT_EQ(registry_.open_count(), kMostOpen);
}

TEST_F(RegistryTest, WhatIsUsedStaysOpenBeyondTheLimit) {
  std::vector<std::shared_ptr<OpenIndex>> used;
  for (int i = 0; i < 10; ++i) {
    registry_.Create(Name(i), Settings());
    used.push_back(registry_.Use(Name(i)));
  }
  EXPECT_EQ(registry_.open_count(), 10U);
  EXPECT_EQ(registry_.Use("x0"), used[0]);
  used.clear();
  registry_.Create("y", Settings());
  registry_.Use("y");
  EXPECT_EQ(registry_.open_count(), kMostOpen);
}

TEST_F(RegistryTest, ChangesThatAreNotCommittedAreBeforeTheirIndexIsClosed) {
  constexpr int kIndexes = 20;
  for (int i = 0; i < kIndexes; ++i) {
    registry_.Create(Name(i), Settings());
    const auto open = registry_.Use(Name(i));
    // Where an index is committed in its writing turn, it has to wait.
    boost::asio::post(open->writing_turn(), std::packaged_task<void()>([open] {
                        Changes changes(open);
                        changes.Apply([](Index& index) { index.Update({{{"id", "1"}}}); });
                        changes.Promise();
                      }));
  }
  const auto give_up = std::chrono::steady_clock::now() + std::chrono::seconds(20);
  while (registry_.open_count() > kMostOpen && std::chrono::steady_clock::now() < give_up) {
    for (int i = 0; i < kIndexes; ++i) registry_.Use(Name(i));
    std::this_thread::sleep_for(std::chrono::milliseconds(5));
  }
  EXPECT_EQ(registry_.open_count(), kMostOpen);
  threads_.join();
  registry_.CommitAll();
  for (int i = 0; i < kIndexes; ++i) {
    EXPECT_EQ(Index::Open(root_.IndexPath(Name(i)))->CountDocuments().live, 1U) << Name(i);
  }
}

TEST_F(RegistryTest, ALossThatNobodyWasToldOfIsNotForgotten) {
  for (const char* name : {"x", "a", "b", "c", "d", "e"}) registry_.Create(name, Settings());
  {
    const auto open = registry_.Use("x");
    Changes changes(open);
    changes.Apply([](Index& index) { index.Update({{{"id", "1"}}}); });
    changes.Promise();
    EXPECT_EQ(
        Failure([&] { changes.Apply([](Index&) { throw IndexIoError("x", "the disk is gone", EIO); }); }),
        ErrorCode::kIoError);
  }
  for (const char* name : {"a", "b", "c", "d", "e"}) registry_.Use(name);
  EXPECT_EQ(Failure([&] { Changes(registry_.Use("x")).ReportBrokenPromise(); }), ErrorCode::kIoError);
}

TEST_F(RegistryTest, WhatIsNotThereIsNotFound) {
  fs::create_directories(folder_ / "import/inner");
  for (const char* name : {"x", "", "..", "import", "import/inner", ".new-x", "X"}) {
    EXPECT_EQ(Failure([&] { registry_.Use(name); }), ErrorCode::kIndexNotFound) << name;
    EXPECT_EQ(Failure([&] { registry_.Delete(name); }), ErrorCode::kIndexNotFound) << name;
  }
}

TEST_F(RegistryTest, ANameIsTakenOnce) {
  registry_.Create("x", Settings());
  EXPECT_EQ(Failure([&] { registry_.Create("x", Settings()); }), ErrorCode::kIndexExists);
}

TEST_F(RegistryTest, AFailedCreationLeavesNothing) {
  EXPECT_EQ(Failure([&] { registry_.Create("x", IndexSettings{}); }), ErrorCode::kBadRequest);
  EXPECT_FALSE(root_.HasIndex("x"));
  registry_.Create("x", Settings());
}

TEST_F(RegistryTest, DeletionWaitsForNobodyButRefuses) {
  registry_.Create("x", Settings());
  auto use = registry_.Use("x");
  EXPECT_EQ(Failure([&] { registry_.Delete("x"); }), ErrorCode::kLocked);
  use.reset();
  registry_.Delete("x");
  EXPECT_THAT(ListFolder(folder_.path()), ElementsAre("daemon.lock", "import"));
  EXPECT_EQ(Failure([&] { registry_.Use("x"); }), ErrorCode::kIndexNotFound);
  registry_.Create("x", Settings());
}

TEST_F(RegistryTest, WhatAnotherProcessWritesToIsNotDeleted) {
  registry_.Create("x", Settings());
  auto writer = Index::Open(root_.IndexPath("x"));
  writer->Delete("id", "nothing");
  EXPECT_EQ(Failure([&] { registry_.Delete("x"); }), ErrorCode::kLocked);
  EXPECT_TRUE(root_.HasIndex("x"));
  writer.reset();
  registry_.Delete("x");
}

TEST_F(RegistryTest, WhatIsClosedForARepairIsLockedUntilItsEnd) {
  registry_.Create("x", Settings());
  registry_.Create("y", Settings());
  auto repair = registry_.Close("x");
  EXPECT_EQ(Failure([&] { registry_.Use("x"); }), ErrorCode::kLocked);
  EXPECT_EQ(Failure([&] { registry_.Delete("x"); }), ErrorCode::kLocked);
  EXPECT_EQ(Failure([&] { registry_.Close("x"); }), ErrorCode::kLocked);
  EXPECT_EQ(Failure([&] { registry_.Create("x", Settings()); }), ErrorCode::kIndexExists);
  EXPECT_EQ(registry_.Use("y")->name(), "y");
  repair.reset();
  EXPECT_EQ(registry_.Use("x")->name(), "x");
  EXPECT_NE(registry_.Close("x"), nullptr);
  registry_.Delete("x");
}

TEST_F(RegistryTest, ALookClosesNothingAndKeepsNothingOpen) {
  for (const char* name : {"a", "b", "c", "d", "e"}) registry_.Create(name, Settings());
  std::vector<std::weak_ptr<OpenIndex>> opened;
  for (const char* name : {"a", "b", "c", "d"}) opened.push_back(registry_.Use(name));
  EXPECT_EQ(registry_.Look("e")->path(), root_.IndexPath("e"));
  EXPECT_EQ(registry_.open_count(), kMostOpen);
  for (const auto& index : opened) EXPECT_FALSE(index.expired());
  auto look = registry_.Look("a");
  EXPECT_EQ(look.get(), &registry_.Use("a")->index());
  EXPECT_EQ(Failure([&] { registry_.Delete("a"); }), ErrorCode::kLocked);
  look.reset();
  registry_.Delete("a");
  EXPECT_EQ(Failure([&] { registry_.Look("a"); }), ErrorCode::kIndexNotFound);
  const auto repair = registry_.Close("e");
  EXPECT_EQ(Failure([&] { registry_.Look("e"); }), ErrorCode::kLocked);
}

TEST_F(RegistryTest, WhatIsUsedIsNotClosedForARepair) {
  registry_.Create("x", Settings());
  auto use = registry_.Use("x");
  EXPECT_EQ(Failure([&] { registry_.Close("x"); }), ErrorCode::kLocked);
  EXPECT_EQ(registry_.Use("x"), use);
  use.reset();
  EXPECT_NE(registry_.Close("x"), nullptr);
}

TEST_F(RegistryTest, ManyThreadsMakeUseAndDeleteAtOnce) {
  std::vector<std::thread> threads;
  threads.reserve(4);
  for (int i = 0; i < 4; ++i) {
    threads.emplace_back([&] {
      for (int round = 0; round < 20; ++round) {
        for (const auto& action : std::vector<std::function<void()>>{
                 [&] { registry_.Create("x", Settings()); },
                 [&] { registry_.Use("x")->index().CountDocuments(); }, [&] { registry_.Delete("x"); }}) {
          try {
            action();
          } catch (const RequestError& error) {
            EXPECT_THAT(error.code(), ::testing::AnyOf(ErrorCode::kIndexExists, ErrorCode::kIndexNotFound,
                                                       ErrorCode::kLocked));
          }
        }
      }
    });
  }
  for (std::thread& thread : threads) thread.join();
}

TEST_F(RegistryTest, EveryOpenIndexIsCommittedAtTheEnd) {
  for (const char* name : {"x", "y"}) {
    registry_.Create(name, Settings());
    Changes changes(registry_.Use(name));
    changes.Apply([](Index& index) { index.Add({{{"id", "1"}}}); });
    changes.Promise();
    EXPECT_EQ(registry_.Use(name)->index().CountDocuments().live, 0u);
  }
  EXPECT_TRUE(registry_.CommitAll());
  for (const char* name : {"x", "y"}) EXPECT_EQ(registry_.Use(name)->index().CountDocuments().live, 1u);
}

}  // namespace
}  // namespace quorelasticd

// The tables that are built before main, whether an action reads them or not.

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <iterator>
#include <memory>

#include "memory/mem_info_keys.h"
#include "suggest/pre_proc_factories.h"
#include "vantrel/elastic/ngram_pre_proc.h"
#include "vantrel/elastic/to_lower_pre_proc.h"

namespace {

using ::testing::ElementsAre;
using vantrel::elastic::FieldPreProc;
using vantrel::elastic::FieldToken;
using vantrel::elastic::NgramPreProc;
using vantrel::elastic::ToLowerPreProc;

TEST(MemInfoKeysTest, AreTheFiveInTheirOrder) {
  EXPECT_THAT(MemInfoKeys, ElementsAre("MemTotal", "MemFree", "Cached", "SwapTotal", "SwapFree"));
}

TEST(PreProcFactoryMapTest, HasTheTwoFactories) {
  ASSERT_EQ(PreProcFactoryMap.size(), 2U);
  const auto lower = PreProcFactoryMap.at("tolower")(nullptr, "");
  EXPECT_NE(std::dynamic_pointer_cast<ToLowerPreProc>(lower), nullptr);
  const auto grams = PreProcFactoryMap.at("ngram")(nullptr, "2");
  EXPECT_NE(std::dynamic_pointer_cast<NgramPreProc>(grams), nullptr);
}

TEST(PreProcFactoryMapTest, EachWrapsTheOneBefore) {
  std::shared_ptr<FieldPreProc> chain = PreProcFactoryMap.at("tolower")(nullptr, "");
  const std::weak_ptr<FieldPreProc> first = chain;
  chain = PreProcFactoryMap.at("ngram")(chain, "2");
  EXPECT_FALSE(first.expired());
  const auto tokens = chain->Process("AB");
  FieldToken token;
  ASSERT_TRUE(tokens->Next(token));
  EXPECT_EQ(token.text, "ab");
  chain.reset();
  EXPECT_TRUE(first.expired());
}

}  // namespace

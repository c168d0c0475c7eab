// Programs that were built earlier make these objects themselves: where their members and virtual operations are is
// fixed.

#include "support/class_layout.h"

#include <gtest/gtest.h>

#include "vantrel/elastic/index.h"
#include "vantrel/elastic/index_container.h"
#include "vantrel/elastic/ngram_pre_proc.h"
#include "vantrel/elastic/prefix_term_suggester.h"
#include "vantrel/elastic/term_suggester.h"
#include "vantrel/elastic/to_lower_pre_proc.h"

namespace vantrel::elastic {
namespace {

using ::quorelastic::testing::DestroyThroughSlot;
using ::quorelastic::testing::HasOnlyItsDestructor;
using ::quorelastic::testing::MemberAt;
using ::quorelastic::testing::SlotOf;

using Indexes = std::vector<std::shared_ptr<Index>>;
using BackEnds = std::vector<std::shared_ptr<TermSuggesterImpl>>;

Indexes TwoIndexes() {
  return {IndexContainer::Instance()->IndexGet("/one/"), IndexContainer::Instance()->IndexGet("/two/")};
}

TEST(ClassLayoutTest, ATermSuggesterIsItsBackEnds) {
  const auto back_end = std::make_shared<PrefixTermSuggester>(Indexes(), 10);
  TermSuggester suggester;
  EXPECT_TRUE(MemberAt<BackEnds>(suggester, 8).empty());
  suggester.AddBackEnd(back_end);
  EXPECT_EQ(MemberAt<BackEnds>(suggester, 8), BackEnds{back_end});
  EXPECT_EQ(sizeof suggester, 8 + sizeof(BackEnds));
  EXPECT_TRUE(HasOnlyItsDestructor<TermSuggester>());
}

TEST(ClassLayoutTest, ADestroyedTermSuggesterHasLetItsBackEndsGo) {
  const auto back_end = std::make_shared<PrefixTermSuggester>(Indexes(), 10);
  auto* const on_heap = new TermSuggester;
  on_heap->AddBackEnd(back_end);
  EXPECT_EQ(back_end.use_count(), 2);
  DestroyThroughSlot(on_heap, 1);
  EXPECT_EQ(back_end.use_count(), 1);

  alignas(TermSuggester) char memory[sizeof(TermSuggester)];
  auto* const in_place = new (memory) TermSuggester;
  in_place->AddBackEnd(back_end);
  EXPECT_EQ(back_end.use_count(), 2);
  DestroyThroughSlot(in_place, 0);
  EXPECT_EQ(back_end.use_count(), 1);
}

TEST(ClassLayoutTest, APrefixTermSuggesterIsANumberAndItsIndexes) {
  const Indexes indexes = TwoIndexes();
  const PrefixTermSuggester suggester(indexes, -1234567);
  EXPECT_EQ(MemberAt<int32_t>(suggester, 8), -1234567);
  EXPECT_EQ(MemberAt<Indexes>(suggester, 16), indexes);
  EXPECT_EQ(indexes.front().use_count(), 2);
  EXPECT_EQ(sizeof suggester, 16 + sizeof(Indexes));
}

TEST(ClassLayoutTest, APrefixTermSuggestersOperationComesBehindItsDestructor) {
  struct Derived : PrefixTermSuggester {
    using PrefixTermSuggester::PrefixTermSuggester;
    virtual void Added() {}
  };
  EXPECT_EQ(SlotOf(&TermSuggesterImpl::Suggest), 2U);
  EXPECT_EQ(SlotOf(&PrefixTermSuggester::Suggest), 2U);
  EXPECT_EQ(SlotOf(&Derived::Added), 3U);
  const Indexes indexes = TwoIndexes();
  TermSuggesterImpl* const base = new PrefixTermSuggester(indexes, 10);
  EXPECT_EQ(indexes.front().use_count(), 2);
  DestroyThroughSlot(base, 1);
  EXPECT_EQ(indexes.front().use_count(), 1);
}

TEST(ClassLayoutTest, ASuggestionIsATypeAndAPayload) {
  JsonValue payload;
  payload["term"] = "tea";
  const Suggestion suggestion("prefix", payload);
  EXPECT_EQ(MemberAt<std::string>(suggestion, 8), "prefix");
  EXPECT_EQ(MemberAt<JsonValue>(suggestion, 8 + sizeof(std::string)), payload);
  EXPECT_EQ(sizeof suggestion, 8 + sizeof(std::string) + sizeof(Json::Value));
  EXPECT_TRUE(HasOnlyItsDestructor<Suggestion>());
}

TEST(ClassLayoutTest, APreProcessorIsWhatItWrapsAndItsArgument) {
  const auto first = std::make_shared<ToLowerPreProc>(nullptr, "");
  const NgramPreProc grams(first, "2,3");
  EXPECT_EQ(MemberAt<std::shared_ptr<FieldPreProc>>(grams, 8), first);
  EXPECT_EQ(MemberAt<std::string>(grams, 24), "2,3");
  EXPECT_EQ(sizeof grams, 24 + sizeof(std::string));
  const ToLowerPreProc lower(first, "");
  EXPECT_EQ(MemberAt<std::shared_ptr<FieldPreProc>>(lower, 8), first);
  EXPECT_EQ(MemberAt<std::string>(lower, 24), "");
  EXPECT_EQ(sizeof lower, 24 + sizeof(std::string));
  EXPECT_EQ(first.use_count(), 3);
}

TEST(ClassLayoutTest, APreProcessorsOperationComesBehindItsDestructor) {
  struct Derived : ToLowerPreProc {
    using ToLowerPreProc::ToLowerPreProc;
    virtual void Added() {}
  };
  EXPECT_EQ(SlotOf(&FieldPreProc::Process), 2U);
  EXPECT_EQ(SlotOf(&NgramPreProc::Process), 2U);
  EXPECT_EQ(SlotOf(&ToLowerPreProc::Process), 2U);
  EXPECT_EQ(SlotOf(&Derived::Added), 3U);
  const auto wrapped = std::make_shared<ToLowerPreProc>(nullptr, "");
  FieldPreProc* const grams = new NgramPreProc(wrapped, "2");
  FieldPreProc* const lower = new ToLowerPreProc(wrapped, "");
  EXPECT_EQ(wrapped.use_count(), 3);
  DestroyThroughSlot(grams, 1);
  DestroyThroughSlot(lower, 1);
  EXPECT_EQ(wrapped.use_count(), 1);
}

}  // namespace
}  // namespace vantrel::elastic

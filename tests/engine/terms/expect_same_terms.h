#pragma once

#include <gtest/gtest.h>
#include <lucene++/LuceneHeaders.h>

#include <string>
#include <vector>

#include "support/library_terms.h"
#include "vantrel/elastic/class_init.h"
#include "vantrel/elastic/index_info.h"

namespace quorelastic::testing {

// A dictionary that has not been walked yet must yield these terms, in this order, and count them right, before
// and after the walk.
inline void ExpectSameTerms(vantrel::elastic::TermDict& dictionary,
                            const std::vector<LibraryTerm>& expected) {
  EXPECT_EQ(dictionary.GetTermsCount(), static_cast<int>(expected.size()));
  EXPECT_FALSE(dictionary.Term());
  for (const LibraryTerm& term : expected) {
    ASSERT_TRUE(dictionary.Next());
    const Lucene::TermPtr found = dictionary.Term();
    ASSERT_TRUE(found);
    ASSERT_EQ(found->field(), term.field);
    ASSERT_EQ(found->text(), term.text);
  }
  EXPECT_FALSE(dictionary.Next());
  EXPECT_FALSE(dictionary.Term());
  EXPECT_FALSE(dictionary.Next());
  EXPECT_EQ(dictionary.GetTermsCount(), static_cast<int>(expected.size()));
}

inline void ExpectSameTerms(const vantrel::elastic::IndexInfo& info,
                            const std::vector<LibrarySegment>& expected) {
  ASSERT_EQ(info.GetSegmentNum(), static_cast<int>(expected.size()));
  for (int segment = 0; segment < info.GetSegmentNum(); ++segment) {
    const LibrarySegment& wanted = expected[static_cast<size_t>(segment)];
    const auto all = info.GetTermDict(segment, false);
    EXPECT_EQ(all->GetName(), wanted.name);
    ExpectSameTerms(*all, wanted.all);
    ExpectSameTerms(*info.GetTermDict(segment, true), wanted.live);
  }
}

inline void ExpectSameTerms(const std::string& index_path, const std::vector<LibrarySegment>& expected) {
  ExpectSameTerms(*vantrel::newClassInit<vantrel::elastic::IndexInfo>(index_path), expected);
}

}  // namespace quorelastic::testing

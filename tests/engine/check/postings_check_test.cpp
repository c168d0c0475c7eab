#include "elastic/check/postings_check.h"

#include <gtest/gtest.h>

#include <string>
#include <vector>

#include "elastic/check/mismatch.h"
#include "support/byte_writer.h"
#include "support/memory_folder.h"

namespace vantrel::elastic::check {
namespace {

using ::quorelastic::testing::ByteWriter;
using ::quorelastic::testing::SourceOf;

constexpr int kInterval = 16;
constexpr int kLevels = 4;

// Terms of one field with one position in each document, and their skip data.
class TermFiles {
 public:
  // Documents so far apart that each posting takes three bytes, where that is true; otherwise one.
  void Add(int documents, bool are_far_apart) {
    const uint64_t postings = postings_.size();
    const uint64_t positions = positions_.size();
    const int distance = are_far_apart ? 1 << 13 : 1;
    std::vector<Level> levels(kLevels);
    for (int number = 1; number <= documents; ++number) {
      const int before = distance * (number - 1);
      if (number % kInterval == 0) {
        AddEntries(levels, number, {before, postings_.size() - postings, positions_.size() - positions});
      }
      postings_.VInt(2 * distance + 1);
      positions_.VInt(7);
    }
    const uint64_t skips = postings_.size() - postings;
    skip_data_.push_back(postings_.size());
    for (size_t level = kLevels; level-- > 0;) {
      if (levels[level].bytes.size() == 0) continue;
      if (level > 0) postings_.VLong(levels[level].bytes.size());
      postings_.Raw(levels[level].bytes.bytes());
    }
    terms_.VInt(0).VInt(1).Byte('a' + count_).VInt(0).VInt(documents);
    terms_.VLong(postings - postings_before_).VLong(positions - positions_before_);
    if (documents >= kInterval) terms_.VInt(static_cast<int64_t>(skips));
    postings_before_ = postings;
    positions_before_ = positions;
    ++count_;
  }

  std::string dictionary() const {
    return ByteWriter().Int(-4).Long(count_).Int(128).Int(kInterval).Int(kLevels).Raw(terms_.bytes()).bytes();
  }
  std::string postings() const { return postings_.bytes(); }
  std::string positions() const { return positions_.bytes(); }
  uint64_t skip_data(size_t term) const { return skip_data_[term]; }

 private:
  struct Place {
    int64_t document = 0;
    uint64_t postings = 0;
    uint64_t positions = 0;
  };
  struct Level {
    ByteWriter bytes;
    Place last;
  };

  static void AddEntries(std::vector<Level>& levels, int number, const Place& place) {
    uint64_t child = 0;
    for (size_t level = 0; level < levels.size() && number % kInterval == 0; ++level, number /= kInterval) {
      auto& [bytes, last] = levels[level];
      // The last distance is that of the entry itself, without this one.
      bytes.VInt(place.document - last.document);
      bytes.VInt(static_cast<int64_t>(place.postings - last.postings));
      bytes.VInt(static_cast<int64_t>(place.positions - last.positions));
      const uint64_t end = bytes.size();
      if (level > 0) bytes.VLong(child);
      child = end;
      last = place;
    }
  }

  ByteWriter terms_;
  ByteWriter postings_;
  ByteWriter positions_;
  uint64_t postings_before_ = 0;
  uint64_t positions_before_ = 0;
  int count_ = 0;
  std::vector<uint64_t> skip_data_;
};

constexpr int32_t kDocuments = 1 << 30;

// Checks all terms, the ones behind a damaged one too. Returns what is said of each, where it is not empty.
std::vector<std::string> CheckAll(const TermFiles& files, const std::string& postings) {
  format::TermCursor cursor(SourceOf(files.dictionary()), format::TermCursor::File::kDictionary, 1,
                            kDocuments);
  PostingsCheck check(SourceOf(postings), SourceOf(files.positions()), kDocuments, cursor);
  format::FieldInfo field;
  field.indexed = true;
  std::vector<std::string> problems;
  while (cursor.Next()) {
    std::string problem;
    try {
      check.Check(cursor, field);
    } catch (const Mismatch& mismatch) {
      problem = mismatch.finding().expected + ", found " + mismatch.finding().found;
    } catch (const IndexDamagedError& error) {
      problem = error.what();
    }
    problems.push_back(problem);
  }
  return problems;
}

// Terms that fit the buffer of the postings, at each place in it, before and behind one that does not.
TEST(PostingsCheckTest, AcceptsSkipDataWhereverTheBufferEnds) {
  for (const int first : {100, 5000, 60'000, 120'000, 121'000, 122'500, 123'000, 125'000, 130'000, 132'000}) {
    SCOPED_TRACE(first);
    TermFiles files;
    files.Add(first, false);
    files.Add(300, false);
    files.Add(50'000, true);
    files.Add(5000, true);
    files.Add(300, false);
    files.Add(3, false);
    files.Add(20'000, true);
    EXPECT_EQ(CheckAll(files, files.postings()), std::vector<std::string>(7));
  }
}

TEST(PostingsCheckTest, FindsWrongSkipDataOfEachTerm) {
  TermFiles files;
  files.Add(300, false);
  files.Add(50'000, true);
  files.Add(5000, true);
  files.Add(300, false);
  for (size_t term = 0; term < 4; ++term) {
    SCOPED_TRACE(term);
    // The length of the highest level, and a number of an entry.
    for (const size_t place : {size_t{0}, size_t{2}}) {
      std::string postings = files.postings();
      postings[files.skip_data(term) + place] =
          static_cast<char>(postings[files.skip_data(term) + place] ^ 1);
      const std::vector<std::string> problems = CheckAll(files, postings);
      ASSERT_EQ(problems.size(), 4U);
      for (size_t i = 0; i < 4; ++i) EXPECT_EQ(problems[i] == "", i != term) << i << ": " << problems[i];
    }
    std::string longer = files.postings();
    longer[files.skip_data(term)] = '\x7f';
    const std::vector<std::string> problems = CheckAll(files, longer);
    for (size_t i = 0; i < 4; ++i) EXPECT_EQ(problems[i] == "", i != term) << i << ": " << problems[i];
  }
}

}  // namespace
}  // namespace vantrel::elastic::check

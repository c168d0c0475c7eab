#include <gtest/gtest.h>

#include <limits>

#include "elastic/format/commit/commit.h"
#include "elastic/format/segment/field_infos.h"
#include "elastic/format/segment/term_cursor.h"
#include "elastic/segment/segment_files.h"
#include "support/random_index.h"
#include "support/temporary_folder.h"

namespace vantrel::elastic::format {
namespace {

using ::quorelastic::testing::TemporaryFolder;
using ::quorelastic::testing::WriteRandomIndex;

std::vector<SegmentFiles> OpenAll(const std::string& path) {
  std::vector<SegmentFiles> segments;
  const DiskFolder folder(path);
  UseNewestCommit(folder, [&](const Commit& commit) {
    for (const SegmentInfo& info : commit.segments) segments.push_back(OpenSegment(folder, info));
  });
  return segments;
}

TermCursor Open(const SegmentFiles& files, const std::shared_ptr<const ByteSource>& source,
                TermCursor::File file) {
  const auto fields = static_cast<uint32_t>(ReadFieldInfos(files.field_infos).size());
  return TermCursor(source, file, fields, files.info.document_count);
}

// The index begins with an entry before all terms; then it repeats the terms number interval - 1,
// 2 * interval - 1 and so on, each with the place in the dictionary where the term after it begins.
void ExpectIndexRepeatsDictionary(const SegmentFiles& files) {
  TermCursor dictionary = Open(files, files.terms, TermCursor::File::kDictionary);
  TermCursor index = Open(files, files.terms_index, TermCursor::File::kIndex);
  ASSERT_TRUE(index.Next());
  EXPECT_EQ(index.text(), "");
  EXPECT_EQ(index.field(), -1);
  EXPECT_EQ(index.index_interval(), dictionary.index_interval());
  const auto interval = static_cast<uint64_t>(dictionary.index_interval());
  EXPECT_EQ(index.count(), 1 + (dictionary.count() == 0 ? 0 : (dictionary.count() - 1) / interval));
  uint64_t pointer = index.dictionary_pointer();
  for (uint64_t number = 0; dictionary.Next(); ++number) {
    if (number % interval == 0) {
      EXPECT_EQ(dictionary.offset(), pointer);
    }
    if (number % interval != interval - 1 || number + 1 == dictionary.count()) continue;
    ASSERT_TRUE(index.Next());
    EXPECT_EQ(index.text(), dictionary.text());
    EXPECT_EQ(index.field(), dictionary.field());
    EXPECT_EQ(index.info().document_frequency, dictionary.info().document_frequency);
    EXPECT_EQ(index.info().postings_pointer, dictionary.info().postings_pointer);
    EXPECT_EQ(index.info().positions_pointer, dictionary.info().positions_pointer);
    EXPECT_EQ(index.info().skip_offset, dictionary.info().skip_offset);
    pointer = index.dictionary_pointer();
  }
  EXPECT_FALSE(index.Next());
}

TEST(TermsIndexTest, RepeatsEveryNthTermOfTheDictionary) {
  for (const int interval : {1, 2, 7, 128}) {
    for (const bool compound : {false, true}) {
      SCOPED_TRACE("interval " + std::to_string(interval) + (compound ? ", compound" : ", plain"));
      const TemporaryFolder folder;
      WriteRandomIndex(folder.path(), {.seed = static_cast<uint32_t>(interval),
                                       .documents = 200,
                                       .documents_per_segment = 80,
                                       .compound = compound,
                                       .term_index_interval = interval});
      const std::vector<SegmentFiles> segments = OpenAll(folder.path());
      ASSERT_EQ(segments.size(), 3U);
      for (const SegmentFiles& files : segments) ExpectIndexRepeatsDictionary(files);
    }
  }
}

}  // namespace
}  // namespace vantrel::elastic::format

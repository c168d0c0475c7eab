#include "elastic/format/io/watched_folder.h"

#include <gmock/gmock.h>
#include <gtest/gtest.h>
#include <zlib.h>

#include <span>
#include <stdexcept>
#include <string>
#include <vector>

#include "elastic/format/io/byte_reader.h"
#include "elastic/format/segment/stored_fields.h"
#include "support/byte_writer.h"
#include "support/memory_folder.h"

namespace vantrel::elastic::format {
namespace {

using ::quorelastic::testing::ByteWriter;
using ::quorelastic::testing::ContentOf;
using ::quorelastic::testing::MemoryFolder;
using ::testing::Each;
using ::testing::ElementsAre;
using ::testing::Ge;
using ::testing::IsEmpty;
using ::testing::Le;
using ::testing::SizeIs;

class Recorder : public ReadWatcher {
 public:
  void NoteOpened(const ByteSource& file) override { opened.push_back(file.name()); }
  void NoteRead(uint64_t bytes) override {
    reads.push_back(bytes);
    if (reads.size() == most_reads) throw std::length_error("enough");
  }

  std::vector<std::string> opened;
  std::vector<uint64_t> reads;
  size_t most_reads = SIZE_MAX;
};

class WatchedFolderTest : public ::testing::Test {
 protected:
  WatchedFolderTest() { memory_.files["a"] = {.bytes = "text", .zeros_after = kSize - 4}; }

  static constexpr uint64_t kSize = 3 * WatchedFolder::kLongestRead + 1;

  MemoryFolder memory_;
  Recorder recorder_;
  const WatchedFolder folder_{memory_, recorder_};
};

TEST_F(WatchedFolderTest, ReportsWhatIsOpenedAndWhatIsRead) {
  const auto file = folder_.Open("a");
  EXPECT_THAT(recorder_.opened, ElementsAre("memory/a"));
  EXPECT_THAT(recorder_.reads, IsEmpty());
  std::vector<uint8_t> bytes(3);
  file->ReadAt(1, bytes);
  EXPECT_THAT(bytes, ElementsAre('e', 'x', 't'));
  EXPECT_THAT(recorder_.reads, ElementsAre(3));
}

TEST_F(WatchedFolderTest, SplitsLongReads) {
  const auto file = folder_.Open("a");
  EXPECT_EQ(ContentOf(*file), "text" + std::string(kSize - 4, '\0'));
  EXPECT_THAT(recorder_.reads, SizeIs(4));
  EXPECT_THAT(recorder_.reads, Each(Le(WatchedFolder::kLongestRead)));
}

TEST_F(WatchedFolderTest, CancelsAReadWithinItself) {
  recorder_.most_reads = 2;
  EXPECT_THROW(ContentOf(*folder_.Open("a")), std::length_error);
  EXPECT_THAT(recorder_.reads, SizeIs(2));
}

TEST_F(WatchedFolderTest, IsAskedEachTimeThatABufferIsFilled) {
  constexpr size_t kBuffer = size_t{4} << 10;
  ByteReader reader(folder_.Open("a"), kBuffer);
  for (uint64_t left = kSize; left > 0; --left) reader.ReadByte();
  EXPECT_THAT(recorder_.reads, SizeIs((kSize + kBuffer - 1) / kBuffer));
}

TEST_F(WatchedFolderTest, IsAskedWhileFewBytesInflateToMany) {
  constexpr uLong kInflated = uLong{1} << 20;
  const std::string zeros(kInflated, '\0');
  std::vector<uint8_t> deflated(compressBound(kInflated));
  uLongf length = deflated.size();
  ASSERT_EQ(compress(deflated.data(), &length, reinterpret_cast<const Bytef*>(zeros.data()), kInflated),
            Z_OK);
  const std::string value(deflated.begin(), deflated.begin() + static_cast<ptrdiff_t>(length));
  memory_.files["index"].bytes = ByteWriter().Int(1).Long(4).bytes();
  memory_.files["records"].bytes = ByteWriter()
                                       .Int(1)
                                       .VInt(1)
                                       .VInt(0)
                                       .Byte(StoredFieldsReader::kBinary | StoredFieldsReader::kCompressed)
                                       .String(value)
                                       .bytes();
  StoredFieldsReader reader(folder_.Open("index"), folder_.Open("records"));
  reader.Seek(0);
  ASSERT_TRUE(reader.Next());
  recorder_.reads.clear();
  reader.PassValue();
  EXPECT_THAT(recorder_.reads, SizeIs(Ge(kInflated / WatchedFolder::kLongestRead)));
}

}  // namespace
}  // namespace vantrel::elastic::format

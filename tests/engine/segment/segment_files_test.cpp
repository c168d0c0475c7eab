#include "elastic/segment/segment_files.h"

#include <gtest/gtest.h>

#include "support/byte_writer.h"
#include "support/expect_damage.h"
#include "support/memory_folder.h"

namespace vantrel::elastic::format {
namespace {

using ::quorelastic::testing::ByteWriter;
using ::quorelastic::testing::ExpectIndexError;
using ::quorelastic::testing::MemoryFolder;
using Compound = SegmentInfo::Compound;

SegmentInfo Info(Compound compound, int64_t deletions_generation) {
  return {
      .name = "_0", .document_count = 1, .deletions_generation = deletions_generation, .compound = compound};
}

void PutPlain(MemoryFolder& folder) {
  for (const char* name : {"_0.fnm", "_0.tis", "_0.tii", "_0.frq"}) folder.files[name] = {};
}

void PutCompound(MemoryFolder& folder) {
  ByteWriter table;
  table.VInt(4);
  for (const char* name : {"_0.fnm", "_0.tis", "_0.tii", "_0.frq"}) table.Long(61).String(name);
  folder.files["_0.cfs"] = {table.bytes()};
}

TEST(SegmentFilesTest, ArePlainOrOutOfACompoundFileAsTheCommitSays) {
  MemoryFolder folder;
  PutPlain(folder);
  PutCompound(folder);
  EXPECT_EQ(OpenSegment(folder, Info(Compound::kNo, -1)).terms->name(), "memory/_0.tis");
  EXPECT_EQ(OpenSegment(folder, Info(Compound::kYes, -1)).terms->name(), "memory/_0.cfs (_0.tis)");
}

TEST(SegmentFilesTest, WhereTheCommitDoesNotSayTheFolderDecides) {
  MemoryFolder folder;
  PutPlain(folder);
  EXPECT_EQ(OpenSegment(folder, Info(Compound::kLookForFile, -1)).terms->name(), "memory/_0.tis");
  PutCompound(folder);
  EXPECT_EQ(OpenSegment(folder, Info(Compound::kLookForFile, -1)).terms->name(), "memory/_0.cfs (_0.tis)");
}

TEST(SegmentFilesTest, PostingsAreOpenedOnlyWhereDocumentsAreDeleted) {
  MemoryFolder folder;
  PutPlain(folder);
  EXPECT_EQ(OpenSegment(folder, Info(Compound::kNo, -1)).postings, nullptr);
  EXPECT_EQ(OpenSegment(folder, Info(Compound::kNo, 0)).deletions, nullptr);
  folder.files["_0.del"] = {};
  folder.files["_0_a.del"] = {};
  EXPECT_EQ(OpenSegment(folder, Info(Compound::kNo, 0)).deletions->name(), "memory/_0.del");
  EXPECT_EQ(OpenSegment(folder, Info(Compound::kNo, 10)).deletions->name(), "memory/_0_a.del");
  EXPECT_NE(OpenSegment(folder, Info(Compound::kNo, 10)).postings, nullptr);
}

TEST(SegmentFilesTest, NamesTheFileThatIsMissing) {
  for (const char* missing : {"_0.fnm", "_0.tis", "_0.tii", "_0.frq", "_0_1.del"}) {
    MemoryFolder folder;
    PutPlain(folder);
    folder.files["_0_1.del"] = {};
    folder.files.erase(missing);
    ExpectIndexError(std::string("memory/") + missing + ": cannot open file",
                     [&] { OpenSegment(folder, Info(Compound::kNo, 1)); });
  }
  MemoryFolder folder;
  PutPlain(folder);
  ExpectIndexError("memory/_0.cfs: cannot open file", [&] { OpenSegment(folder, Info(Compound::kYes, -1)); });
  folder.files["_0.cfs"] = {std::string(1, '\0')};
  ExpectIndexError("memory/_0.cfs: compound file holds no '_0.fnm'",
                   [&] { OpenSegment(folder, Info(Compound::kYes, -1)); });
}

}  // namespace
}  // namespace vantrel::elastic::format

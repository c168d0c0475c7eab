// Suggestions give up at their time limit, whichever file they are reading then.

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <atomic>
#include <chrono>
#include <string>
#include <thread>

#include "elastic/suggest/suggest_terms_in.h"
#include "support/byte_writer.h"
#include "support/memory_folder.h"
#include "support/numbered.h"
#include "vantrel/elastic/search_error.h"

namespace vantrel::elastic {
namespace {

using ::quorelastic::testing::ByteWriter;
using ::quorelastic::testing::MemoryFolder;
using ::quorelastic::testing::Numbered;
using ::testing::IsEmpty;

constexpr int kDocuments = 1'000'000;
constexpr int kFields = 20'000;
constexpr int kTerms = 20'000;

std::string FieldNames() {
  ByteWriter names = ByteWriter().VInt(-2).VInt(kFields).String("body").Byte(1);
  for (int i = 1; i < kFields; ++i) names.String(Numbered("f", i)).Byte(1);
  return names.bytes();
}

// A dictionary and the index over it, which has an entry for each term. The first term is in all documents, each other
// one in one.
void AddDictionary(MemoryFolder& folder) {
  const auto header = [] { return ByteWriter().Int(-4).Long(kTerms).Int(1).Int(0x7fffffff).Int(10); };
  ByteWriter terms = header();
  ByteWriter index = header();
  index.VInt(0).String("").VInt(-1).VInt(0).VLong(0).VLong(0).VLong(terms.size());
  for (int i = 0; i < kTerms; ++i) {
    const int frequency = i == 0 ? kDocuments : 1;
    const uint64_t postings = i == 0 ? 0 : i == 1 ? kDocuments : 1;  // from the term before
    const uint64_t start = terms.size();
    terms.VInt(0).String(Numbered("t", kTerms + i)).VInt(0).VInt(frequency).VLong(postings).VLong(0);
    if (i + 1 == kTerms) break;
    index.VInt(0).String(Numbered("t", kTerms + i)).VInt(0).VInt(frequency).VLong(postings).VLong(0);
    index.VLong(terms.size() - start);
  }
  folder.files["_0.tis"].bytes = terms.bytes();
  folder.files["_0.tii"].bytes = index.bytes();
}

// An index whose documents are all deleted, so that each term's postings are read.
void AddIndex(MemoryFolder& folder) {
  folder.files["segments_1"].bytes = ByteWriter()
                                         .Int(-2)
                                         .Long(1)
                                         .Int(1)
                                         .Int(1)
                                         .String("_0")
                                         .Int(kDocuments)
                                         .Long(1)
                                         .Int(-1)
                                         .Byte(0xff)
                                         .bytes();
  folder.files["_0.fnm"].bytes = FieldNames();
  AddDictionary(folder);
  std::string postings(kDocuments, '\x03');  // the next document, once
  postings.front() = '\x01';                 // the first one
  folder.files["_0.frq"].bytes = postings + std::string(kTerms, '\x01');
  std::string deleted(kDocuments / 8 + 1, '\xff');
  deleted.back() = 0;
  folder.files["_0_1.del"].bytes = ByteWriter().Int(kDocuments).Int(kDocuments).Raw(deleted).bytes();
}

class SuggestionDeadlineTest : public ::testing::TestWithParam<const char*> {};

TEST_P(SuggestionDeadlineTest, IsHeededWhileAFileIsRead) {
  constexpr std::chrono::milliseconds kLimit{500};
  MemoryFolder folder;
  AddIndex(folder);
  std::atomic<int> reads = 0;
  std::chrono::milliseconds first_read_takes{0};
  folder.files.at(GetParam()).before_read = [&] {
    if (++reads == 1) std::this_thread::sleep_for(first_read_takes);
  };
  SuggestRequest request{.field = "body", .prefix = "t"};
  EXPECT_THAT(SuggestTermsIn({&folder}, request), IsEmpty());
  EXPECT_GT(reads, 3) << "the file is read at once";

  reads = 0;
  first_read_takes = kLimit;
  request.time_limit = kLimit;
  EXPECT_THROW(SuggestTermsIn({&folder}, request), SearchTimeoutError);
  EXPECT_LE(reads, 1);
}

INSTANTIATE_TEST_SUITE_P(OfEveryKind, SuggestionDeadlineTest,
                         ::testing::Values("_0.fnm", "_0.tii", "_0.tis", "_0_1.del", "_0.frq"),
                         [](const auto& instance) {
                           const std::string name = instance.param;
                           return name.substr(name.find('.') + 1);
                         });

}  // namespace
}  // namespace vantrel::elastic

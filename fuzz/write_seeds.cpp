// Writes the inputs that the fuzz targets start from, a folder for each target: the files of two small indexes
// and a few older layouts by hand.
//
//   write_seeds FOLDER

#include <filesystem>
#include <iostream>
#include <string>

#include "support/byte_writer.h"
#include "support/files.h"
#include "support/random_index.h"
#include "support/temporary_folder.h"

namespace {

using quorelastic::testing::ByteWriter;
using quorelastic::testing::ListFolder;
using quorelastic::testing::RandomIndexShape;
using quorelastic::testing::ReadFile;
using quorelastic::testing::TemporaryFolder;
using quorelastic::testing::WriteFile;

class Corpus {
 public:
  explicit Corpus(std::string folder) : folder_(std::move(folder)) {}

  void Add(const std::string& target, const std::string& name, const std::string& bytes) const {
    std::filesystem::create_directories(folder_ + "/" + target);
    WriteFile(folder_ + "/" + target + "/" + name, bytes);
  }

 private:
  std::string folder_;
};

// What the targets take ahead of the file, as they document it.
const ByteWriter kDictionary = ByteWriter().Byte(0).Byte(20).Byte(0xff).Byte(0);
const ByteWriter kIndex = ByteWriter().Byte(1).Byte(20).Byte(0xff).Byte(0);
const ByteWriter kPostings = ByteWriter().Byte(0).Byte(0xff).Byte(0).Byte(3).Byte(0).Byte(0);

void AddIndex(const Corpus& corpus, const RandomIndexShape& shape, const std::string& name) {
  const TemporaryFolder folder;
  quorelastic::testing::WriteRandomIndex(folder.path(), shape);
  const auto documents = static_cast<int>(shape.documents);
  for (const std::string& file : ListFolder(folder.path())) {
    const std::string bytes = ReadFile(folder / file);
    if (file.starts_with("segments_")) corpus.Add("commit", name, bytes);
    if (file.ends_with(".cfs")) corpus.Add("compound_file", name, bytes);
    if (file.ends_with(".fnm")) corpus.Add("field_infos", name, bytes);
    if (file.ends_with(".del"))
      corpus.Add("deletions", name,
                 ByteWriter().Byte(documents & 0xff).Byte(documents >> 8).Raw(bytes).bytes());
    if (file.ends_with(".tis")) corpus.Add("term_cursor", name, ByteWriter(kDictionary).Raw(bytes).bytes());
    if (file.ends_with(".tii"))
      corpus.Add("term_cursor", name + "-index", ByteWriter(kIndex).Raw(bytes).bytes());
    if (file.ends_with(".frq")) corpus.Add("postings", name, ByteWriter(kPostings).Raw(bytes).bytes());
  }
}

void AddOlderLayouts(const Corpus& corpus) {
  corpus.Add("commit", "oldest", ByteWriter().Int(1).Int(1).String("_0").Int(3).bytes());
  corpus.Add("commit", "minus-1", ByteWriter().Int(-1).Long(1).Int(1).Int(1).String("_0").Int(3).bytes());
  corpus.Add("commit", "minus-4",
             ByteWriter()
                 .Int(-4)
                 .Long(1)
                 .Int(1)
                 .Int(1)
                 .String("_0")
                 .Int(3)
                 .Long(-1)
                 .Int(0)
                 .String("_0")
                 .Byte(1)
                 .Byte(1)
                 .Int(2)
                 .Long(1)
                 .Long(2)
                 .Byte(0)
                 .bytes());
  corpus.Add("field_infos", "units",
             ByteWriter().VInt(2).UnitsString(u"k\u00f6rper").Byte(1).UnitsString(u"z").Byte(1).bytes());
  corpus.Add("deletions", "sparse",
             ByteWriter().Byte(100).Byte(0).Int(-1).Int(100).Int(2).VInt(1).Byte(1).VInt(2).Byte(1).bytes());
  for (int format = -3; format <= 0; ++format) {
    ByteWriter terms = kDictionary;
    if (format < 0) terms.Int(format).Long(2).Int(128).Int(16);
    if (format == -3) terms.Int(10);
    if (format == 0) terms.Int(2);
    terms.VInt(0).UnitsString(u"k\u00f6").VInt(0).VInt(3).VLong(0).VLong(0);
    terms.VInt(1).UnitsString(u"\u4e2d").VInt(1).VInt(1).VLong(3).VLong(9);
    corpus.Add("term_cursor", "minus" + std::to_string(format), terms.bytes());
  }
  corpus.Add("postings", "omitted",
             ByteWriter().Byte(1).Byte(9).Byte(0).Byte(2).Byte(0).Byte(0).VInt(3).VInt(5).bytes());
}

}  // namespace

int main(int argc, char** argv) {
  if (argc != 2) {
    std::cerr << "write_seeds FOLDER\n";
    return 2;
  }
  const Corpus corpus(argv[1]);
  AddIndex(corpus, {.seed = 1, .documents = 12, .deletions = 3, .compound = false, .term_index_interval = 3},
           "plain");
  AddIndex(corpus, {.seed = 2, .documents = 5, .deletions = 3}, "compound");
  AddOlderLayouts(corpus);
  return 0;
}

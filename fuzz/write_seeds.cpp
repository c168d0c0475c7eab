// Writes the inputs that the fuzz targets start from, a folder for each target: the files of two small indexes
// and a few older layouts by hand.
//
//   write_seeds FOLDER

#include <algorithm>
#include <filesystem>
#include <iostream>
#include <set>
#include <string>
#include <vector>

#include "support/byte_writer.h"
#include "support/files.h"
#include "support/random_index.h"
#include "support/temporary_folder.h"
#include "support/varied_index.h"

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

ByteWriter Length(const std::string& bytes) {
  return ByteWriter().Byte(static_cast<int>(bytes.size() & 0xff)).Byte(static_cast<int>(bytes.size() >> 8));
}

// Files one behind the other, as FuzzInput::TakeFiles() takes them.
std::string FilesOf(const std::string& folder, const std::vector<std::string>& names) {
  ByteWriter files;
  for (const std::string& name : names) {
    const std::string bytes = ReadFile(folder + "/" + name);
    files.Byte(static_cast<int>(name.size())).Raw(name).Raw(Length(bytes).bytes()).Raw(bytes);
  }
  return files.bytes();
}

// What dictionaries are read from, begun with each of the files in turn: only the beginning is varied.
void AddDictionaries(const Corpus& corpus, const std::string& folder, const std::string& name) {
  std::vector<std::string> files = ListFolder(folder);
  std::erase_if(files, [](const std::string& file) {
    if (file.starts_with("segments_")) return false;
    const std::string extension = std::filesystem::path(file).extension();
    static const std::set<std::string> kNeeded = {".cfs", ".fnm", ".tii", ".tis", ".frq", ".del"};
    return !kNeeded.contains(extension);
  });
  for (size_t turn = 0; turn < files.size(); ++turn) {
    const std::string bytes = FilesOf(folder, files);
    for (const std::string text : {"", "x"}) {
      const ByteWriter wanted = ByteWriter().String("body").String(text);
      const std::string seed = name + std::to_string(turn) + "-" + text;
      corpus.Add("suggest", seed, ByteWriter(wanted).Byte(5).Raw(bytes).bytes());
      corpus.Add("merged_terms", seed, ByteWriter(wanted).Byte(static_cast<int>(turn)).Raw(bytes).bytes());
    }
    std::rotate(files.begin(), files.begin() + 1, files.end());
  }
}

// A folder as one input, begun with the file at each third place in turn: only the beginning is varied.
void AddFolder(const Corpus& corpus, const std::string& folder, const std::string& name) {
  std::vector<std::string> files = ListFolder(folder);
  for (size_t turn = 0; turn < files.size(); turn += 3) {
    const std::string whole = FilesOf(folder, files);
    corpus.Add("index_health", name + std::to_string(turn), whole);
    for (const int document : {0, 2}) {
      corpus.Add("lookup", name + std::to_string(turn) + "-" + std::to_string(document),
                 ByteWriter().Byte(4).Raw("body").Byte(1).Raw("x").Byte(document).Byte(0).Raw(whole).bytes());
    }
    std::rotate(files.begin(), files.begin() + 3 % static_cast<std::ptrdiff_t>(files.size()), files.end());
  }
}

void AddStores(const Corpus& corpus, const std::string& folder, const std::string& name) {
  const auto read = [&](const char* ending) { return ReadFile(folder + "/_0" + ending); };
  corpus.Add("stored_fields", name, Length(read(".fdx")).Raw(read(".fdx")).Raw(read(".fdt")).bytes());
  corpus.Add("term_vectors", name,
             ByteWriter()
                 .Byte(20)
                 .Raw(Length(read(".tvx")).bytes())
                 .Raw(Length(read(".tvd")).bytes())
                 .Raw(read(".tvx"))
                 .Raw(read(".tvd"))
                 .Raw(read(".tvf"))
                 .bytes());
}

void AddWholeIndexes(const Corpus& corpus) {
  const TemporaryFolder plain;
  quorelastic::testing::WriteVariedIndex(plain.path(), {.seed = 1,
                                                        .documents = 3,
                                                        .documents_per_segment = 9,
                                                        .compound = false,
                                                        .compound_store = false,
                                                        .deletions = 1,
                                                        .changed_norms = 1,
                                                        .term_index_interval = 4});
  AddFolder(corpus, plain.path(), "plain");
  AddDictionaries(corpus, plain.path(), "plain");
  AddStores(corpus, plain.path(), "plain");
  const TemporaryFolder compound;
  quorelastic::testing::WriteVariedIndex(compound.path(),
                                         {.seed = 2, .documents = 4, .documents_per_segment = 2});
  AddFolder(corpus, compound.path(), "compound");
  AddDictionaries(corpus, compound.path(), "compound");
}

void AddSkipsAndPositions(const Corpus& corpus) {
  // 16 documents, the first 15 distances 2, and payloads of one length.
  corpus.Add("skip_list", "one-level",
             ByteWriter().Byte(4).Byte(10).Byte(1).Byte(16).Byte(0).VInt(7).VInt(5).VInt(3).VInt(9).bytes());
  corpus.Add("skip_list", "two-levels",
             ByteWriter()
                 .Byte(4)
                 .Byte(10)
                 .Byte(0)
                 .Byte(16)
                 .Byte(0)
                 .VLong(4)
                 .VInt(15)
                 .VInt(15)
                 .VInt(15)
                 .VLong(9)
                 .bytes());
  std::string postings = ByteWriter().VInt(0).VInt(2).bytes();
  std::string positions = ByteWriter().VInt(1).VInt(2).bytes();
  for (int document = 1; document < 40; ++document) {
    postings += ByteWriter().VInt(document % 5 == 0 ? 200 * 2 : 3).bytes();
    if (document % 5 == 0) postings += ByteWriter().VInt(3).bytes();
    for (int left = document % 5 == 0 ? 3 : 1; left > 0; --left)
      positions += ByteWriter().VInt(int64_t{90} * left).bytes();
  }
  for (const int payloads : {0, 1}) {
    corpus.Add("positions", "payloads" + std::to_string(payloads),
               ByteWriter()
                   .Byte(payloads)
                   .Byte(40)
                   .Raw(Length(postings).bytes())
                   .Raw(postings)
                   .Raw(positions)
                   .bytes());
  }
}

// Postings of numbers of one byte to five, enough of them to be decoded in blocks.
void AddLongPostings(const Corpus& corpus) {
  constexpr int kDocuments = 400;
  for (const bool omits_frequencies : {false, true}) {
    ByteWriter postings = ByteWriter().Byte(omits_frequencies ? 1 : 0).Byte(0xff).Byte(0xff);
    postings.Byte(kDocuments & 0xff).Byte(kDocuments >> 8).Byte(0);
    for (int document = 0; document < kDocuments; ++document) {
      const int distance = document % 100 == 99 ? 9000 : 1 + document % 90;
      if (omits_frequencies) {
        postings.VInt(distance);
      } else if (document % 3 == 0) {
        postings.VInt(int64_t{2} * distance).VInt(document % 60 == 0 ? int64_t{1} << 29 : 2 + document);
      } else {
        postings.VInt(int64_t{2} * distance + 1);
      }
    }
    corpus.Add("postings", omits_frequencies ? "long-omitted" : "long", postings.bytes());
  }
}

void AddManifests(const Corpus& corpus) {
  const std::string digest = " 0123456789abcdef";
  corpus.Add("manifest", "files",
             "commit 36\nfile _0.cfs 1048577" + digest + digest + "\nfile _0_1.del 0\nfile segments_10 80" +
                 digest + "\n");
  corpus.Add("manifest", "empty", "commit 1\n");
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
  AddLongPostings(corpus);
  AddManifests(corpus);
  AddOlderLayouts(corpus);
  AddWholeIndexes(corpus);
  AddSkipsAndPositions(corpus);
  return 0;
}

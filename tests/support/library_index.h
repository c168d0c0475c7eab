#pragma once

#include <boost/smart_ptr/shared_ptr.hpp>

#include <string>
#include <vector>

namespace Lucene {
class IndexWriter;
}

namespace quorelastic::testing {

// One field of a document to be written. Text is cut into words at blanks; a keyword is one term.
struct LibraryField {
  enum class Vector { kNone, kTerms, kPositions, kOffsets, kPositionsAndOffsets };

  std::string name;
  std::string value;
  bool keyword = false;
  bool stored = true;
  bool norms = true;
  bool frequencies = true;  // without them, no positions either
  Vector vector = Vector::kNone;
};

// Writes an index through the index library alone: what the engine is measured against. Everything takes UTF-8.
class LibraryIndex {
 public:
  struct Options {
    bool compound = true;
    int documents_per_segment = 1000;  // a segment is flushed when it has that many; they are not merged
    int term_index_interval = 128;
  };

  explicit LibraryIndex(const std::string& path) : LibraryIndex(path, Options()) {}
  LibraryIndex(const std::string& path, const Options& options);
  LibraryIndex(const LibraryIndex&) = delete;
  LibraryIndex& operator=(const LibraryIndex&) = delete;
  ~LibraryIndex();

  void Add(const std::vector<LibraryField>& document);
  void Delete(const std::string& field, const std::string& term);  // every document that holds the term
  void Commit();                                                   // ends the segment
  void Optimize();                                                 // merges all segments into one
  void Close();                                                    // commits; implied by destruction

 private:
  boost::shared_ptr<Lucene::IndexWriter> writer_;
};

}  // namespace quorelastic::testing

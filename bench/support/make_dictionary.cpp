// Writes an index of the entries of a dictionary, as Debian packages it for a dictionary server, again and again until
// its files take a given number of MiB: words and texts with positions, stored, with term vectors of positions and
// offsets. By the index library alone, merged as its defaults have it.
//
// Such a dictionary is NAME.index, with lines of a word, an offset and a length in base 64, and NAME.dict.dz, the texts
// compressed by gzip.

#include <lucene++/LuceneHeaders.h>
#include <zlib.h>

#include <cstdint>
#include <cstdlib>
#include <exception>
#include <fstream>
#include <iostream>
#include <memory>
#include <stdexcept>
#include <string>
#include <string_view>
#include <vector>

#include "support/sized_index.h"

namespace {

using Lucene::AbstractField;
using Lucene::newLucene;
using Lucene::String;
using Lucene::StringUtils;

constexpr uint64_t kMebibyte = uint64_t{1} << 20;

struct Entry {
  std::string word;
  size_t offset = 0;
  size_t length = 0;
};

size_t FromBase64(std::string_view digits) {
  constexpr std::string_view kDigits = "ABCDEFGHIJKLMNOPQRSTUVWXYZabcdefghijklmnopqrstuvwxyz0123456789+/";
  size_t value = 0;
  for (const char digit : digits) {
    const size_t found = kDigits.find(digit);
    if (found == std::string_view::npos) throw std::runtime_error("not a number in base 64");
    value = value * kDigits.size() + found;
  }
  return value;
}

std::vector<Entry> ReadEntries(const std::string& path) {
  std::ifstream lines(path);
  std::vector<Entry> entries;
  for (std::string line; std::getline(lines, line);) {
    const size_t first = line.find('\t');
    const size_t second = line.find('\t', first + 1);
    if (second == std::string::npos) throw std::runtime_error(path + ": not an index of a dictionary");
    const std::string_view numbers = std::string_view(line).substr(first + 1);
    entries.push_back({line.substr(0, first), FromBase64(numbers.substr(0, second - first - 1)),
                       FromBase64(numbers.substr(second - first))});
  }
  if (entries.empty()) throw std::runtime_error(path + ": no entries");
  return entries;
}

std::string ReadTexts(const std::string& path) {
  const std::unique_ptr<gzFile_s, int (*)(gzFile)> file(gzopen(path.c_str(), "rb"), gzclose);
  if (file == nullptr) throw std::runtime_error(path + ": cannot be opened");
  std::string texts;
  std::vector<char> piece(kMebibyte);
  for (int got = 1; got > 0;) {
    got = gzread(file.get(), piece.data(), static_cast<unsigned>(piece.size()));
    if (got < 0) throw std::runtime_error(path + ": cannot be read");
    texts.append(piece.data(), static_cast<size_t>(got));
  }
  return texts;
}

Lucene::DocumentPtr MakeDocument(const Entry& entry, const std::string& texts, int number) {
  const auto document = newLucene<Lucene::Document>();
  const auto add = [&](const String& name, const String& value, AbstractField::Index index,
                       AbstractField::TermVector vector) {
    document->add(newLucene<Lucene::Field>(name, value, AbstractField::STORE_YES, index, vector));
  };
  add(L"id", StringUtils::toString(number), AbstractField::INDEX_NOT_ANALYZED_NO_NORMS,
      AbstractField::TERM_VECTOR_NO);
  add(L"word", StringUtils::toUnicode(entry.word), AbstractField::INDEX_ANALYZED,
      AbstractField::TERM_VECTOR_NO);
  add(L"text", StringUtils::toUnicode(texts.substr(entry.offset, entry.length)),
      AbstractField::INDEX_ANALYZED, AbstractField::TERM_VECTOR_WITH_POSITIONS_OFFSETS);
  return document;
}

void Write(const std::string& folder, const std::string& dictionary, uint64_t wanted) {
  const std::vector<Entry> entries = ReadEntries(dictionary + ".index");
  const std::string texts = ReadTexts(dictionary + ".dict.dz");
  for (const Entry& entry : entries) {
    if (entry.offset > texts.size()) throw std::runtime_error(dictionary + ": an entry lies past the texts");
  }
  quorelastic::bench::WriteSizedIndex(folder, wanted, [&](int number) {
    return MakeDocument(entries[static_cast<size_t>(number) % entries.size()], texts, number);
  });
}

}  // namespace

int main(int argc, char** argv) {
  if (argc != 4) {
    std::cerr << "usage: make_dictionary FOLDER DICTIONARY MEBIBYTES\n";
    return 2;
  }
  try {
    Write(argv[1], argv[2], std::strtoull(argv[3], nullptr, 10) * kMebibyte);
  } catch (const Lucene::LuceneException& error) {
    std::wcerr << error.getError() << L'\n';
    return 1;
  } catch (const std::exception& error) {
    std::cerr << error.what() << '\n';
    return 1;
  }
  return 0;
}

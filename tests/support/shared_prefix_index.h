#pragma once

#include <string>
#include <string_view>

#include "support/byte_writer.h"
#include "support/files.h"

namespace quorelastic::testing {

// An index of one document whose terms all begin with the same long text, of which the files have but one copy: each term
// takes about ten bytes. Nothing is wrong with it.
struct SharedPrefixIndex {
  int format = -4;  // of the dictionary: -4 holds UTF-8, those before UTF-16 code units
  int terms = 1000;
  int shared = 60'000;  // characters
  int interval = 128;   // of the index over the dictionary
  int segments = 1;     // each with the same terms
  bool has_vectors = false;

  static constexpr char kShared = 'x';

  // What term `number` has behind the shared text. Ascends with the number, and takes four bytes.
  static std::string Ending(int number) {
    std::string ending(4, '!');
    for (size_t i = ending.size(); i > 0; number /= 90) ending[--i] = static_cast<char>('!' + number % 90);
    return ending;
  }

  void Write(const std::string& folder) const {
    ByteWriter commit = ByteWriter().Int(-2).Long(1).Int(segments).Int(segments);
    for (int i = 0; i < segments; ++i) {
      commit.String("_" + std::to_string(i)).Int(1).Long(-1).Int(-1).Byte(0xff);
      WriteSegment(folder + "/_" + std::to_string(i));
    }
    WriteFile(folder + "/segments_1", commit.bytes());
  }

 private:
  void WriteSegment(const std::string& name) const {
    constexpr int kIndexed = 1;
    constexpr int kHasVectors = 2;
    constexpr int kOmitsNorms = 0x10;
    constexpr int kOmitsFrequencies = 0x40;
    const int flags = kIndexed | kOmitsNorms | kOmitsFrequencies | (has_vectors ? kHasVectors : 0);
    WriteFile(name + ".fnm", ByteWriter().VInt(-2).VInt(1).String("f").Byte(flags).bytes());
    WriteDictionary(name);
    WriteFile(name + ".frq", std::string(static_cast<size_t>(terms), '\0'));
    WriteFile(name + ".fdx", ByteWriter().Int(2).Long(4).bytes());
    WriteFile(name + ".fdt", ByteWriter().Int(2).VInt(0).bytes());
    if (has_vectors) WriteVectors(name);
  }

  void WriteDictionary(const std::string& name) const {
    ByteWriter dictionary = Header(terms);
    ByteWriter index = Header((terms + interval - 1) / interval);
    uint64_t last_pointer = 0;
    int last_entry = 0;  // the number of terms before it
    for (int i = 0; i < terms; ++i) {
      if (i % interval == 0) {
        if (i == 0) {
          index.VInt(0).VInt(0).VInt(-1).VInt(0).VLong(0).VLong(0);
        } else {
          AddText(index, i - 1, last_entry == 0);
          index.VInt(0).VInt(1).VLong(static_cast<uint64_t>(i - (last_entry == 0 ? 1 : last_entry))).VLong(0);
        }
        index.VLong(dictionary.size() - last_pointer);
        last_pointer = dictionary.size();
        last_entry = i;
      }
      AddText(dictionary, i, i == 0);
      dictionary.VInt(0).VInt(1).VLong(i == 0 ? 0 : 1).VLong(0);
    }
    WriteFile(name + ".tis", dictionary.bytes());
    WriteFile(name + ".tii", index.bytes());
  }

  void WriteVectors(const std::string& name) const {
    const int vector_format = format <= -4 ? 4 : 3;
    WriteFile(name + ".tvx", ByteWriter().Int(vector_format).Long(4).Long(4).bytes());
    WriteFile(name + ".tvd", ByteWriter().Int(vector_format).VInt(1).VInt(0).bytes());
    ByteWriter vectors = ByteWriter().Int(vector_format).VInt(terms).Byte(0);
    for (int i = 0; i < terms; ++i) {
      AddText(vectors, i, i == 0);
      vectors.VInt(1);
    }
    WriteFile(name + ".tvf", vectors.bytes());
  }

  ByteWriter Header(int count) const {
    ByteWriter out = ByteWriter().Int(format).Long(count).Int(interval).Int(16);
    if (format <= -3) out.Int(10);
    return out;
  }

  // ASCII is one byte in either layout.
  void AddText(ByteWriter& out, int number, bool is_first) const {
    const std::string text = Ending(number);
    if (is_first) {
      out.VInt(0).String(std::string(static_cast<size_t>(shared), kShared) + text);
    } else {
      out.VInt(shared).String(text);
    }
  }
};

}  // namespace quorelastic::testing

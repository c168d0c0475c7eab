#pragma once

#include <string>
#include <vector>

#include "support/byte_writer.h"
#include "support/files.h"

namespace quorelastic::testing {

// An index of one document with the field "f" and the given terms in the given order, in a dictionary of one of the
// older formats.
inline void WriteTermListIndex(const std::string& folder, int format,
                               const std::vector<std::u16string>& terms) {
  const auto header = [&](int64_t count) {
    ByteWriter out = ByteWriter().Int(format).Long(count).Int(128).Int(16);
    if (format <= -3) out.Int(10);
    return out;
  };
  ByteWriter dictionary = header(static_cast<int64_t>(terms.size()));
  ByteWriter index = header(1);
  index.VInt(0).VInt(0).VInt(-1).VInt(0).VLong(0).VLong(0).VLong(dictionary.size());
  for (size_t i = 0; i < terms.size(); ++i) {
    dictionary.VInt(0).UnitsString(terms[i]).VInt(0).VInt(1).VLong(i == 0 ? 0 : 1).VLong(0);
  }
  constexpr int kIndexedWithoutFrequenciesAndNorms = 0x51;
  WriteFile(folder + "/_0.fnm",
            ByteWriter().VInt(-2).VInt(1).String("f").Byte(kIndexedWithoutFrequenciesAndNorms).bytes());
  WriteFile(folder + "/_0.tis", dictionary.bytes());
  WriteFile(folder + "/_0.tii", index.bytes());
  WriteFile(folder + "/_0.frq", std::string(terms.size(), '\0'));
  WriteFile(folder + "/_0.fdx", ByteWriter().Int(2).Long(4).bytes());
  WriteFile(folder + "/_0.fdt", ByteWriter().Int(2).VInt(0).bytes());
  WriteFile(
      folder + "/segments_1",
      ByteWriter().Int(-2).Long(1).Int(1).Int(1).String("_0").Int(1).Long(-1).Int(-1).Byte(0xff).bytes());
}

// Texts on which the orders differ, in three orders: by UTF-16, by code points, and by neither.
inline const std::vector<std::u16string> kTermsByUtf16 = {u"a",          u"b\U0001F600", u"b\uff21",
                                                          u"\U0001F600", u"\U0001F601",  u"\uff21"};
inline const std::vector<std::u16string> kTermsByCodePoints = {u"a",      u"b\uff21",    u"b\U0001F600",
                                                               u"\uff21", u"\U0001F600", u"\U0001F601"};
inline const std::vector<std::u16string> kTermsByNeither = {u"a",      u"b\U0001F600", u"b\uff21",
                                                            u"\uff21", u"\U0001F600",  u"\U0001F601"};

}  // namespace quorelastic::testing

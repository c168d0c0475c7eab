#include "elastic/index/path_codecvt.h"

#include <algorithm>
#include <boost/filesystem/path.hpp>
#include <string>
#include <string_view>

#include "elastic/common/text.h"

namespace vantrel::elastic {
namespace {

constexpr char32_t kOddByte = 0xdc00;

bool StandsForByte(char32_t code_point) {
  return code_point >= kOddByte + 0x80 && code_point <= kOddByte + 0xff;
}

bool IsCodePoint(char32_t value) { return value <= 0x10ffff && (value < 0xd800 || value > 0xdfff); }

}  // namespace

PathCodecvt::result PathCodecvt::do_in(state_type&, const char* from, const char* from_end,
                                       const char*& from_next, wchar_t* to, wchar_t* to_end,
                                       wchar_t*& to_next) const {
  std::string_view rest(from, static_cast<size_t>(from_end - from));
  while (!rest.empty() && to != to_end) {
    char32_t code_point = 0;
    if (!TakeCodePoint(rest, code_point)) {
      code_point = kOddByte + static_cast<unsigned char>(rest.front());
      rest.remove_prefix(1);
    }
    *to++ = static_cast<wchar_t>(code_point);
  }
  from_next = from_end - rest.size();
  to_next = to;
  return rest.empty() ? ok : partial;
}

PathCodecvt::result PathCodecvt::do_out(state_type&, const wchar_t* from, const wchar_t* from_end,
                                        const wchar_t*& from_next, char* to, char* to_end,
                                        char*& to_next) const {
  result outcome = ok;
  std::string bytes;
  for (; from != from_end; ++from) {
    const auto value = static_cast<char32_t>(*from);
    bytes.clear();
    if (StandsForByte(value)) {
      bytes.push_back(static_cast<char>(value - kOddByte));
    } else if (IsCodePoint(value)) {
      AppendUtf8(value, bytes);
    } else {
      outcome = error;
      break;
    }
    if (bytes.size() > static_cast<size_t>(to_end - to)) {
      outcome = partial;
      break;
    }
    to = std::copy(bytes.begin(), bytes.end(), to);
  }
  from_next = from;
  to_next = to;
  return outcome;
}

std::wstring ToWidePath(const std::string& bytes) { return boost::filesystem::path(bytes).wstring(); }

}  // namespace vantrel::elastic

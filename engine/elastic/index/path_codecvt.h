#pragma once

#include <cwchar>
#include <locale>
#include <string>

namespace vantrel::elastic {

// Converts paths between the bytes of the file system and the wide text that the index library wants. It is
// UTF-8 and never fails on bytes: one that belongs to no UTF-8 becomes a lone surrogate, U+DC00 plus the byte,
// and that byte again on the way back. A folder with a single odd name in it could not be listed otherwise.
class PathCodecvt : public std::codecvt<wchar_t, char, std::mbstate_t> {
 protected:
  result do_in(state_type& state, const char* from, const char* from_end, const char*& from_next, wchar_t* to,
               wchar_t* to_end, wchar_t*& to_next) const override;
  result do_out(state_type& state, const wchar_t* from, const wchar_t* from_end, const wchar_t*& from_next,
                char* to, char* to_end, char*& to_next) const override;
  int do_encoding() const noexcept override { return 0; }  // of no fixed width
  bool do_always_noconv() const noexcept override { return false; }
  int do_max_length() const noexcept override { return 4; }
};

// A path, or a text with one in it, as the index library takes it: by that conversion, whose way back leads to the
// same bytes. To be called after PrepareIndexLibrary().
std::wstring ToWidePath(const std::string& bytes);

}  // namespace vantrel::elastic

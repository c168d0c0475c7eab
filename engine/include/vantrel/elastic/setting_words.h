#pragma once

#include <array>
#include <string_view>

#include "vantrel/elastic/index_settings.h"

namespace vantrel::elastic {

// What a value of a setting is called, in the settings file as in the daemon's protocol.
template <typename T>
struct SettingWord {
  T value;
  const char* word;
};

inline constexpr std::array kFieldTypeWords = {SettingWord<FieldType>{FieldType::kText, "text"},
                                               SettingWord<FieldType>{FieldType::kKeyword, "keyword"}};

inline constexpr std::array kTermVectorWords = {
    SettingWord<TermVector>{TermVector::kNone, "none"}, SettingWord<TermVector>{TermVector::kTerms, "terms"},
    SettingWord<TermVector>{TermVector::kPositions, "positions"},
    SettingWord<TermVector>{TermVector::kOffsets, "offsets"},
    SettingWord<TermVector>{TermVector::kPositionsAndOffsets, "positions_offsets"}};

// The word of a value; every value has one.
template <typename Table, typename T>
constexpr const char* ToWord(const Table& table, T value) {
  for (const auto& entry : table) {
    if (entry.value == value) return entry.word;
  }
  return "";
}

}  // namespace vantrel::elastic

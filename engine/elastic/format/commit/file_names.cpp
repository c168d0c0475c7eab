#include "elastic/format/commit/file_names.h"

#include <algorithm>
#include <array>
#include <charconv>

namespace vantrel::elastic::format {
namespace {

constexpr int kBase = 36;

bool IsBase36(std::string_view text) {
  return !text.empty() && std::all_of(text.begin(), text.end(), [](char c) {
    return (c >= '0' && c <= '9') || (c >= 'a' && c <= 'z');
  });
}

std::string ToBase36(int64_t number) {
  std::array<char, 16> digits{};
  const auto end = std::to_chars(digits.data(), digits.data() + digits.size(), number, kBase).ptr;
  return {digits.data(), end};
}

}  // namespace

std::optional<int64_t> CommitGeneration(std::string_view name) {
  if (name == kSegments) return 0;
  if (!name.starts_with(kSegments) || name.substr(kSegments.size(), 1) != "_") return std::nullopt;
  const std::string_view digits = name.substr(kSegments.size() + 1);
  int64_t generation = 0;
  if (!IsBase36(digits)) return std::nullopt;
  const auto [end, error] = std::from_chars(digits.begin(), digits.end(), generation, kBase);
  if (error != std::errc() || end != digits.end()) return std::nullopt;
  return generation;
}

std::string CommitFileName(int64_t generation) {
  return generation == 0 ? std::string(kSegments) : std::string(kSegments) + "_" + ToBase36(generation);
}

bool IsSegmentName(std::string_view name) {
  constexpr size_t kMostDigits = 13;  // of a 64-bit number
  return name.size() <= kMostDigits + 1 && name.starts_with('_') && IsBase36(name.substr(1));
}

bool IsCoreExtension(std::string_view extension) {
  return std::find(kCoreExtensions.begin(), kCoreExtensions.end(), extension) != kCoreExtensions.end();
}

bool IsNormsExtension(std::string_view extension) {
  return (extension.starts_with(".f") || extension.starts_with(".s")) && extension.size() > 2 &&
         std::all_of(extension.begin() + 2, extension.end(), [](char c) { return c >= '0' && c <= '9'; });
}

std::string_view ExtensionOf(std::string_view name) {
  return name.substr(std::min(name.find('.'), name.size()));
}

bool IsStoreExtension(std::string_view extension) {
  return std::find(kStoreExtensions.begin(), kStoreExtensions.end(), extension) != kStoreExtensions.end();
}

std::string_view SegmentOfFile(std::string_view name) {
  return name.starts_with('_') ? name.substr(0, name.find_first_of("._", 1)) : std::string_view();
}

std::string DeletionsFileName(const std::string& segment, int64_t generation) {
  return generation == 0 ? segment + ".del" : segment + "_" + ToBase36(generation) + ".del";
}

std::string NormsFileName(const std::string& segment, size_t field, int64_t generation) {
  const std::string extension = ".s" + std::to_string(field);
  return generation == 0 ? segment + extension : segment + "_" + ToBase36(generation) + extension;
}

}  // namespace vantrel::elastic::format

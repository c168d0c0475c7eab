#include "elastic/manifest/manifest.h"

#include <algorithm>
#include <charconv>
#include <set>
#include <span>
#include <utility>

#include "elastic/common/quoted.h"
#include "elastic/format/commit/file_names.h"
#include "elastic/format/commit/shared_files.h"
#include "elastic/format/io/opening_error.h"
#include "elastic/manifest/block_digest.h"
#include "elastic/segment/whole_segment.h"
#include "vantrel/elastic/index_error.h"

namespace vantrel::elastic::format {
namespace {

// Whether a file of this name may be looked for in the folder.
bool IsFileName(const std::string& name) {
  return name.find('/') == std::string::npos && (name.starts_with('_') || CommitGeneration(name).has_value());
}

constexpr std::string_view kTitle = "quorelastic manifest ";
constexpr std::string_view kVersion = "1";

std::string LastLine(std::string_view before) {
  const auto* bytes = reinterpret_cast<const uint8_t*>(before.data());
  return "digest " + DigestText(BlockDigest::Of(std::span(bytes, before.size()))) + "\n";
}

// Takes the text of a manifest apart, from its start on.
class Lines {
 public:
  Lines(const std::string& path, std::string_view text) : path_(path), text_(text) {}

  bool at_end() const { return at_ == text_.size(); }
  size_t offset() const { return at_; }

  void Expect(std::string_view word) {
    if (!text_.substr(at_).starts_with(word)) Refuse("\"" + std::string(word) + "\" is missing");
    at_ += word.size();
  }
  bool Passes(char separator) {
    if (at_ == text_.size() || text_[at_] != separator) return false;
    ++at_;
    return true;
  }
  std::string_view Word() {
    const size_t end = std::min(text_.find_first_of(" \n", at_), text_.size());
    if (end == at_) Refuse("a word is missing");
    const size_t start = std::exchange(at_, end);
    return text_.substr(start, end - start);
  }
  template <typename Number>
  Number TakeNumber(int base = 10) {
    const size_t start = at_;
    const std::string_view word = Word();
    Number number = 0;
    const auto [end, error] = std::from_chars(word.data(), word.data() + word.size(), number, base);
    if (error == std::errc() && end == word.data() + word.size() &&
        (base == 10 || word.size() == kDigestDigits)) {
      return number;
    }
    at_ = start;
    Refuse("no number where one must be");
  }
  [[noreturn]] void Refuse(const std::string& problem) const { Refuse(at_, problem); }
  [[noreturn]] void Refuse(size_t offset, const std::string& problem) const {
    throw IndexDamagedError(path_, offset, problem);
  }

 private:
  const std::string& path_;
  std::string_view text_;
  size_t at_ = 0;
};

Manifest::File ReadFileLine(Lines& lines) {
  Manifest::File file;
  lines.Expect("file ");
  const size_t start = lines.offset();
  file.name = lines.Word();
  if (!IsFileName(file.name)) lines.Refuse(start, Quoted(file.name) + " is no file of a commit");
  lines.Expect(" ");
  file.size = lines.TakeNumber<uint64_t>();
  while (lines.Passes(' ')) file.digests.push_back(lines.TakeNumber<uint64_t>(16));
  if (file.digests.size() != CountDigestBlocks(file.size)) lines.Refuse("digests and size do not agree");
  lines.Expect("\n");
  return file;
}

std::string ReadText(const ByteSource& source) {
  if (source.size() > kLargestManifest) {
    throw IndexError(source.name(),
                     "of " + std::to_string(source.size()) + " bytes, too large for a manifest");
  }
  std::string text(source.size(), '\0');
  source.ReadAt(0, std::span(reinterpret_cast<uint8_t*>(text.data()), text.size()));
  return text;
}

// A file's size and digests.
Manifest::File DigestFile(const Folder& folder, const std::string& name) {
  const auto source = folder.Open(name);
  return {.name = name, .size = source->size(), .digests = DigestBlocks(*source)};
}

}  // namespace

const Manifest::File* Manifest::Find(std::string_view name) const {
  const auto found =
      std::lower_bound(files.begin(), files.end(), name,
                       [](const File& file, std::string_view wanted) { return file.name < wanted; });
  return found != files.end() && found->name == name ? &*found : nullptr;
}

bool Manifest::BelongsTo(const Folder& folder, const Commit& commit) const {
  if (generation != commit.generation) return false;
  const File* file = Find(CommitFileName(generation));
  return file != nullptr && *file == DigestFile(folder, file->name);
}

std::string WriteManifest(const Manifest& manifest) {
  std::string text(kTitle);
  text.append(kVersion).append("\ncommit ").append(std::to_string(manifest.generation)).append("\n");
  for (const Manifest::File& file : manifest.files) {
    text.append("file ").append(file.name).append(" ").append(std::to_string(file.size));
    for (const uint64_t digest : file.digests) text.append(" ").append(DigestText(digest));
    text.append("\n");
  }
  return text.append(LastLine(text));
}

std::optional<Manifest> ReadManifest(const ByteSource& source) {
  const std::string text = ReadText(source);
  const size_t last_line = text.size() - std::min(text.size(), LastLine("").size());
  const std::string_view body = std::string_view(text).substr(0, last_line);
  if (!text.starts_with(kTitle) || text.substr(last_line) != LastLine(body)) {
    throw IndexDamagedError(source.name(), last_line,
                            "the manifest is not what was written: its digest differs");
  }
  Lines lines(source.name(), body);
  lines.Expect(kTitle);
  if (lines.Word() != kVersion) return std::nullopt;
  Manifest manifest;
  lines.Expect("\ncommit ");
  manifest.generation = lines.TakeNumber<int64_t>();
  lines.Expect("\n");
  while (!lines.at_end()) {
    manifest.files.push_back(ReadFileLine(lines));
    const size_t count = manifest.files.size();
    if (count > 1 && manifest.files[count - 2].name >= manifest.files[count - 1].name) {
      lines.Refuse("files out of order");
    }
  }
  return manifest;
}

std::optional<Manifest> FindManifest(const Folder& folder, const Commit& commit) {
  try {
    auto manifest = ReadManifest(*folder.Open(kManifestName));
    if (manifest.has_value() && manifest->BelongsTo(folder, commit)) return manifest;
  } catch (const IndexIoError& error) {
    if (!IsMissingError(error)) throw;
  } catch (const IndexError&) {
    // As if there were none.
  }
  return std::nullopt;
}

Manifest MakeManifest(const Folder& folder, const Commit& commit, const std::optional<Manifest>& known) {
  std::set<std::string> names = {CommitFileName(commit.generation)};
  SharedFiles shared(folder);
  for (const SegmentInfo& segment : commit.segments) {
    const WholeSegment files(folder, segment, shared);
    names.insert(files.file_names().begin(), files.file_names().end());
  }
  Manifest manifest;
  manifest.generation = commit.generation;
  for (const std::string& name : names) {
    const Manifest::File* const file = known.has_value() ? known->Find(name) : nullptr;
    manifest.files.push_back(file != nullptr ? *file : DigestFile(folder, name));
  }
  return manifest;
}

}  // namespace vantrel::elastic::format

#include "damage/damage.h"

#include <algorithm>
#include <filesystem>

#include "support/byte_writer.h"
#include "support/files.h"

namespace quorelastic::testing {
namespace {

using Kind = Damage::Kind;

constexpr size_t kChecksumLength = 8;

uint64_t Below(std::mt19937& random, uint64_t bound) { return bound == 0 ? 0 : random() % bound; }

// Where the structure is, at the front, a place is as likely as anywhere else.
uint64_t RandomOffset(std::mt19937& random, uint64_t size) {
  return Below(random, 2) == 0 ? Below(random, std::min<uint64_t>(size, 40)) : Below(random, size);
}

// Every file has its turn, those that dictionaries are read from the more often.
std::string RandomFile(std::mt19937& random, const std::vector<std::string>& files) {
  std::string file = files[Below(random, files.size())];
  for (int again = 0; again < 2; ++again) {
    const bool is_other = file.find(".fd") != std::string::npos || file.find(".tv") != std::string::npos ||
                          file.ends_with(".prx") || file.ends_with(".nrm");
    if (is_other) file = files[Below(random, files.size())];
  }
  return file;
}

// As a new file, which is quicker than to cut and rewrite one: some file systems flush that to the disk.
void WriteNewFile(const std::string& path, const std::string& bytes) {
  std::filesystem::remove(path);
  WriteFile(path, bytes);
}

Kind RandomKind(std::mt19937& random, bool is_commit) {
  constexpr Kind kKinds[] = {Kind::kFlipBit, Kind::kFlipBit, Kind::kFlipBit, Kind::kSetByte,
                             Kind::kSetByte, Kind::kSetRun,  Kind::kCut,     Kind::kCut,
                             Kind::kGrow,    Kind::kDrop,    Kind::kReplace, Kind::kRemove};
  const Kind kind = kKinds[Below(random, std::size(kKinds))];
  return is_commit && Below(random, 2) == 0 ? Kind::kFlipUnderChecksum : kind;
}

std::string Flipped(std::string bytes, const Damage& damage) {
  if (damage.offset < bytes.size()) {
    bytes[damage.offset] = static_cast<char>(bytes[damage.offset] ^ 1 << damage.value % 8);
  }
  return bytes;
}

std::string Damaged(std::string bytes, const Damage& damage, const std::string& other) {
  const size_t at = std::min<size_t>(damage.offset, bytes.size());
  const size_t run = std::min<size_t>(damage.length, bytes.size() - at);
  switch (damage.kind) {
    case Kind::kFlipBit:
      return Flipped(std::move(bytes), damage);
    case Kind::kSetByte:
      return bytes.replace(at, std::min<size_t>(1, bytes.size() - at), 1, static_cast<char>(damage.value));
    case Kind::kSetRun:
      return bytes.replace(at, run, run, static_cast<char>(damage.value % 2 == 0 ? 0 : 0xff));
    case Kind::kCut:
      return bytes.substr(0, at);
    case Kind::kGrow:
      return bytes + std::string(damage.length, static_cast<char>(damage.value));
    case Kind::kDrop:
      return bytes.erase(at, run);
    case Kind::kReplace:
      return other;
    case Kind::kFlipUnderChecksum:
      bytes = Flipped(std::move(bytes), damage);
      if (bytes.size() < kChecksumLength) return bytes;
      return ByteWriter().Raw(bytes.substr(0, bytes.size() - kChecksumLength)).Checksum().bytes();
    case Kind::kRemove:
      break;
  }
  return bytes;
}

}  // namespace

std::string Damage::Describe() const {
  constexpr const char* kNames[] = {
      "flip bit", "set byte", "set run", "cut", "grow", "drop", "replace", "remove", "flip under checksum"};
  return std::string(kNames[static_cast<int>(kind)]) + " of " + file + ", offset " + std::to_string(offset) +
         ", length " + std::to_string(length) + ", value " + std::to_string(value) +
         (other_file.empty() ? "" : ", by " + other_file);
}

Damage RandomDamage(const std::string& folder, std::mt19937& random) {
  const std::string file = RandomFile(random, ListFolder(folder));
  return RandomDamageTo(folder, file, random);
}

Damage RandomDamageTo(const std::string& folder, const std::string& file, std::mt19937& random) {
  const bool is_commit = file.starts_with("segments_");
  const uint64_t size = std::filesystem::file_size(folder + "/" + file);
  Damage damage{.kind = RandomKind(random, is_commit), .file = file};
  damage.offset = RandomOffset(random, size);
  damage.length = 1 + Below(random, 20);
  damage.value = static_cast<int>(Below(random, 256));
  if (damage.kind == Kind::kReplace) {
    const std::vector<std::string> files = ListFolder(folder);
    damage.other_file = files[Below(random, files.size())];
  }
  return damage;
}

DamagedFile::DamagedFile(const std::string& folder, const Damage& damage)
    : path_(folder + "/" + damage.file), original_(ReadFile(path_)) {
  if (damage.kind == Kind::kRemove) {
    std::filesystem::remove(path_);
    return;
  }
  const std::string other = damage.other_file.empty() ? "" : ReadFile(folder + "/" + damage.other_file);
  WriteNewFile(path_, Damaged(original_, damage, other));
}

DamagedFile::~DamagedFile() { WriteNewFile(path_, original_); }

}  // namespace quorelastic::testing

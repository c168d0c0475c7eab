#pragma once

#include <cstdint>
#include <random>
#include <string>
#include <vector>

namespace quorelastic::testing {

// One thing that goes wrong with one file of an index.
struct Damage {
  enum class Kind {
    kFlipBit,
    kSetByte,
    kSetRun,   // some bytes become 0 or 0xff
    kCut,      // the end is lost
    kGrow,     // something is appended
    kDrop,     // some bytes in the middle are lost
    kReplace,  // another file's content stands in its place
    kRemove,
    kFlipUnderChecksum  // a commit with a valid checksum over damaged bytes
  };

  Kind kind;
  std::string file;
  uint64_t offset = 0;
  uint64_t length = 0;
  int value = 0;
  std::string other_file = {};  // for kReplace

  std::string Describe() const;
};

// A damage at random to one of the files in the folder, as they are now.
Damage RandomDamage(const std::string& folder, std::mt19937& random);

// A damage at random to one file of the folder.
Damage RandomDamageTo(const std::string& folder, const std::string& file, std::mt19937& random);

// Applies a damage to a file in a folder and undoes it when it goes.
class DamagedFile {
 public:
  DamagedFile(const std::string& folder, const Damage& damage);
  DamagedFile(const DamagedFile&) = delete;
  DamagedFile& operator=(const DamagedFile&) = delete;
  ~DamagedFile();

 private:
  std::string path_;
  std::string original_;
};

}  // namespace quorelastic::testing

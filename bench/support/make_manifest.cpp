// Gives an index that another program has written the manifest that a commit of ours would leave: digests every file.

#include <exception>
#include <fstream>
#include <iostream>
#include <string>

#include "elastic/common/path.h"
#include "elastic/format/commit/commit.h"
#include "elastic/format/io/folder.h"
#include "elastic/manifest/manifest.h"

namespace {

namespace format = vantrel::elastic::format;

void MakeManifest(const std::string& path) {
  const format::DiskFolder folder(path);
  format::Manifest manifest;
  format::UseNewestCommit(
      folder, [&](const format::Commit& commit) { manifest = format::MakeManifest(folder, commit); });
  std::ofstream file(vantrel::elastic::JoinPath(path, format::kManifestName), std::ios::binary);
  file << format::WriteManifest(manifest);
  if (!file.flush()) throw std::runtime_error("cannot write the manifest");
}

}  // namespace

int main(int argc, char** argv) {
  if (argc != 2) {
    std::cerr << "usage: make_manifest FOLDER\n";
    return 2;
  }
  try {
    MakeManifest(argv[1]);
    return 0;
  } catch (const std::exception& error) {
    std::cerr << error.what() << "\n";
    return 1;
  }
}

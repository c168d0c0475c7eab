#include "elastic/manifest/manifest.h"

#include <span>

#include "elastic/manifest/block_digest.h"
#include "fuzz_input.h"

using namespace vantrel::elastic::format;
using quorelastic::fuzz::Require;
using quorelastic::testing::SourceOf;

// What stands between the first line and the last one, whose digest is made to fit.
extern "C" int LLVMFuzzerTestOneInput(const uint8_t* data, size_t size) {
  return quorelastic::fuzz::DecodeWithinBounds([&] {
    std::string text = "quorelastic manifest 1\n" + quorelastic::fuzz::FuzzInput(data, size).TakeBytes(size);
    const uint64_t digest =
        BlockDigest::Of(std::span(reinterpret_cast<const uint8_t*>(text.data()), text.size()));
    text += "digest " + DigestText(digest) + "\n";
    const auto manifest = ReadManifest(*SourceOf(text));
    Require(manifest.has_value(), "a manifest of this version is read or refused");
    Require(ReadManifest(*SourceOf(WriteManifest(*manifest))) == manifest,
            "what is written is what was read");
    for (const Manifest::File& file : manifest->files) {
      Require(file.name.find('/') == std::string::npos, "no file leaves the folder");
      Require(file.digests.size() == CountDigestBlocks(file.size), "each block has a digest");
    }
  });
}

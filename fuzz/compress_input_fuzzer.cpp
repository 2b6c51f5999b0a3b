// Property: compressing any input and expanding the payload gives the input back, the payload
// equals the exhaustive reference's byte for byte, and a reused compressor gives it again.
#include <cstddef>
#include <cstdint>
#include <string>

#include "fuzz/fuzzbytes.h"
#include "fuzz/fuzzscratch.h"
#include "port/src/memorystream.h"
#include "qorCompress/src/qorCompress.h"
#include "tests/support/referencecompressor.h"

namespace {

const int kWindow = 131072;
const int kStretchStep = 256;
const uint8_t kStretch = 0xE0;

// A first byte with its three top bits set asks for an input past the first window refill:
// the rest tiled to 128 KiB and up to 8 KiB more, one byte changed per tile so the tiles are
// not all equal. The exhaustive reference makes these slow, so they are one input in eight.
std::string InputOf(const uint8_t* aData, size_t aSize) {
  FuzzBytes_t bytes(aData, aSize);
  const uint8_t mode = bytes.Byte();
  std::string rest = bytes.Rest();
  if ((mode & kStretch) != kStretch || rest.empty()) return rest;
  const size_t length = kWindow + (mode & ~kStretch) * kStretchStep;
  std::string input;
  input.reserve(length);
  for (size_t tile = 0; input.size() < length; ++tile) {
    std::string piece = rest;
    piece[tile % piece.size()] = static_cast<char>(piece[tile % piece.size()] + tile);
    input += piece;
  }
  input.resize(length);
  return input;
}

std::string StreamBytes(PortMemoryStream_t& aStream) {
  std::string bytes(static_cast<size_t>(aStream.GetLength()), '\0');
  aStream.Seek(0, 0);
  aStream.ReadBuffer(&bytes[0], aStream.GetLength());
  return bytes;
}

std::string Compress(qorCompressor_t& aCompressor, const std::string& aInput) {
  PortMemoryStream_t source;
  source.WriteBuffer(aInput.data(), static_cast<int>(aInput.size()));
  source.Seek(0, 0);
  PortMemoryStream_t payload;
  aCompressor.compress(payload, source, static_cast<int>(aInput.size()));
  return StreamBytes(payload);
}

}  // namespace

extern "C" int LLVMFuzzerTestOneInput(const uint8_t* aData, size_t aSize) {
  const std::string input = InputOf(aData, aSize);
  qorCompressor_t compressor;
  const std::string payload = Compress(compressor, input);
  FuzzRequire(payload == ReferenceCompressor().Compress(input),
              "payload differs from the exhaustive reference's");
  FuzzRequire(Compress(compressor, input) == payload, "a reused compressor differs");

  PortMemoryStream_t source;
  source.WriteBuffer(payload.data(), static_cast<int>(payload.size()));
  source.Seek(0, 0);
  PortMemoryStream_t expanded;
  qorExpander_t().expand(expanded, source, static_cast<int>(payload.size()),
                         static_cast<int>(input.size()));
  FuzzRequire(StreamBytes(expanded) == input, "expanded payload differs from the input");
  return 0;
}

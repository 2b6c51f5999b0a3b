#include "tests/support/payloadrun.h"

#include <random>
#include <unordered_map>

#include "qorCompress/src/qorCompress.h"
#include "tests/support/teststream.h"

std::string Hex(const char* aText) {
  std::string bytes;
  int pending = -1;
  for (const char* p = aText; *p != '\0'; ++p) {
    const char c = *p;
    int digit;
    if (c >= '0' && c <= '9') {
      digit = c - '0';
    } else if (c >= 'a' && c <= 'f') {
      digit = c - 'a' + 10;
    } else if (c >= 'A' && c <= 'F') {
      digit = c - 'A' + 10;
    } else {
      continue;
    }
    if (pending < 0) {
      pending = digit;
    } else {
      bytes += static_cast<char>(pending << 4 | digit);
      pending = -1;
    }
  }
  return bytes;
}

std::string CompressString(const std::string& aInput) {
  TestStream_t src(aInput);
  TestStream_t dst;
  qorCompressor_t compressor;
  compressor.compress(dst, src, static_cast<int>(aInput.size()));
  return dst.Content();
}

std::string ExpandString(const std::string& aPayload, int aRealSize) {
  TestStream_t src(aPayload);
  TestStream_t dst;
  qorExpander_t expander;
  expander.expand(dst, src, static_cast<int>(aPayload.size()), aRealSize);
  return dst.Content();
}

std::string IncompressibleBytes(int aLength, uint32_t aSeed) {
  std::mt19937 rng(aSeed);
  std::unordered_map<uint32_t, int> last_seen;  // 3 bytes -> where they ended
  std::string bytes;
  while (static_cast<int>(bytes.size()) < aLength) {
    const int i = static_cast<int>(bytes.size());
    const unsigned char b = static_cast<unsigned char>(1 + rng() % 255);
    if (i > 0 && b == static_cast<unsigned char>(bytes[i - 1])) continue;  // no runs
    if (i < 2) {
      bytes += static_cast<char>(b);
      continue;
    }
    const uint32_t key = static_cast<unsigned char>(bytes[i - 2]) << 16 |
                         static_cast<unsigned char>(bytes[i - 1]) << 8 | b;
    auto seen = last_seen.find(key);
    if (seen != last_seen.end() && i - seen->second <= 1024) continue;
    last_seen[key] = i;
    bytes += static_cast<char>(b);
  }
  return bytes;
}

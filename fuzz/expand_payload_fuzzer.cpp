// Property: given any payload, payload length and realSize, the decoder writes exactly what a
// plain byte-at-a-time decoder gives, or raises " invalid file format." where that one refuses.
#include <cstddef>
#include <cstdint>
#include <cstring>
#include <string>

#include "fuzz/fuzzbytes.h"
#include "fuzz/fuzzscratch.h"
#include "port/src/memorystream.h"
#include "qorCompress/src/qorCompress.h"

namespace {

const int kHistory = 1024;

// Every rule of the format checked at the byte it concerns; false for a malformed payload.
bool PlainExpand(const std::string& aPayload, int aRealSize, std::string& aOut) {
  if (aRealSize < 0) return false;
  const size_t n = aPayload.size();
  if (n == 0) return aRealSize == 0;
  size_t pos = 0;
  auto byte = [&](size_t aAt) { return static_cast<unsigned char>(aPayload[aAt]); };
  for (;;) {
    if (pos >= n) return false;
    const int directive = byte(pos++);
    if (directive == 0xFF) break;
    const int code = directive >> 5;
    int leng = directive & 0x1F;
    if (leng == 0) {
      if (pos + 2 > n) return false;
      leng = byte(pos) | byte(pos + 1) << 8;
      pos += 2;
      if (leng == 0) return false;
    }
    const long out_leng = code == 5 ? 2L * leng : leng;
    if (static_cast<long>(aOut.size()) + out_leng > aRealSize) return false;
    switch (code) {
      case 0:
        if (pos + leng > n) return false;
        aOut.append(aPayload, pos, leng);
        pos += leng;
        break;
      case 1:
        aOut.append(leng, '\0');
        break;
      case 2:
        if (pos + 1 > n) return false;
        aOut.append(leng, aPayload[pos++]);
        break;
      case 3:
      case 4: {
        int offset = 0;
        if (pos + (code - 2) > n) return false;
        offset = byte(pos++);
        if (code == 4) offset |= byte(pos++) << 8;
        if (offset == 0 || offset > kHistory) return false;
        if (offset > static_cast<int>(aOut.size())) return false;
        for (int k = 0; k < leng; ++k) aOut += aOut[aOut.size() - offset];
        break;
      }
      case 5:
        if (pos + leng > n) return false;
        for (int k = 0; k < leng; ++k) {
          aOut += aPayload[pos++];
          aOut += '\0';
        }
        break;
      default:
        return false;
    }
  }
  return pos == n && static_cast<long>(aOut.size()) == aRealSize;
}

bool EndsWith(const std::string& aText, const char* aTail) {
  const size_t tail = strlen(aTail);
  return aText.size() >= tail && aText.compare(aText.size() - tail, tail, aTail) == 0;
}

}  // namespace

extern "C" int LLVMFuzzerTestOneInput(const uint8_t* aData, size_t aSize) {
  FuzzBytes_t bytes(aData, aSize);
  // 0: the stream holds the payload alone; 1: bytes follow it, which must stay unread;
  // 2: the stream ends one byte before the payload length given.
  const int layout = bytes.Below(3);
  const int real_size = static_cast<int>(bytes.Le32());
  const std::string payload = bytes.Rest();
  const int payload_length = static_cast<int>(payload.size()) + (layout == 2 ? 1 : 0);

  PortMemoryStream_t source;
  source.WriteBuffer(payload.data(), static_cast<int>(payload.size()));
  if (layout == 1) source.WriteBuffer("\xFF\x01\x02", 3);
  source.Seek(0, 0);
  PortMemoryStream_t output;
  std::string raised;
  try {
    qorExpander_t().expand(output, source, payload_length, real_size);
  } catch (const char* text) {
    raised = text;
  }

  std::string expected;
  if (layout == 2) {
    // Nothing says how far a decoder reads before it meets the end of the stream.
    FuzzRequire(raised.empty() ? false : EndsWith(raised, " read error.") ||
                                             raised == " invalid file format.",
                "a short stream must fail");
    return 0;
  }
  if (!PlainExpand(payload, real_size, expected)) {
    FuzzRequire(raised == " invalid file format.", "a malformed payload must be refused");
    return 0;
  }
  FuzzRequire(raised.empty(), "a sound payload was refused");
  FuzzRequire(source.GetPosition() == payload_length, "the decoder read past its payload");
  std::string written(static_cast<size_t>(output.GetLength()), '\0');
  output.Seek(0, 0);
  output.ReadBuffer(&written[0], output.GetLength());
  FuzzRequire(written == expected, "expanded bytes differ from the plain decoder's");
  return 0;
}

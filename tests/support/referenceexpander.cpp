#include "tests/support/referenceexpander.h"

namespace {
const int kHistory = 1024;
}  // namespace

bool ReferenceExpand(const std::string& aPayload, int aRealSize, std::string& aOut) {
  aOut.clear();
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

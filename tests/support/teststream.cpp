#include "tests/support/teststream.h"

#include <algorithm>
#include <cstring>

TestStream_t::TestStream_t(const std::string& aContent, const char* aDescription)
    : content(aContent), description(aDescription) {
  SetReadable();
  SetWritable();
}

void TestStream_t::SetAccess(bool aReadable, bool aWritable) {
  if (aReadable) SetReadable(); else ResetReadable();
  if (aWritable) SetWritable(); else ResetWritable();
}

void TestStream_t::SetCap(int aMaxPerCall) { cap = aMaxPerCall; }

int TestStream_t::Capped(int aLength) const {
  return cap > 0 ? std::min(aLength, cap) : aLength;
}

// No access test here: like the library's streams, the checks belong to WriteBuffer/ReadBuffer.
int TestStream_t::Write(const void* aPtr, int aLength) {
  writeSizes.push_back(aLength);
  if (failWriteAt > 0 && static_cast<int>(writeSizes.size()) == failWriteAt) Error(8);
  if (aLength <= 0) return 0;
  int n = Capped(aLength);
  size_t end = static_cast<size_t>(pos) + n;
  if (end > content.size()) content.resize(end);
  std::memcpy(&content[pos], aPtr, n);
  pos += n;
  return n;
}

int TestStream_t::Read(void* aPtr, int aLength) {
  readSizes.push_back(aLength);
  if (failReadAt > 0 && static_cast<int>(readSizes.size()) == failReadAt) Error(9);
  if (aLength <= 0) return 0;
  int n = std::min(Capped(aLength), GetLength() - pos);
  std::memcpy(aPtr, content.data() + pos, n);
  pos += n;
  return n;
}

void TestStream_t::Seek(PortStreamUnit_t aPos, int aWherence) {
  long long base = aWherence == 0 ? 0 : aWherence == 1 ? pos : GetLength();
  long long target = base + aPos;
  if (aWherence < 0 || aWherence > 2 || target < 0 || target > GetLength()) Error(13);
  pos = static_cast<PortStreamUnit_t>(target);
}

#include "port/src/stream.h"

#include <algorithm>
#include <cfloat>
#include <cstdio>
#include <cstring>
#include <memory>

#include "port/src/error.h"

namespace {
const PortStreamUnit_t kCopyPiece = 4096;
const PortStreamUnit_t kFillPiece = 256;
// "%f" prints every integer digit: -DBL_MAX needs a sign, DBL_MAX_10_EXP + 1 digits, the
// point and six decimals. A fixed 128-byte buffer would overflow for large values.
const int kFloatTextSize = 1 + (DBL_MAX_10_EXP + 1) + 1 + 6 + 1;
}  // namespace

void PortStream_t::SizeRequest(PortStreamUnit_t) {}

const PortString_t& PortStream_t::GetDescription() const {
  static const PortString_t description("<PortStream_t super-class>");
  return description;
}

void PortStream_t::CheckWritable() {
  if (!CanWrite()) Error(10);
}

void PortStream_t::CheckReadable() {
  if (!CanRead()) Error(11);
}

void PortStream_t::Error(int aErrorNum) {
  PortString_t& cause = PortErrorGetStr();
  cause = GetDescription() + PortErrorGetMsg(aErrorNum);
  PortErrorThrow(cause);
}

void PortStream_t::WriteBuffer(const void* aPtr, PortStreamUnit_t aLength) {
  CheckWritable();
  if (Write(aPtr, aLength) != aLength) Error(8);
}

void PortStream_t::ReadBuffer(void* aPtr, PortStreamUnit_t aLength) {
  CheckReadable();
  if (Read(aPtr, aLength) != aLength) Error(9);
}

void PortStream_t::CopyFrom(PortStream_t& aSrc, PortStreamUnit_t aLeng) {
  if (aLeng <= 0) return;
  const PortStreamUnit_t piece_size = std::min(kCopyPiece, aLeng);
  std::unique_ptr<unsigned char[]> buffer(new unsigned char[piece_size]);
  for (PortStreamUnit_t remain = aLeng; remain > 0;) {
    const PortStreamUnit_t l = std::min(piece_size, remain);
    aSrc.ReadBuffer(buffer.get(), l);
    WriteBuffer(buffer.get(), l);
    remain -= l;
  }
}

void PortStream_t::CopyFrom(PortStream_t& aSrc) {
  CopyFrom(aSrc, aSrc.GetLength() - aSrc.GetPosition());
}

void PortStream_t::FillChar(PortStreamUnit_t aLength, char aCode) {
  if (aLength <= 0) return;
  char buffer[kFillPiece];
  std::memset(buffer, aCode, std::min(kFillPiece, aLength));
  for (PortStreamUnit_t remain = aLength; remain > 0;) {
    const PortStreamUnit_t l = std::min(kFillPiece, remain);
    WriteBuffer(buffer, l);
    remain -= l;
  }
}

PortStream_t& PortStream_t::operator<<(const PORT_char_t* aStr) {
  const size_t length = std::strlen(aStr);
  if (length > 0) WriteBuffer(aStr, static_cast<PortStreamUnit_t>(length));
  return *this;
}

PortStream_t& PortStream_t::operator<<(const unsigned char* aStr) {
  return *this << reinterpret_cast<const PORT_char_t*>(aStr);
}

PortStream_t& PortStream_t::operator<<(const signed char* aStr) {
  return *this << reinterpret_cast<const PORT_char_t*>(aStr);
}

PortStream_t& PortStream_t::operator<<(const PortString_t& aStr) {
  if (aStr.GetLength() > 0) WriteBuffer(aStr.GetCharPtr(), aStr.GetLength());
  return *this;
}

PortStream_t& PortStream_t::operator<<(int aIntValue) {
  char text[64];
  const int length = std::snprintf(text, sizeof text, "%d", aIntValue);
  if (length > 0) WriteBuffer(text, length);
  return *this;
}

PortStream_t& PortStream_t::operator<<(unsigned int aUintValue) {
  char text[64];
  const int length = std::snprintf(text, sizeof text, "0x%X", aUintValue);
  if (length > 0) WriteBuffer(text, length);
  return *this;
}

PortStream_t& PortStream_t::operator<<(double aFloatValue) {
  char text[kFloatTextSize];
  const int length = std::snprintf(text, sizeof text, "%f", aFloatValue);
  if (length > 0) WriteBuffer(text, length);
  return *this;
}

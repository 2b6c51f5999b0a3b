// qorExpander_t: the checked decoder. Payload and output pass through two fixed buffers; each
// directive is checked once, as a whole, against what is left of the payload, of realSize and
// of the history, and then copied without further checks.
#include <cstring>

#include "port/src/error.h"
#include "qorCompress/src/qorCompress.h"

namespace {

const int kInvalidFormat = 15;
const int kHistory = 1024;                 // the farthest an sd copy may reach back
const int kMaxDirective = 3 + 0xFFFF;      // directive byte, long length, 65535 data bytes
const int kMaxOutput = 2 * 0xFFFF;         // a word directive of 65535 units
const int kInBlock = 0x40000;
const int kOutBlock = 0x40000;
const int kShort = 32;                     // lengths copied with fixed-size moves
const int kSlack = 64;                     // fixed-size moves may run this far past their end

[[noreturn]] void invalid() { PortErrorThrow(kInvalidFormat); }

inline uint64_t load64(const unsigned char* aPtr) {
  uint64_t v;
  std::memcpy(&v, aPtr, sizeof v);
  return v;
}

inline void store64(unsigned char* aPtr, uint64_t aValue) { std::memcpy(aPtr, &aValue, sizeof aValue); }

// Copies aLeng bytes from aOffset back; an overlapping copy repeats the last aOffset bytes.
// Moves of up to 16 bytes never read what they write, since each is no longer than the
// offset. May write up to 15 bytes past the end.
inline void sdCopy(unsigned char* aDst, int aOffset, int aLeng) {
  const unsigned char* src = aDst - aOffset;
  if (aOffset >= 16) {
    for (int k = 0; k < aLeng; k += 16) std::memcpy(aDst + k, src + k, 16);
  } else if (aOffset >= 8) {
    for (int k = 0; k < aLeng; k += 8) std::memcpy(aDst + k, src + k, 8);
  } else if (aOffset == 1) {
    std::memset(aDst, src[0], aLeng);
  } else {
    for (int k = 0; k < aLeng; ++k) aDst[k] = src[k];
  }
}

// Fills aLeng bytes with aValue; may write up to kShort - 1 bytes past the end.
inline void fill(unsigned char* aDst, unsigned char aValue, int aLeng) {
  if (aLeng <= kShort) {
    std::memset(aDst, aValue, kShort);
  } else {
    std::memset(aDst, aValue, aLeng);
  }
}

// A buffer owned for one expand() call.
struct ByteBuffer_t {
  unsigned char* const p;
  explicit ByteBuffer_t(int aSize) : p(new unsigned char[aSize]) {}
  ~ByteBuffer_t() { delete[] p; }
  ByteBuffer_t(const ByteBuffer_t&) = delete;
  ByteBuffer_t& operator=(const ByteBuffer_t&) = delete;
};

}  // namespace

void qorExpander_t::expand(PortStream_t& dstStrm, PortStream_t& srcStrm, int payloadLength,
                           int realSize) {
  if (payloadLength < 0 || realSize < 0) invalid();
  if (payloadLength == 0) {
    if (realSize != 0) invalid();
    return;
  }
  // Neither buffer is larger than the payload or the output needs.
  const int in_size = payloadLength < kInBlock + kMaxDirective ? payloadLength : kInBlock + kMaxDirective;
  const int out_size = realSize < kOutBlock + kMaxOutput ? realSize : kOutBlock + kMaxOutput;
  ByteBuffer_t in_buf(in_size + kSlack);
  ByteBuffer_t out_buf(kHistory + out_size + kSlack);
  int in_remain = payloadLength;         // payload bytes not yet read into in_buf.p
  const unsigned char* in = in_buf.p;
  const unsigned char* in_end = in_buf.p;
  unsigned char* const out_start = out_buf.p + kHistory;
  unsigned char* out = out_start;
  unsigned char* out_flushed = out_start;  // bytes before it have gone to dstStrm
  int64_t out_total = 0;                   // bytes expanded before out_start
  bool ended = false;
  while (!ended) {
    if (in_end - in < kMaxDirective && in_remain > 0) {
      const int kept = static_cast<int>(in_end - in);
      std::memmove(in_buf.p, in, kept);
      const int count = in_size - kept < in_remain ? in_size - kept : in_remain;
      srcStrm.ReadBuffer(in_buf.p + kept, count);
      in_remain -= count;
      in = in_buf.p;
      in_end = in_buf.p + kept + count;
    }
    if (out - out_start >= kOutBlock) {
      dstStrm.WriteBuffer(out_flushed, static_cast<int>(out - out_flushed));
      std::memmove(out_buf.p, out - kHistory, kHistory);
      out_total += out - out_start;
      out = out_flushed = out_start;
    }
    // Up to these limits neither a refill nor a flush is due.
    const unsigned char* const in_stop = in_remain > 0 ? in_end - kMaxDirective : in_end;
    unsigned char* const out_stop = out_start + kOutBlock;
    do {
      if (in == in_end) invalid();
      const int directive = *in++;
      if (directive == 0xFF) {
        ended = true;
        break;
      }
      const int code = directive >> 5;
      int leng = directive & 0x1F;
      if (leng == 0) {
        if (in_end - in < 2) invalid();
        leng = in[0] | in[1] << 8;
        in += 2;
        if (leng == 0) invalid();
      }
      const int64_t produced = out_total + (out - out_start);
      const int out_leng = code == 5 ? 2 * leng : leng;
      if (out_leng > realSize - produced) invalid();
      const int64_t avail = in_end - in;
      if (code == 0 || code == 3 || code == 4) {
        // Normal data and sd copies are both copies, from the payload or from the output;
        // one path for both keeps the kind out of the branches of the common short case.
        const bool is_sd = code != 0;
        const int operand = is_sd ? code - 2 : leng;  // payload bytes after the length
        if (avail < operand) invalid();
        // The buffer's slack makes reading a second offset byte harmless.
        const int offset = is_sd ? (in[0] | (code == 4 ? in[1] << 8 : 0)) : kHistory + 1;
        if (is_sd && (offset == 0 || offset > kHistory || offset > produced)) invalid();
        const unsigned char* src = is_sd ? out - offset : in;
        in += operand;
        if (leng <= kShort && offset >= 16) {
          // Each 16-byte move reads only bytes already final, as none is longer than the
          // offset; the slack of both buffers takes the overrun.
          std::memcpy(out, src, 16);
          std::memcpy(out + 16, src + 16, 16);
        } else if (is_sd) {
          sdCopy(out, offset, leng);
        } else {
          std::memcpy(out, src, leng);
        }
      } else {
        switch (code) {
          case 1:
            fill(out, 0, leng);
            break;
          case 2:
            if (avail < 1) invalid();
            fill(out, *in++, leng);
            break;
          case 5:
            if (avail < leng) invalid();
            for (int k = 0; k < leng; ++k) {
              out[2 * k] = in[k];
              out[2 * k + 1] = 0;
            }
            in += leng;
            break;
          default:
            invalid();
        }
      }
      out += out_leng;
    } while (in <= in_stop && out < out_stop);
  }
  if (in != in_end || in_remain != 0) invalid();
  if (out_total + (out - out_start) != realSize) invalid();
  if (out > out_flushed) dstStrm.WriteBuffer(out_flushed, static_cast<int>(out - out_flushed));
}

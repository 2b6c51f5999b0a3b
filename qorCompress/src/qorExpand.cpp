// qorExpander_t: the checked decoder. Payload and output pass through two fixed buffers; each
// directive is checked once, as a whole, against what is left of the payload, of realSize and
// of the history, and then copied without further checks.
//
// Two paths share the work. The fast one takes the short directives (at most 32 bytes of
// output) that lie well inside both buffers, without a branch on their kind: a table indexed
// by the directive byte gives the lengths, and every kind becomes "load 16 bytes, shuffle,
// store 32". Everything else (long forms, block and payload ends, the first 1024 output
// bytes, any malformed directive) goes through the checked one, one directive at a time.
#include <cstdint>
#include <cstring>

#include "port/src/error.h"
#include "qorCompress/src/qorCompress.h"

#if defined(__x86_64__) || defined(__i386__)
#include <immintrin.h>
#define QOR_EXPAND_SHUFFLE 1
#endif

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

// Copies aLeng bytes from aOffset back; an overlapping copy repeats the last aOffset bytes.
// Below 16 the first period-multiple of at least 16 bytes goes byte by byte; from there on
// 16-byte moves at that distance never read what they write. May write up to 15 bytes past
// the end.
inline void sdCopy(unsigned char* aDst, int aOffset, int aLeng) {
  const unsigned char* src = aDst - aOffset;
  int dist = aOffset;
  int k = 0;
  if (aOffset < 16) {
    dist = aOffset * ((16 + aOffset - 1) / aOffset);
    for (; k < dist && k < aLeng; ++k) aDst[k] = src[k];
  }
  for (; k < aLeng; k += 16) std::memcpy(aDst + k, aDst + k - dist, 16);
}

// Fills aLeng bytes with aValue; may write up to kShort - 1 bytes past the end.
inline void fill(unsigned char* aDst, unsigned char aValue, int aLeng) {
  std::memset(aDst, aValue, aLeng <= kShort ? kShort : aLeng);
}

// Spreads aLeng low bytes into 16-bit little-endian units. The buffers are distinct, which
// lets the compiler vectorise the loop.
inline void spreadWords(unsigned char* __restrict aDst, const unsigned char* __restrict aSrc,
                        int aLeng) {
  for (int k = 0; k < aLeng; ++k) {
    aDst[2 * k] = aSrc[k];
    aDst[2 * k + 1] = 0;
  }
}

// Payload bytes the directive at aIn takes; more than the bytes left when its length is cut.
int64_t directiveSize(const unsigned char* aIn, const unsigned char* aEnd) {
  if (aEnd - aIn < 3) return 3;
  const int code = aIn[0] >> 5;
  int leng = aIn[0] & 0x1F;
  int head = 1;
  if (leng == 0) {
    leng = aIn[1] | aIn[2] << 8;
    head = 3;
  }
  const int operand[] = {leng, 0, 1, 1, 2, leng, 0, 0};
  return head + operand[code];
}

// Expands the directive at `in` with every check; returns false at the end mark. `produced`
// counts the bytes before `out`; the buffer keeps kHistory of them before `out`.
bool checkedDirective(const unsigned char*& in, const unsigned char* in_end, unsigned char*& out,
                      int64_t produced, int64_t realSize) {
  if (in == in_end) invalid();
  const int directive = *in++;
  if (directive == 0xFF) return false;
  const int code = directive >> 5;
  int leng = directive & 0x1F;
  if (leng == 0) {
    if (in_end - in < 2) invalid();
    leng = in[0] | in[1] << 8;
    in += 2;
    if (leng == 0) invalid();
  }
  const int out_leng = code == 5 ? 2 * leng : leng;
  if (out_leng > realSize - produced) invalid();
  const int64_t avail = in_end - in;
  switch (code) {
    case 0:
      if (avail < leng) invalid();
      std::memcpy(out, in, leng);
      in += leng;
      break;
    case 1:
      fill(out, 0, leng);
      break;
    case 2:
      if (avail < 1) invalid();
      fill(out, *in++, leng);
      break;
    case 3:
    case 4: {
      if (avail < code - 2) invalid();
      const int offset = code == 3 ? in[0] : in[0] | in[1] << 8;
      in += code - 2;
      if (offset == 0 || offset > kHistory || offset > produced) invalid();
      sdCopy(out, offset, leng);
      break;
    }
    case 5:
      if (avail < leng) invalid();
      spreadWords(out, in, leng);
      in += leng;
      break;
    default:
      invalid();
  }
  out += out_leng;
  return true;
}

#ifdef QOR_EXPAND_SHUFFLE

// What the fast path needs to know of a directive byte.
struct FastOp_t {
  int32_t outLeng;   // kNotFast for what the checked path must take
  uint16_t offMask;  // the offset's bytes after the directive byte; 0 for kinds without one
  uint8_t shape;     // index into the shuffles; sd copies add min(offset, 16)
};

const int32_t kNotFast = 1 << 30;  // larger than any room the fast path is given

// Shapes: 1-15 repeat the first n loaded bytes (sd copies from a near offset, rle as n = 1);
// 16 copies 32 bytes as they are; 17 writes zeros; 18 spreads 16 bytes into 16-bit units.
const int kDirect = 16;
const int kZeros = 17;
const int kWords = 18;
const int kShapes = 19;

struct FastTables_t {
  // First, and apart from the rest: the serial chain of the fast path is "load the directive
  // byte, load its payload length, advance", and a plain byte index into the table's start
  // takes a cycle less to address than a field of a larger entry.
  uint8_t inLeng[256];
  FastOp_t op[256];
  unsigned char low[kShapes][16];   // shuffle for the first 16 bytes written
  unsigned char high[kShapes][16];  // shuffle for the second 16; 0x80 yields 0
  unsigned char zeros[16];
  FastTables_t() : inLeng(), op(), low(), high(), zeros() {
    for (int b = 0; b < 256; ++b) {
      const int code = b >> 5;
      const int leng = b & 0x1F;
      FastOp_t& o = op[b];
      o.outLeng = kNotFast;
      o.offMask = 0;
      inLeng[b] = 1;
      o.shape = kZeros;
      if (leng == 0 || code > 5 || (code == 5 && 2 * leng > kShort)) continue;
      o.outLeng = code == 5 ? 2 * leng : leng;
      const uint8_t in_leng[] = {static_cast<uint8_t>(1 + leng), 1, 2, 2, 3,
                                 static_cast<uint8_t>(1 + leng)};
      const uint8_t shape[] = {kDirect, kZeros, 1, 0, 0, kWords};
      inLeng[b] = in_leng[code];
      o.shape = shape[code];
      o.offMask = code == 3 ? 0xFF : code == 4 ? 0xFFFF : 0;
    }
    for (int s = 0; s < kShapes; ++s) {
      for (int i = 0; i < 16; ++i) {
        unsigned char lo = 0x80;
        unsigned char hi = 0x80;
        if (s >= 1 && s < kDirect) {
          lo = static_cast<unsigned char>(i % s);
          hi = static_cast<unsigned char>((16 + i) % s);
        } else if (s == kDirect) {
          lo = static_cast<unsigned char>(i);
        } else if (s == kWords && i % 2 == 0) {
          lo = static_cast<unsigned char>(i / 2);
          hi = static_cast<unsigned char>(8 + i / 2);
        }
        low[s][i] = lo;
        high[s][i] = hi;
      }
    }
  }
};

const FastTables_t kFast;

// Expands directives from `in` while each one starts before in_stop (so that it and its
// 33-byte reads lie in the payload buffer) and ends at or before out_stop (its 32-byte writes
// then fall into the slack). Needs kHistory bytes of history before `out`. Returns at the
// first directive it leaves to the checked path.
__attribute__((target("ssse3"))) const unsigned char* fastRun(const unsigned char* in,
                                                              const unsigned char* in_stop,
                                                              unsigned char*& out_ref,
                                                              unsigned char* out_stop) {
  unsigned char* out = out_ref;
  while (in < in_stop) {
    const int directive = in[0];
    const FastOp_t op = kFast.op[directive];
    const uint32_t offset = (in[1] | in[2] << 8) & op.offMask;
    const bool is_sd = op.offMask != 0;
    if ((out_stop - out < op.outLeng) | (is_sd & (offset - 1 >= static_cast<uint32_t>(kHistory))))
      break;
    const unsigned shape = op.shape + (offset < 16 ? offset : 16);
    const unsigned char* src = is_sd ? out - offset : in + 1;
    const __m128i v = _mm_loadu_si128(reinterpret_cast<const __m128i*>(src));
    _mm_storeu_si128(reinterpret_cast<__m128i*>(out),
                     _mm_shuffle_epi8(v, _mm_loadu_si128(reinterpret_cast<const __m128i*>(
                                             kFast.low[shape]))));
    // Loaded after the first store: a copy from 16 to 31 bytes back reads some of it.
    const unsigned char* src2 = shape == kDirect ? src + 16 : kFast.zeros;
    const __m128i v2 = _mm_or_si128(
        _mm_shuffle_epi8(v, _mm_loadu_si128(reinterpret_cast<const __m128i*>(kFast.high[shape]))),
        _mm_loadu_si128(reinterpret_cast<const __m128i*>(src2)));
    _mm_storeu_si128(reinterpret_cast<__m128i*>(out + 16), v2);
    in += kFast.inLeng[directive];
    out += op.outLeng;
  }
  out_ref = out;
  return in;
}

// Initialised after kFast: an expand() run before either (from another static initialiser)
// sees false and takes the checked path only.
const bool kHaveShuffle = [] {
  __builtin_cpu_init();
  return __builtin_cpu_supports("ssse3") != 0;
}();

#endif

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
  for (;;) {
    if (out - out_start >= kOutBlock) {
      dstStrm.WriteBuffer(out_flushed, static_cast<int>(out - out_flushed));
      std::memmove(out_buf.p, out - kHistory, kHistory);
      out_total += out - out_start;
      out = out_flushed = out_start;
    }
#ifdef QOR_EXPAND_SHUFFLE
    if (kHaveShuffle && out_total + (out - out_start) >= kHistory && in_end - in > kShort) {
      const int64_t room = realSize - out_total < kOutBlock ? realSize - out_total : kOutBlock;
      in = fastRun(in, in_end - kShort, out, out_start + room);
    }
#endif
    // Refilled only when the directive is not whole in the buffer, so that little is moved.
    if (in_remain > 0 && (in_end - in <= kShort || directiveSize(in, in_end) > in_end - in)) {
      const int kept = static_cast<int>(in_end - in);
      std::memmove(in_buf.p, in, kept);
      const int count = in_size - kept < in_remain ? in_size - kept : in_remain;
      srcStrm.ReadBuffer(in_buf.p + kept, count);
      in_remain -= count;
      in = in_buf.p;
      in_end = in_buf.p + kept + count;
    }
    const int64_t produced = out_total + (out - out_start);
    if (!checkedDirective(in, in_end, out, produced, realSize)) break;
  }
  if (in != in_end || in_remain != 0) invalid();
  if (out_total + (out - out_start) != realSize) invalid();
  if (out > out_flushed) dstStrm.WriteBuffer(out_flushed, static_cast<int>(out - out_flushed));
}

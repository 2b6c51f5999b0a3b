#include "qorCompress/src/qorCompress.h"

#include <cstring>

#include "qorCompress/src/qorMatchFinder.h"

namespace {

const int kDstSize = 4096;
const int kWindowSize = 0x20000;
const int kRefillAt = 0xFFFF;
const int kHistory = 0x2000;
const int kMaxMatch = 0x800;
const int kNearMax = 0xFF;
const int kShortMax = 0x1F;
const int kMaxNormal = 0xE000;
const int kMaxRun = 0xFFFF;        // zero and rle runs in bytes, word runs in units
const int kMaxWordBytes = 2 * kMaxRun;
const int kRunProbe = 0x10000;     // runs are measured this far at most: past every limit

const unsigned char kNormal = 0x00;
const unsigned char kZero = 0x20;
const unsigned char kRle = 0x40;
const unsigned char kNearSd = 0x60;
const unsigned char kFarSd = 0x80;
const unsigned char kWord = 0xA0;
const unsigned char kEndMark = 0xFF;

const bool kLittleEndian = __BYTE_ORDER__ == __ORDER_LITTLE_ENDIAN__;

enum Kind_t { kNone, kKindZero, kKindRle, kKindSd, kKindWord };

inline int zeroScore(int aLeng) { return aLeng <= kShortMax ? aLeng - 1 : aLeng - 2; }
inline int rleScore(int aLeng) { return aLeng <= kShortMax ? aLeng - 2 : aLeng - 3; }
inline int sdScore(int aLeng) { return aLeng <= kShortMax ? aLeng - 2 : aLeng - 3; }
inline int wordScore(int aUnits) { return aUnits <= kShortMax + 1 ? aUnits - 1 : aUnits - 2; }

// The shortest sd match that, at a near offset, scores above aBeat and at least aReach.
inline int minSdLeng(int aBeat, int aReach) {
  const int target = aBeat + 1 > aReach ? aBeat + 1 : aReach;
  return target + 2 <= kShortMax ? target + 2 : target + 3;
}

// Frees the window however compress() ends, so that an error passes out unchanged and the
// compressor can serve the next call.
struct WindowRelease_t {
  unsigned char*& window;
  PortStream_t*& dst;
  qorMatchFinder_t*& finder;
  ~WindowRelease_t() {
    delete[] window;
    window = nullptr;
    dst = nullptr;
    finder = nullptr;
  }
};

}  // namespace

qorCompressor_t::qorCompressor_t() : dstStrm_(nullptr), buffer_(nullptr), finder_(nullptr) {}

qorCompressor_t::~qorCompressor_t() {}

void qorCompressor_t::compress(PortStream_t& dstStrm, PortStream_t& srcStrm, int length) {
  if (length <= 0) return;
  dstStrm_ = &dstStrm;
  const int window_size = length < kWindowSize ? length : kWindowSize;
  buffer_ = new unsigned char[window_size];
  WindowRelease_t release{buffer_, dstStrm_, finder_};
  srcStrm.ReadBuffer(buffer_, window_size);
  srcLimit_ = window_size;
  srcIndex_ = 0;
  srcRemain_ = length - window_size;
  dstIndex_ = 0;
  normalIndex_ = 0;
  sdOffset_ = 0;
  srcBase_ = 0;
  runFrom_ = runEnd_ = 0;
  runOpen_ = false;
  wordFrom_ = wordEnd_ = 0;
  wordLimit_ = -1;
  qorMatchFinder_t finder;
  finder_ = &finder;
  finder.setWindow(buffer_, srcBase_, srcLimit_);

  for (;;) {
    if (srcRemain_ > 0 && srcLimit_ - srcIndex_ <= kRefillAt) {
      refill(srcStrm);
      finder.setWindow(buffer_, srcBase_, srcLimit_);
    } else if (srcRemain_ == 0 && srcIndex_ == srcLimit_) {
      break;
    }
    // Steps until the next refill point cannot change the window.
    const int stop = srcRemain_ > 0 ? srcLimit_ - kRefillAt : srcLimit_;
    while (srcIndex_ < stop) {
      // The skipper's own first test, here too to save a call where it fails.
      if (srcLimit_ - srcIndex_ <= 3 || !qorMatchFinder_t::mayBeLiteral(buffer_ + srcIndex_)) {
        step();
        continue;
      }
      const int normal_stop = normalIndex_ + kMaxNormal;
      const int skip_stop = stop < normal_stop ? stop : normal_stop;
      int near_offset;
      srcIndex_ = finder.skipLiterals(srcIndex_, skip_stop, near_offset);
      if (srcIndex_ == skip_stop) {
        if (srcIndex_ - normalIndex_ >= kMaxNormal) flushNormalData();
      } else if (near_offset > 0) {
        // The skipper has done the search: the nearest 3 bytes within 255 and nothing longer.
        sdOffset_ = near_offset;
        putSdStep(3);
      } else if (near_offset < 0) {
        sdStep();
      }
    }
  }
  flushNormalData();
  putData(kEndMark);
  flushDstBuff();
}

void qorCompressor_t::refill(PortStream_t& srcStrm) {
  // Keep 8192 bytes of history for the search, and every pending normal byte.
  const int drop = srcIndex_ - kHistory < normalIndex_ ? srcIndex_ - kHistory : normalIndex_;
  std::memmove(buffer_, buffer_ + drop, srcLimit_ - drop);
  srcLimit_ -= drop;
  srcIndex_ -= drop;
  normalIndex_ -= drop;
  srcBase_ += drop;
  const int count = kWindowSize - srcLimit_ < srcRemain_ ? kWindowSize - srcLimit_ : srcRemain_;
  srcStrm.ReadBuffer(buffer_ + srcLimit_, count);
  srcLimit_ += count;
  srcRemain_ -= count;
}

void qorCompressor_t::step() {
  int best = 0;
  Kind_t kind = kNone;
  const int run = runLeng();
  const int zero = getZeroLeng(run);
  if (zero > 0) {
    best = zeroScore(zero);
    kind = kKindZero;
  }
  const int rle = getRleLeng(run);
  if (rle > 0 && rleScore(rle) > best) {
    best = rleScore(rle);
    kind = kKindRle;
  }
  // The word candidate is measured before the search: a match that cannot reach its score
  // loses to it, so the search need not look for one.
  const int word = getWordLeng();
  const int word_score = word > 0 ? wordScore(word / 2) : 0;
  const int sd = getSdLeng(run, minSdLeng(best, word_score));
  if (sd > 0) {
    int score = sdScore(sd);
    if (sdOffset_ > kNearMax) --score;
    if (score > best) {
      best = score;
      kind = kKindSd;
    }
  }
  if (word > 0 && word_score > best) kind = kKindWord;

  if (kind == kNone) {
    ++srcIndex_;
    if (srcIndex_ - normalIndex_ >= kMaxNormal) flushNormalData();
    return;
  }
  flushNormalData();
  const unsigned char* cur = buffer_ + srcIndex_;
  int covered;
  switch (kind) {
    case kKindZero:
      putDirective(kZero, zero);
      covered = zero;
      break;
    case kKindRle:
      putDirective(kRle, rle);
      putData(cur[0]);
      covered = rle;
      break;
    case kKindSd:
      putSd(sd);
      covered = sd;
      break;
    default:
      putDirective(kWord, word / 2);
      for (int i = 0; i < word; i += 2) putData(cur[i]);
      covered = word;
      break;
  }
  srcIndex_ += covered;
  normalIndex_ = srcIndex_;
}

// A step where the skipper stopped at a match of 4 or more at a position that starts no
// zero, rle or word run: only an sd match can be chosen, so the other measures are left out.
void qorCompressor_t::sdStep() {
  const unsigned char* cur = buffer_ + srcIndex_;
  const int sd = getSdLeng(cur[1] == cur[0] ? 2 : 1, minSdLeng(0, 0));
  if (sd > 0 && sdScore(sd) - (sdOffset_ > kNearMax ? 1 : 0) > 0) {
    putSdStep(sd);
    return;
  }
  ++srcIndex_;
  if (srcIndex_ - normalIndex_ >= kMaxNormal) flushNormalData();
}

// Writes the sd directive that the step at srcIndex_ chose, after the pending normal run.
inline void qorCompressor_t::putSdStep(int leng) {
  flushNormalData();
  putSd(leng);
  srcIndex_ += leng;
  normalIndex_ = srcIndex_;
}

inline void qorCompressor_t::putSd(int leng) {
  if (sdOffset_ > kNearMax) {
    putDirective(kFarSd, leng);
    putData(static_cast<unsigned char>(sdOffset_));
    putData(static_cast<unsigned char>(sdOffset_ >> 8));
  } else {
    putDirective(kNearSd, leng);
    putData(static_cast<unsigned char>(sdOffset_));
  }
}

// Bytes equal to the one at srcIndex_ from there on, at most kRunProbe.
inline int qorCompressor_t::runLeng() {
  const unsigned char* cur = buffer_ + srcIndex_;
  if (srcIndex_ + 1 >= srcLimit_ || cur[1] != cur[0]) return 1;
  return longRunLeng();
}

// A run is scanned once and remembered, so that steps inside it do not scan it again.
int qorCompressor_t::longRunLeng() {
  const unsigned char* cur = buffer_ + srcIndex_;
  const int abs = srcBase_ + srcIndex_;
  if (abs < runFrom_ || abs >= runEnd_) {
    runFrom_ = abs;
    runEnd_ = abs + 1;
    runOpen_ = true;
  }
  if (runOpen_ && runEnd_ - abs < kRunProbe) {
    const int stop = srcLimit_ - srcIndex_ < kRunProbe ? srcLimit_ : srcIndex_ + kRunProbe;
    int i = runEnd_ - srcBase_;
    const unsigned char b = cur[0];
    uint64_t pattern = b * 0x0101010101010101ull;
    while (i + 8 <= stop) {
      uint64_t v;
      std::memcpy(&v, buffer_ + i, sizeof v);
      if (v != pattern) {
        // The first differing byte, in memory order.
        const uint64_t diff = v ^ pattern;
        i += (kLittleEndian ? __builtin_ctzll(diff) : __builtin_clzll(diff)) >> 3;
        break;
      }
      i += 8;
    }
    if (i + 8 > stop) {
      while (i < stop && buffer_[i] == b) ++i;
    }
    runEnd_ = srcBase_ + i;
    runOpen_ = i == stop && !(srcRemain_ == 0 && stop == srcLimit_);
  }
  return runEnd_ - abs < kRunProbe ? runEnd_ - abs : kRunProbe;
}

inline int qorCompressor_t::getZeroLeng(int run) {
  if (buffer_[srcIndex_] != 0 || run < 2) return 0;
  return run < kMaxRun ? run : kMaxRun;
}

inline int qorCompressor_t::getRleLeng(int run) {
  if (buffer_[srcIndex_] == 0 || run < 3) return 0;
  return run < kMaxRun ? run : kMaxRun;
}

inline int qorCompressor_t::getSdLeng(int run, int minLeng) {
  if (minLeng > kMaxMatch) return 0;
  return finder_->find(srcIndex_, run, minLeng, sdOffset_);
}

inline int qorCompressor_t::getWordLeng() {
  const int cur = srcIndex_;
  if (buffer_[cur] == 0 || cur + 2 > srcLimit_ || buffer_[cur + 1] != 0) return 0;
  return wordWalk();
}

// The walk over units with a zero high byte: from any unit boundary inside an earlier walk it
// stops where that walk stopped, so the stop is remembered. A walk cut by the window's end
// goes on when the window has grown.
int qorCompressor_t::wordWalk() {
  const int abs = srcBase_ + srcIndex_;
  if (abs < wordFrom_ || abs >= wordEnd_ || ((abs - wordFrom_) & 1) != 0) {
    wordFrom_ = abs;
    wordEnd_ = abs;
    wordLimit_ = 0;  // no window ends at 0: walk
  }
  if (wordLimit_ >= 0 && wordLimit_ != srcBase_ + srcLimit_) {
    int i = wordEnd_ - srcBase_;
    while (i + 2 <= srcLimit_ && buffer_[i + 1] == 0) {
      if (buffer_[i] == 0 && buffer_[i - 2] == 0) {
        i -= 2;
        break;
      }
      i += 2;
    }
    wordLimit_ = i + 2 > srcLimit_ ? srcBase_ + srcLimit_ : -1;
    wordEnd_ = srcBase_ + i;
  }
  const int leng = wordEnd_ - abs < kMaxWordBytes ? wordEnd_ - abs : kMaxWordBytes;
  return leng < 3 ? 0 : leng;
}

inline void qorCompressor_t::putData(unsigned char d) {
  dstBuffer_[dstIndex_++] = d;
  if (dstIndex_ == kDstSize) flushDstBuff();
}

inline void qorCompressor_t::putDirective(unsigned char directive, int leng) {
  if (leng <= kShortMax) {
    putData(static_cast<unsigned char>(directive | leng));
  } else {
    putData(directive);
    putData(static_cast<unsigned char>(leng));
    putData(static_cast<unsigned char>(leng >> 8));
  }
}

void qorCompressor_t::putBuff(const void* buff, int leng) {
  const unsigned char* src = static_cast<const unsigned char*>(buff);
  while (leng > 0) {
    const int room = kDstSize - dstIndex_;
    const int piece = leng < room ? leng : room;
    std::memcpy(dstBuffer_ + dstIndex_, src, piece);
    dstIndex_ += piece;
    src += piece;
    leng -= piece;
    if (dstIndex_ == kDstSize) flushDstBuff();
  }
}

void qorCompressor_t::flushDstBuff() {
  if (dstIndex_ > 0) {
    dstStrm_->WriteBuffer(dstBuffer_, dstIndex_);
    dstIndex_ = 0;
  }
}

inline void qorCompressor_t::flushNormalData() {
  const int leng = srcIndex_ - normalIndex_;
  if (leng <= 0) return;
  // Most runs are short: with room on both sides, one fixed-size copy (the bytes past the
  // run are overwritten later or never handed out).
  if (leng <= kShortMax && dstIndex_ + 1 + kShortMax + 1 < kDstSize &&
      normalIndex_ + kShortMax + 1 <= srcLimit_) {
    dstBuffer_[dstIndex_] = static_cast<unsigned char>(kNormal | leng);
    std::memcpy(dstBuffer_ + dstIndex_ + 1, buffer_ + normalIndex_, kShortMax + 1);
    dstIndex_ += 1 + leng;
  } else {
    putDirective(kNormal, leng);
    putBuff(buffer_ + normalIndex_, leng);
  }
  normalIndex_ = srcIndex_;
}

#include "qorCompress/src/qorMatchFinder.h"

#include <cstring>

namespace {

const int kMaxOffset = 1024;
const int kMaxMatch = 2048;
const int kNearMax = 255;
const bool kLittleEndian = __BYTE_ORDER__ == __ORDER_LITTLE_ENDIAN__;
// Only the last 1024 positions (255 for the 3-byte table) are ever live, so the tables stay
// small; the 4-byte one is sparse enough that chains rarely hold other bytes.
const int kBits4 = 13;
const int kBits3 = 10;
const int kBits8 = 12;
// One search in kSampleEvery has its 4-byte chain counted (at most kSampleCap entries); every
// kDecideEvery searches the average decides whether 8-byte chains are kept.
const int kSampleEvery = 64;
const int kSampleCap = 64;
#ifdef QOR_FLIP_CHAINS
const int kDecideEvery = kSampleEvery;  // test builds switch at every decision, and decide often
#else
const int kDecideEvery = 4096;
#endif
const int kOn8 = 24;
const int kOff8 = 12;

// Little-endian by construction; compilers make one load of it.
inline uint32_t load32(const unsigned char* aPtr) {
  return static_cast<uint32_t>(aPtr[0]) | static_cast<uint32_t>(aPtr[1]) << 8 |
         static_cast<uint32_t>(aPtr[2]) << 16 | static_cast<uint32_t>(aPtr[3]) << 24;
}

inline uint32_t load24(const unsigned char* aPtr) {
  return static_cast<uint32_t>(aPtr[0]) | static_cast<uint32_t>(aPtr[1]) << 8 |
         static_cast<uint32_t>(aPtr[2]) << 16;
}

inline uint64_t load64(const unsigned char* aPtr) {
  uint64_t v;
  std::memcpy(&v, aPtr, sizeof v);
  return v;
}

inline int hashOf(uint32_t aValue, int aBits) {
  return static_cast<int>((aValue * 2654435761u) >> (32 - aBits));
}

inline int hash8Of(uint64_t aValue) {
  return static_cast<int>((aValue * 0x9E3779B185EBCA87ull) >> (64 - kBits8));
}

}  // namespace

qorMatchFinder_t::qorMatchFinder_t()
    : window_(nullptr), base_(0), limit_(0), nextInsert_(0), runCount_(0), use8_(false),
      searches_(0), sampled_(0) {
  const int run_heads = 1 << kBits3;
  // The 3-byte table has one slot more: the chain of run positions, which no search walks.
  const int heads4 = 1 << kBits4;
  const int heads3 = (1 << kBits3) + 1;
  const int heads8 = 1 << kBits8;
  head4_ = new int[heads4 + kMaxOffset + heads3 + (kNearMax + 1) + run_heads + heads8 + kMaxOffset];
  prev4_ = head4_ + heads4;
  head3_ = prev4_ + kMaxOffset;
  prev3_ = head3_ + heads3;
  headRun_ = prev3_ + (kNearMax + 1);
  head8_ = headRun_ + run_heads;
  prev8_ = head8_ + heads8;
  std::memset(head8_, 0x80, sizeof(int) * heads8);
  // 0x80 bytes make every head a large negative offset: older than any position searched.
  std::memset(head4_, 0x80, sizeof(int) * heads4);
  std::memset(head3_, 0x80, sizeof(int) * heads3);
  std::memset(headRun_, 0xFF, sizeof(int) * run_heads);
}

qorMatchFinder_t::~qorMatchFinder_t() {
  delete[] head4_;
}

void qorMatchFinder_t::setWindow(const unsigned char* aWindow, int aBase, int aLimit) {
  window_ = aWindow;
  base_ = aBase;
  limit_ = aLimit;
}

// Inlined into the searches: it runs between every two of them, mostly over a few positions.
template <bool kUse8>
__attribute__((always_inline)) inline void qorMatchFinder_t::insertPositions(int aAbsCur) {
  int p = nextInsert_ > aAbsCur - kMaxOffset ? nextInsert_ : aAbsCur - kMaxOffset;
  nextInsert_ = aAbsCur;
  // Locals: stores into the tables would otherwise make the compiler reload the members.
  const unsigned char* const window = window_ - base_;  // indexed by absolute offsets
  const int abs_limit = base_ + limit_;
  int* const head4 = head4_;
  int* const prev4 = prev4_;
  int* const head3 = head3_;
  int* const prev3 = prev3_;
  int* const head8 = head8_;
  int* const prev8 = prev8_;
  const int bits4 = kBits4;
  const int bits3 = kBits3;
  // The 4-byte chains need every position of the last 1024 that has 4 bytes, the 3-byte
  // table those of the last 255 that have 3. A position whose first 4 (or 3) bytes are all
  // equal lies in a run; runs are listed once instead (addRun), and such positions enter no
  // 4-byte chain and only the spare slot of the 3-byte table: long runs make no long chains.
  const int stop4 = abs_limit - 3 < aAbsCur ? abs_limit - 3 : aAbsCur;
  const int near_from = aAbsCur - kNearMax;
  const auto insert4 = [&](int aPos, uint32_t aValue) {
    if (aValue == (aValue & 0xFF) * 0x01010101u) {
      // Its ring slot is never read: no chain leads to it.
      if (aPos + 4 < abs_limit && window[aPos + 4] != window[aPos]) {
        addRun(window + aPos + 3, aPos + 4);
      }
      return;
    }
    const int h4 = hashOf(aValue, bits4);
    prev4[aPos & (kMaxOffset - 1)] = head4[h4];
    head4[h4] = aPos;
    if (kUse8 && aPos + 8 <= abs_limit) {
      const int h8 = hash8Of(load64(window + aPos));
      prev8[aPos & (kMaxOffset - 1)] = head8[h8];
      head8[h8] = aPos;
    }
  };
  const int far_stop = near_from < stop4 ? near_from : stop4;
  for (; p < far_stop; ++p) insert4(p, load32(window + p));
  for (; p < stop4; ++p) {
    const uint32_t v = load32(window + p);
    insert4(p, v);
    const uint32_t v3 = v & 0xFFFFFF;
    const int h3 = v3 == (v & 0xFF) * 0x010101u ? 1 << bits3 : hashOf(v3, bits3);
    prev3[p & kNearMax] = head3[h3];
    head3[h3] = p;
  }
  for (; p < aAbsCur; ++p) {
    if (p < near_from || p + 2 >= abs_limit) continue;
    const uint32_t v3 = load24(window + p);
    const int h3 = v3 == (v3 & 0xFF) * 0x010101u ? 1 << bits3 : hashOf(v3, bits3);
    prev3[p & kNearMax] = head3[h3];
    head3[h3] = p;
  }
}

void qorMatchFinder_t::insertRange(int aAbsCur) {
  if (use8_) {
    insertPositions<true>(aAbsCur);
  } else {
    insertPositions<false>(aAbsCur);
  }
}

int qorMatchFinder_t::skipLiterals(int aCur, int aStop, int& aNearOffset) {
  aNearOffset = 0;
  return use8_ ? skipPositions<true>(aCur, aStop, aNearOffset)
               : skipPositions<false>(aCur, aStop, aNearOffset);
}

template <bool kUse8>
int qorMatchFinder_t::skipPositions(int aCur, int aStop, int& aNearOffset) {
  if (nextInsert_ < base_ + aCur) insertPositions<kUse8>(base_ + aCur);
  const unsigned char* const window = window_ - base_;
  int* const head4 = head4_;
  int* const prev4 = prev4_;
  int* const head3 = head3_;
  int* const prev3 = prev3_;
  int* const head8 = head8_;
  int* const prev8 = prev8_;
  const int bits4 = kBits4;
  const int bits3 = kBits3;
  const int abs_limit = base_ + limit_;
  // Four bytes are read from each position.
  const int stop = base_ + (aStop < limit_ - 3 ? aStop : limit_ - 3);
  int abs = base_ + aCur;
  for (; abs < stop; ++abs) {
    const unsigned char* s = window + abs;
    if (!mayBeLiteral(s)) break;
    const uint32_t v = load32(s);
    const int h4 = hashOf(v, bits4);
    const int h3 = hashOf(v & 0xFFFFFF, bits3);
    int j = head4[h4];
    while (j >= abs - kMaxOffset && load32(window + j) != v) j = prev4[j & (kMaxOffset - 1)];
    if (j >= abs - kMaxOffset) {
      aNearOffset = -1;
      break;
    }
    int k = head3[h3];
    while (k >= abs - kNearMax && (load32(window + k) & 0xFFFFFF) != (v & 0xFFFFFF)) {
      k = prev3[k & kNearMax];
    }
    if (k >= abs - kNearMax) {
      aNearOffset = abs - k;
      break;
    }
    prev4[abs & (kMaxOffset - 1)] = head4[h4];
    head4[h4] = abs;
    prev3[abs & kNearMax] = head3[h3];
    head3[h3] = abs;
    if (kUse8 && abs + 8 <= abs_limit) {
      const int h8 = hash8Of(load64(s));
      prev8[abs & (kMaxOffset - 1)] = head8[h8];
      head8[h8] = abs;
    }
  }
  nextInsert_ = abs;
  return abs - base_;
}

// Where the 4-byte chains run long (small alphabets, short periods), 8-byte chains find the
// usual long matches after a few candidates; elsewhere they cost more to keep than they save.
// The walk lengths of sampled searches decide, with a gap between the two thresholds so that
// the mode changes seldom. Switching on fills the 8-byte chains from the last 1024 positions.
void qorMatchFinder_t::sampleChain4(int aCur) {
  const int abs_cur = base_ + aCur;
  const int lowest = abs_cur - kMaxOffset;
  int count = 0;
  for (int j = head4_[hashOf(load32(window_ + aCur), kBits4)]; j >= lowest && count < kSampleCap;
       j = prev4_[j & (kMaxOffset - 1)]) {
    ++count;
  }
  sampled_ += count;
  if ((searches_ & (kDecideEvery - 1)) != 0) return;
  const int per_search = sampled_ / (kDecideEvery / kSampleEvery);
  sampled_ = 0;
#ifdef QOR_FLIP_CHAINS
  const bool want8 = !use8_;
#else
  const bool want8 = use8_ ? per_search >= kOff8 : per_search > kOn8;
#endif
  if (want8 == use8_) return;
  use8_ = want8;
  if (!use8_) return;
  std::memset(head8_, 0x80, sizeof(int) * (1 << kBits8));
  const unsigned char* const window = window_ - base_;
  const int abs_limit = base_ + limit_;
  int p = nextInsert_ - kMaxOffset;
  if (p < base_) p = base_;
  for (; p < nextInsert_ && p + 8 <= abs_limit; ++p) {
    const uint32_t v = load32(window + p);
    if (v == (v & 0xFF) * 0x01010101u) continue;
    const int h8 = hash8Of(load64(window + p));
    prev8_[p & (kMaxOffset - 1)] = head8_[h8];
    head8_[h8] = p;
  }
}

void qorMatchFinder_t::addRun(const unsigned char* aLast, int aAbsEnd) {
  const int in_window = static_cast<int>(aLast - window_) + 1;
  const int max_leng = in_window < kMaxMatch ? in_window : kMaxMatch;
  int leng = 4;
  while (leng < max_leng && aLast[-leng] == aLast[0]) ++leng;
  const int key = aLast[0] << 8 | aLast[1];
  const int h = hashOf(static_cast<uint32_t>(key), kBits3);
  Run_t& run = runs_[runCount_ & (kRunRing - 1)];
  run.end = aAbsEnd;
  run.leng = leng;
  run.key = key;
  run.prev = headRun_[h];
  headRun_[h] = runCount_++;
}

inline int qorMatchFinder_t::matchLeng(const unsigned char* aA, const unsigned char* aB, int aFrom,
                                int aCap) const {
  int k = aFrom;
  while (k + 8 <= aCap) {
    const uint64_t diff = load64(aA + k) ^ load64(aB + k);
    if (diff != 0) return k + ((kLittleEndian ? __builtin_ctzll(diff) : __builtin_clzll(diff)) >> 3);
    k += 8;
  }
  while (k < aCap && aA[k] == aB[k]) ++k;
  return k;
}

// The bytes at aCur are a run of aRunLeng bytes b followed by c. A match longer than the run
// starts aRunLeng bytes before the end of an earlier run of b at least that long, followed
// by c: one candidate per listed run.
int qorMatchFinder_t::findRun(int aCur, int aRunLeng, int aMinLeng, int aCap, int& aOffset) {
  if (aRunLeng >= aCap) return 0;
  const unsigned char* cur = window_ + aCur;
  const unsigned char* const window = window_ - base_;  // indexed by absolute offsets
  const int abs_cur = base_ + aCur;
  const int key = cur[0] << 8 | cur[aRunLeng];
  const int lowest = abs_cur - kMaxOffset;
  const int oldest = runCount_ - kRunRing;
  int best = aMinLeng - 1;  // at least aRunLeng, so the tail below lies within the match
  int best_pos = -1;
  uint32_t tail = load32(cur + best - 3);
  const unsigned char* tails = window + best - 3;  // tails[j]: where candidate j has them
  for (int i = headRun_[hashOf(static_cast<uint32_t>(key), kBits3)]; i >= 0 && i >= oldest;) {
    const Run_t& run = runs_[i & (kRunRing - 1)];
    const int j = run.end - aRunLeng;
    if (j < lowest) break;
    i = run.prev;
    // A run is listed as soon as its end is in the window: the one at aCur itself may be.
    if (run.key != key || run.leng < aRunLeng || j >= abs_cur) continue;
    if (load32(tails + j) != tail) continue;
    const int leng = matchLeng(window + j, cur, aRunLeng + 1, aCap);
    if (leng > best) {
      best = leng;
      best_pos = j;
      if (leng == aCap) break;
      tail = load32(cur + best - 3);
      tails = window + best - 3;
    }
  }
  if (best_pos < 0) return 0;
  aOffset = abs_cur - best_pos;
  return best;
}

inline int qorMatchFinder_t::findChain(const int* aHead, const int* aPrev, int aCur,
                                        int aMinLeng, int aCap, int& aOffset) {
  const unsigned char* cur = window_ + aCur;
  const unsigned char* const window = window_ - base_;  // indexed by absolute offsets
  const int abs_cur = base_ + aCur;
  const int lowest = abs_cur - kMaxOffset;
  int best = aMinLeng - 1;
  int best_pos = -1;
  // A longer match must agree on the 4 bytes ending at the current best length.
  uint32_t tail = load32(cur + best - 3);
  const unsigned char* tails = window + best - 3;  // tails[j]: where candidate j has them
  for (int j = *aHead; j >= lowest; j = aPrev[j & (kMaxOffset - 1)]) {
    if (load32(tails + j) != tail) continue;
    const int leng = matchLeng(window + j, cur, 0, aCap);
    if (leng > best) {
      best = leng;
      best_pos = j;
      if (leng == aCap) break;
      tail = load32(cur + best - 3);
      tails = window + best - 3;
    }
  }
  if (best_pos < 0) return 0;
  aOffset = abs_cur - best_pos;
  return best;
}

inline int qorMatchFinder_t::findNear3(int aCur, int& aOffset) {
  const unsigned char* cur = window_ + aCur;
  const int abs_cur = base_ + aCur;
  const int lowest = abs_cur - kNearMax;
  for (int j = head3_[hashOf(load24(cur), kBits3)]; j >= lowest;
       j = prev3_[j & kNearMax]) {
    const unsigned char* cand = window_ + (j - base_);
    if (cand[0] == cur[0] && cand[1] == cur[1] && cand[2] == cur[2]) {
      aOffset = abs_cur - j;
      return 3;
    }
  }
  return 0;
}

int qorMatchFinder_t::find(int aCur, int aRunLeng, int aMinLeng, int& aOffset) {
  const int cap = limit_ - aCur < kMaxMatch ? limit_ - aCur : kMaxMatch;
  if (aMinLeng > cap) return 0;
  insertUpTo(base_ + aCur);
  if (aRunLeng >= 4) return findRun(aCur, aRunLeng, aMinLeng, cap, aOffset);
  const unsigned char* cur = window_ + aCur;
  int cap4 = cap;
  if (cap >= 8 && (++searches_ & (kSampleEvery - 1)) == 0) sampleChain4(aCur);
  if (use8_ && cap >= 8) {
    // Every match of 8 or more starts in the 8-byte chain, nearest first.
    const int leng = findChain(head8_ + hash8Of(load64(cur)), prev8_, aCur,
                               aMinLeng > 8 ? aMinLeng : 8, cap, aOffset);
    if (leng > 0 || aMinLeng >= 8) return leng;
    cap4 = 7;  // none of 8: the nearest of 7 is the answer
  }
  const int leng = cap4 >= 4 ? findChain(head4_ + hashOf(load32(cur), kBits4), prev4_, aCur,
                                         aMinLeng > 4 ? aMinLeng : 4, cap4, aOffset)
                             : 0;
  // Without a match of 4 or more, a match of 3 can only win when it is near: the nearest
  // one within 255 is then the answer that counts.
  if (leng == 0 && aMinLeng <= 3) return findNear3(aCur, aOffset);
  return leng;
}

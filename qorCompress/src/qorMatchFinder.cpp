#include "qorCompress/src/qorMatchFinder.h"

#include <cstring>

namespace {

const int kMaxOffset = 1024;
const int kMaxMatch = 2048;
const int kNearMax = 255;
const int kRunRing = 512;  // runs of 4+ bytes ending in the last 1024 bytes number at most 206

inline uint32_t load32(const unsigned char* aPtr) {
  uint32_t v;
  std::memcpy(&v, aPtr, sizeof v);
  return v;
}

inline uint64_t load64(const unsigned char* aPtr) {
  uint64_t v;
  std::memcpy(&v, aPtr, sizeof v);
  return v;
}

inline int hashOf(uint32_t aValue, int aBits) {
  return static_cast<int>((aValue * 2654435761u) >> (32 - aBits));
}

}  // namespace

qorMatchFinder_t::qorMatchFinder_t(int aLength)
    : window_(nullptr), base_(0), limit_(0), nextInsert_(0), runCount_(0) {
  // Only the last 1024 positions are ever live, so small tables suffice; short sources get
  // smaller ones still, since they are cleared on every call.
  const bool small = aLength <= 8192;
  hashBits4_ = small ? 11 : 14;
  hashBits3_ = small ? 9 : 12;
  const int run_heads = 1 << hashBits3_;
  head4_ = new int[(1 << hashBits4_) + kMaxOffset + (1 << hashBits3_) + (kNearMax + 1) + run_heads];
  prev4_ = head4_ + (1 << hashBits4_);
  head3_ = prev4_ + kMaxOffset;
  prev3_ = head3_ + (1 << hashBits3_);
  headRun_ = prev3_ + (kNearMax + 1);
  // 0x80 bytes make every head a large negative offset: older than any position searched.
  std::memset(head4_, 0x80, sizeof(int) << hashBits4_);
  std::memset(head3_, 0x80, sizeof(int) << hashBits3_);
  std::memset(headRun_, 0xFF, sizeof(int) * run_heads);
  runs_ = new Run_t[kRunRing];
}

qorMatchFinder_t::~qorMatchFinder_t() {
  delete[] runs_;
  delete[] head4_;
}

void qorMatchFinder_t::setWindow(const unsigned char* aWindow, int aBase, int aLimit) {
  window_ = aWindow;
  base_ = aBase;
  limit_ = aLimit;
}

void qorMatchFinder_t::insertUpTo(int aAbsCur) {
  int p = nextInsert_ > aAbsCur - kMaxOffset ? nextInsert_ : aAbsCur - kMaxOffset;
  const int abs_limit = base_ + limit_;
  for (; p < aAbsCur; ++p) {
    const unsigned char* s = window_ + (p - base_);
    const int avail = abs_limit - p;
    // A position whose first bytes are all equal lies in a run; runs are listed once
    // instead, so that long runs do not make long chains.
    if (avail >= 4) {
      const uint32_t v = load32(s);
      if (v != s[0] * 0x01010101u) {
        const int h = hashOf(v, hashBits4_);
        prev4_[p & (kMaxOffset - 1)] = head4_[h];
        head4_[h] = p;
      }
    }
    if (avail >= 3 && (s[0] != s[1] || s[1] != s[2])) {
      const int h = hashOf(s[0] | s[1] << 8 | s[2] << 16, hashBits3_);
      prev3_[p & kNearMax] = head3_[h];
      head3_[h] = p;
    }
    if (avail >= 2 && s[1] != s[0] && p - base_ >= 3 && s[-1] == s[0] && s[-2] == s[0] &&
        s[-3] == s[0]) {
      addRun(s, p + 1);
    }
  }
  nextInsert_ = aAbsCur;
}

void qorMatchFinder_t::addRun(const unsigned char* aLast, int aAbsEnd) {
  const int in_window = static_cast<int>(aLast - window_) + 1;
  const int max_leng = in_window < kMaxMatch ? in_window : kMaxMatch;
  int leng = 4;
  while (leng < max_leng && aLast[-leng] == aLast[0]) ++leng;
  const int key = aLast[0] << 8 | aLast[1];
  const int h = hashOf(static_cast<uint32_t>(key), hashBits3_);
  Run_t& run = runs_[runCount_ & (kRunRing - 1)];
  run.end = aAbsEnd;
  run.leng = leng;
  run.key = key;
  run.prev = headRun_[h];
  headRun_[h] = runCount_++;
}

int qorMatchFinder_t::matchLeng(const unsigned char* aA, const unsigned char* aB, int aFrom,
                                int aCap) const {
  int k = aFrom;
  while (k + 8 <= aCap) {
    const uint64_t diff = load64(aA + k) ^ load64(aB + k);
    if (diff != 0) return k + (__builtin_ctzll(diff) >> 3);
    k += 8;
  }
  while (k < aCap && aA[k] == aB[k]) ++k;
  return k;
}

int qorMatchFinder_t::find(int aCur, int aRunLeng, int aMinLeng, int& aOffset) {
  const int cap = limit_ - aCur < kMaxMatch ? limit_ - aCur : kMaxMatch;
  if (aMinLeng > cap) return 0;
  insertUpTo(base_ + aCur);
  if (aRunLeng >= 4) return findRun(aCur, aRunLeng, aMinLeng, cap, aOffset);
  const int leng = cap >= 4 ? findChain(aCur, aMinLeng, cap, aOffset) : 0;
  // Without a match of 4 or more, a match of 3 can only win when it is near: the nearest
  // one within 255 is then the answer that counts.
  if (leng == 0 && aMinLeng <= 3) return findNear3(aCur, aOffset);
  return leng;
}

// The bytes at aCur are a run of aRunLeng bytes b followed by c. A match longer than the run
// starts aRunLeng bytes before the end of an earlier run of b at least that long, followed
// by c: one candidate per listed run.
int qorMatchFinder_t::findRun(int aCur, int aRunLeng, int aMinLeng, int aCap, int& aOffset) {
  if (aRunLeng >= aCap) return 0;
  const unsigned char* cur = window_ + aCur;
  const int abs_cur = base_ + aCur;
  const int key = cur[0] << 8 | cur[aRunLeng];
  const int lowest = abs_cur - kMaxOffset;
  int best = aMinLeng - 1;
  int best_pos = -1;
  for (int i = headRun_[hashOf(static_cast<uint32_t>(key), hashBits3_)];
       i >= 0 && i >= runCount_ - kRunRing;) {
    const Run_t& run = runs_[i & (kRunRing - 1)];
    const int j = run.end - aRunLeng;
    if (j < lowest) break;
    i = run.prev;
    if (run.key != key || run.leng < aRunLeng) continue;
    const unsigned char* cand = window_ + (j - base_);
    if (cand[best] != cur[best]) continue;
    const int leng = matchLeng(cand, cur, aRunLeng + 1, aCap);
    if (leng > best) {
      best = leng;
      best_pos = j;
      if (leng == aCap) break;
    }
  }
  if (best_pos < 0) return 0;
  aOffset = abs_cur - best_pos;
  return best;
}

int qorMatchFinder_t::findChain(int aCur, int aMinLeng, int aCap, int& aOffset) {
  const unsigned char* cur = window_ + aCur;
  const int abs_cur = base_ + aCur;
  const int lowest = abs_cur - kMaxOffset;
  int best = (aMinLeng > 4 ? aMinLeng : 4) - 1;
  int best_pos = -1;
  for (int j = head4_[hashOf(load32(cur), hashBits4_)]; j >= lowest;
       j = prev4_[j & (kMaxOffset - 1)]) {
    const unsigned char* cand = window_ + (j - base_);
    // A longer match must agree on the 4 bytes ending at the current best length.
    if (load32(cand + best - 3) != load32(cur + best - 3)) continue;
    const int leng = matchLeng(cand, cur, 0, aCap);
    if (leng > best) {
      best = leng;
      best_pos = j;
      if (leng == aCap) break;
    }
  }
  if (best_pos < 0) return 0;
  aOffset = abs_cur - best_pos;
  return best;
}

int qorMatchFinder_t::findNear3(int aCur, int& aOffset) {
  const unsigned char* cur = window_ + aCur;
  const int abs_cur = base_ + aCur;
  const int lowest = abs_cur - kNearMax;
  for (int j = head3_[hashOf(cur[0] | cur[1] << 8 | cur[2] << 16, hashBits3_)]; j >= lowest;
       j = prev3_[j & kNearMax]) {
    const unsigned char* cand = window_ + (j - base_);
    if (cand[0] == cur[0] && cand[1] == cur[1] && cand[2] == cur[2]) {
      aOffset = abs_cur - j;
      return 3;
    }
  }
  return 0;
}

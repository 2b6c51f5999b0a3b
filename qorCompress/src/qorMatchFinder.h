// qorMatchFinder_t: the compressor's sd search. find() returns exactly what trying every start
// of the last 1024 bytes would return (the longest match, capped at 2048 bytes and at the
// window's end, ties to the nearest start), but visits only starts that can share the bytes.
// Positions in its tables are absolute source offsets, so they survive every window refill.
#ifndef QOR_MATCHFINDER_H
#define QOR_MATCHFINDER_H

#include <cstdint>

class qorMatchFinder_t {
 public:
  // Allocates the tables (about 65 KB); the destructor releases them.
  qorMatchFinder_t();
  ~qorMatchFinder_t();
  qorMatchFinder_t(const qorMatchFinder_t&) = delete;
  qorMatchFinder_t& operator=(const qorMatchFinder_t&) = delete;

  // Names the window after every fill: aWindow[i] is the source byte at offset aBase + i, and
  // aLimit bytes are valid. The window must hold the 1024 + 2048 bytes before every position
  // searched afterwards (or start at offset 0) and every byte up to the match cap after it.
  void setWindow(const unsigned char* aWindow, int aBase, int aLimit);

  // Searches at window position aCur for a match of at least aMinLeng (>= 3) bytes. aRunLeng
  // is the number of bytes equal to the one at aCur from aCur on (capped, at least 1); when it
  // is 4 or more, aMinLeng must exceed it. Returns the length and sets aOffset, or returns 0
  // (aOffset unchanged) when the longest match is shorter than aMinLeng.
  int find(int aCur, int aRunLeng, int aMinLeng, int& aOffset);

  // Passes over the positions from aCur (below aStop) that are sure literals: no zero, rle
  // or word candidate, no match of 4 within 1024 and no match of 3 within 255 (so none that
  // scores). Returns the first position it cannot decide; find() takes over from there,
  // except when that position has no match of 4 or more but one of 3 within 255: then
  // aNearOffset is the offset of the nearest such (what find() would return). It is -1 when
  // the position has a match of 4 or more (and no zero, rle or word candidate), else 0.
  int skipLiterals(int aCur, int aStop, int& aNearOffset);

  // False when the 4 bytes from aAt start a zero run, an rle run or a word run of 2 units:
  // then the position is no literal.
  static bool mayBeLiteral(const unsigned char* aAt) {
    return aAt[0] == 0 ? aAt[1] != 0
                       : (aAt[1] != aAt[0] || aAt[2] != aAt[0]) && (aAt[1] != 0 || aAt[3] != 0);
  }

 private:
  struct Run_t {
    int end;      // absolute offset of the first byte after the run
    int leng;     // run length, capped at kMaxMatch
    int key;      // run byte << 8 | byte after the run
    int prev;     // index of the previous run with the same key hash (absolute count)
  };

  // Enters the positions before aAbsCur (the last 1024 of them) into the tables.
  void insertUpTo(int aAbsCur) {
    if (nextInsert_ < aAbsCur) insertRange(aAbsCur);
  }
  void insertRange(int aAbsCur);
  template <bool kUse8> void insertPositions(int aAbsCur);
  template <bool kUse8> int skipPositions(int aCur, int aStop, int& aNearOffset);
  void addRun(const unsigned char* aLast, int aAbsEnd);
  int matchLeng(const unsigned char* aA, const unsigned char* aB, int aFrom, int aCap) const;
  int findRun(int aCur, int aRunLeng, int aMinLeng, int aCap, int& aOffset);
  int findChain(const int* aHead, const int* aPrev, int aCur, int aMinLeng, int aCap,
                int& aOffset);
  int findNear3(int aCur, int& aOffset);
  void sampleChain4(int aCur);

  const unsigned char* window_;
  int base_;
  int limit_;
  int nextInsert_;  // absolute offset of the first position not yet entered

  int* head4_;  // newest position per hash of 4 bytes not all equal
  int* prev4_;  // ring of 1024: the previous position with the same hash
  int* head3_;  // newest position per hash of 3 bytes not all equal
  int* prev3_;  // ring of 256
  int* headRun_;  // newest run index per hash of (run byte, byte after the run)
  int* head8_;  // newest position per hash of 8 bytes whose first 4 are not all equal
  int* prev8_;  // ring of 1024
  // Runs of 4 or more bytes ending in the last 1024 bytes number at most 206.
  static const int kRunRing = 512;
  Run_t runs_[kRunRing];  // ring of the runs listed last
  int runCount_;
  bool use8_;     // the 8-byte chains hold every eligible position of the last 1024
  unsigned searches_;  // searches that could use the 8-byte chains (cap of 8 or more)
  int sampled_;   // 4-byte chain entries counted since the last decision
};

#endif

// The compressor against a plain transcription of its greedy algorithm with the exhaustive
// sd search: the payloads must be equal byte for byte on generated inputs of many kinds.
#include <gtest/gtest.h>

#include <algorithm>
#include <random>
#include <string>
#include <vector>

#include "tests/support/payloadrun.h"

namespace {

// Optimised builds run the full set; debug and sanitizer builds a smaller one.
#ifdef NDEBUG
const int kScale = 4;
#else
const int kScale = 1;
#endif

// The reference: window, refill, measures, scores and output exactly as described, and
// deliberately simple.
class ReferenceCompressor {
 public:
  std::string Compress(const std::string& aInput) {
    out_.clear();
    const int length = static_cast<int>(aInput.size());
    if (length <= 0) return out_;
    input_ = &aInput;
    read_ = 0;
    window_.assign(std::min(length, 131072), 0);
    Read(0, static_cast<int>(window_.size()));
    limit_ = static_cast<int>(window_.size());
    cur_ = 0;
    remain_ = length - limit_;
    normal_ = 0;
    for (;;) {
      if (remain_ > 0 && limit_ - cur_ <= 65535) {
        Refill();
        Step();
      } else if (remain_ > 0 || cur_ != limit_) {
        Step();
      } else {
        break;
      }
    }
    FlushNormal();
    out_ += '\xFF';
    return out_;
  }

 private:
  void Read(int aAt, int aCount) {
    for (int i = 0; i < aCount; ++i) window_[aAt + i] = (*input_)[read_ + i];
    read_ += aCount;
  }

  void Refill() {
    const int drop = std::min(cur_ - 8192, normal_);
    for (int i = drop; i < limit_; ++i) window_[i - drop] = window_[i];
    limit_ -= drop;
    cur_ -= drop;
    normal_ -= drop;
    const int count = std::min(131072 - limit_, remain_);
    Read(limit_, count);
    limit_ += count;
    remain_ -= count;
  }

  int ZeroLeng() const {
    if (window_[cur_] != 0) return 0;
    int n = 0;
    while (cur_ + n < limit_ && window_[cur_ + n] == 0 && n < 65535) ++n;
    return n < 2 ? 0 : n;
  }

  int RleLeng() const {
    const unsigned char d = window_[cur_];
    if (d == 0) return 0;
    int n = 0;
    while (cur_ + n < limit_ && window_[cur_ + n] == d && n < 65535) ++n;
    return n < 3 ? 0 : n;
  }

  int SdLeng() {
    const int match_limit = std::min(limit_ - cur_, 2048);
    int best = 0;
    int best_start = 0;
    for (int j = cur_ - 1; j >= std::max(cur_ - 1024, 0); --j) {
      if (window_[j] != window_[cur_]) continue;
      int k = 0;
      while (k < match_limit && window_[j + k] == window_[cur_ + k]) ++k;
      if (k > best) {
        best = k;
        best_start = j;
      }
    }
    if (best < 3) return 0;
    sdOffset_ = cur_ - best_start;
    return best;
  }

  int WordLeng() const {
    if (window_[cur_] == 0) return 0;
    int i = cur_;
    while (i + 2 <= limit_ && window_[i + 1] == 0) {
      if (window_[i] == 0 && window_[i - 2] == 0) {
        i -= 2;
        break;
      }
      i += 2;
    }
    const int n = std::min(i - cur_, 131070);
    return n < 3 ? 0 : n;
  }

  void Step() {
    int best = 0;
    int kind = 0;
    const int z = ZeroLeng();
    if (z >= 2) {
      best = z <= 31 ? z - 1 : z - 2;
      kind = 1;
    }
    const int r = RleLeng();
    const int r_score = r <= 31 ? r - 2 : r - 3;
    if (r > 0 && r_score > best) {
      best = r_score;
      kind = 2;
    }
    const int s = SdLeng();
    int s_score = s <= 31 ? s - 2 : s - 3;
    if (s > 0 && sdOffset_ > 255) --s_score;
    if (s > 0 && s_score > best) {
      best = s_score;
      kind = 3;
    }
    const int w = WordLeng();
    const int n = w / 2;
    const int w_score = n <= 32 ? n - 1 : n - 2;
    if (w > 0 && w_score > best) kind = 4;

    if (kind == 0) {
      ++cur_;
      if (cur_ - normal_ >= 57344) FlushNormal();
      return;
    }
    FlushNormal();
    const unsigned char at = window_[cur_];
    if (kind == 1) {
      Directive(0x20, z);
      cur_ += z;
    } else if (kind == 2) {
      Directive(0x40, r);
      out_ += static_cast<char>(at);
      cur_ += r;
    } else if (kind == 3) {
      if (sdOffset_ > 255) {
        Directive(0x80, s);
        out_ += static_cast<char>(sdOffset_ & 0xFF);
        out_ += static_cast<char>(sdOffset_ >> 8);
      } else {
        Directive(0x60, s);
        out_ += static_cast<char>(sdOffset_);
      }
      cur_ += s;
    } else {
      Directive(0xA0, n);
      for (int i = 0; i < n; ++i) out_ += static_cast<char>(window_[cur_ + 2 * i]);
      cur_ += w;
    }
    normal_ = cur_;
  }

  void Directive(int aCode, int aLeng) {
    if (aLeng <= 31) {
      out_ += static_cast<char>(aCode | aLeng);
    } else {
      out_ += static_cast<char>(aCode);
      out_ += static_cast<char>(aLeng & 0xFF);
      out_ += static_cast<char>(aLeng >> 8);
    }
  }

  void FlushNormal() {
    const int leng = cur_ - normal_;
    if (leng <= 0) return;
    Directive(0x00, leng);
    for (int i = normal_; i < cur_; ++i) out_ += static_cast<char>(window_[i]);
    normal_ = cur_;
  }

  const std::string* input_ = nullptr;
  int read_ = 0;
  std::vector<unsigned char> window_;
  int cur_ = 0;
  int limit_ = 0;
  int remain_ = 0;
  int normal_ = 0;
  int sdOffset_ = 0;
  std::string out_;
};

// Input generators; each appends about aLength bytes of one kind.
typedef std::mt19937 Rng;

int Pick(Rng& aRng, int aLow, int aHigh) {
  return std::uniform_int_distribution<int>(aLow, aHigh)(aRng);
}

void AddSmallAlphabet(std::string& aOut, int aLength, Rng& aRng) {
  const int size = Pick(aRng, 2, 4);
  char symbols[4];
  for (char& s : symbols) s = static_cast<char>(Pick(aRng, 0, 3) == 0 ? 0 : Pick(aRng, 1, 255));
  for (int i = 0; i < aLength; ++i) aOut += symbols[Pick(aRng, 0, size - 1)];
}

void AddRuns(std::string& aOut, int aLength, Rng& aRng) {
  const size_t end = aOut.size() + aLength;
  while (aOut.size() < end) {
    const int choice = Pick(aRng, 0, 9);
    int leng = choice < 7 ? Pick(aRng, 1, 6) : choice < 9 ? Pick(aRng, 28, 36) : Pick(aRng, 60, 2100);
    if (Pick(aRng, 0, 200) == 0) leng = Pick(aRng, 65530, 70000);
    const char b = static_cast<char>(Pick(aRng, 0, 2) == 0 ? 0 : Pick(aRng, 1, 3));
    aOut.append(leng, b);
  }
}

void AddUtf16(std::string& aOut, int aLength, Rng& aRng) {
  if (Pick(aRng, 0, 3) == 0) aOut += static_cast<char>(Pick(aRng, 0, 255));  // odd alignment
  for (int i = 0; i < aLength / 2; ++i) {
    const int choice = Pick(aRng, 0, 99);
    if (choice < 3) {
      aOut.append(Pick(aRng, 1, 3) * 2, '\0');
    } else if (choice < 5) {
      aOut += static_cast<char>(Pick(aRng, 1, 255));
      aOut += static_cast<char>(Pick(aRng, 1, 4));
    } else {
      aOut += static_cast<char>(Pick(aRng, 0x20, 0x7A));
      aOut += '\0';
    }
  }
}

void AddRepeats(std::string& aOut, int aLength, Rng& aRng) {
  static const int kDistances[] = {1, 3, 4, 254, 255, 256, 257, 1022, 1023, 1024, 1025, 1026};
  const size_t end = aOut.size() + aLength;
  while (aOut.size() < end) {
    const int dist = kDistances[Pick(aRng, 0, 11)];
    int leng = Pick(aRng, 0, 9) == 0 ? Pick(aRng, 40, 3000) : Pick(aRng, 2, 12);
    if (static_cast<int>(aOut.size()) < dist) {
      for (int i = 0; i < dist; ++i) aOut += static_cast<char>(Pick(aRng, 0, 255));
    }
    for (int i = 0; i < leng; ++i) aOut += aOut[aOut.size() - dist];
    leng = Pick(aRng, 0, 8);
    for (int i = 0; i < leng; ++i) aOut += static_cast<char>(Pick(aRng, 0, 255));
  }
}

void AddPeriodic(std::string& aOut, int aLength, Rng& aRng) {
  const int period = Pick(aRng, 0, 3) == 0 ? Pick(aRng, 1, 8) : Pick(aRng, 1, 1100);
  std::string pattern;
  for (int i = 0; i < period; ++i) pattern += static_cast<char>(Pick(aRng, 0, 255));
  for (int i = 0; i < aLength; ++i) {
    char b = pattern[i % period];
    if (Pick(aRng, 0, 499) == 0) b = static_cast<char>(Pick(aRng, 0, 255));
    aOut += b;
  }
}

void AddRandom(std::string& aOut, int aLength, Rng& aRng) {
  for (int i = 0; i < aLength; ++i) aOut += static_cast<char>(Pick(aRng, 0, 255));
}

typedef void (*Generator)(std::string&, int, Rng&);
const Generator kGenerators[] = {AddSmallAlphabet, AddRuns, AddUtf16, AddRepeats, AddPeriodic,
                                 AddRandom};

// Segments of random kinds and lengths, so that kinds meet at arbitrary places.
std::string Mixed(int aLength, Rng& aRng) {
  std::string out;
  while (static_cast<int>(out.size()) < aLength) {
    const int leng = Pick(aRng, 0, 3) == 0 ? Pick(aRng, 1000, 40000) : Pick(aRng, 1, 600);
    kGenerators[Pick(aRng, 0, 5)](out, leng, aRng);
  }
  out.resize(aLength);
  return out;
}

void ExpectSameAsReference(const std::string& aInput, const std::string& aWhat) {
  ReferenceCompressor reference;
  const std::string expected = reference.Compress(aInput);
  const std::string payload = CompressString(aInput);
  if (payload != expected) {
    size_t at = 0;
    while (at < payload.size() && at < expected.size() && payload[at] == expected[at]) ++at;
    FAIL() << aWhat << ": " << aInput.size() << " bytes, payload differs from byte " << at
           << " (" << payload.size() << " vs " << expected.size() << " bytes)";
  }
  EXPECT_EQ(aInput, ExpandString(payload, static_cast<int>(aInput.size()))) << aWhat;
}

void RunKind(int aKind, int aCount, int aMaxLength, uint32_t aSeed) {
  for (int i = 0; i < aCount; ++i) {
    Rng rng(aSeed + i);
    std::string input;
    kGenerators[aKind](input, Pick(rng, 1, aMaxLength), rng);
    ExpectSameAsReference(input, "kind " + std::to_string(aKind) + " seed " +
                                     std::to_string(aSeed + i));
  }
}

TEST(qorCompressorExact, SmallAlphabets) { RunKind(0, 40 * kScale, 6000, 100); }
TEST(qorCompressorExact, RunsOfZerosAndOfOneByte) { RunKind(1, 10 * kScale, 20000, 200); }
TEST(qorCompressorExact, SixteenBitText) { RunKind(2, 25 * kScale, 8000, 300); }
TEST(qorCompressorExact, RepeatsAroundOffsetLimits) { RunKind(3, 25 * kScale, 8000, 400); }
TEST(qorCompressorExact, PeriodicData) { RunKind(4, 15 * kScale, 12000, 500); }
TEST(qorCompressorExact, IncompressibleData) { RunKind(5, 5 * kScale, 8000, 600); }

TEST(qorCompressorExact, MixedKindsOfManySizes) {
  for (int i = 0; i < 60 * kScale; ++i) {
    Rng rng(700 + i);
    const int length = Pick(rng, 0, 2) == 0 ? Pick(rng, 1, 40) : Pick(rng, 41, 20000);
    ExpectSameAsReference(Mixed(length, rng), "mixed seed " + std::to_string(700 + i));
  }
}

// Sizes at the normal-run limit, the refill point and the window size, and inputs that take
// several refills: the refill rule and the window's end are part of the output.
TEST(qorCompressorExact, SizesAroundWindowLimits) {
  const int kSizes[] = {57343, 57344, 57345, 65535, 65536, 65537, 131071, 131072, 131073};
  int seed = 900;
  for (int size : kSizes) {
    Rng rng(seed++);
    ExpectSameAsReference(Mixed(size, rng), "mixed size " + std::to_string(size));
  }
  for (int i = 0; i < kScale; ++i) {
    Rng rng(seed++);
    ExpectSameAsReference(Mixed(300000 + Pick(rng, 0, 100000), rng), "several refills");
  }
}

TEST(qorCompressorExact, NormalRunPendingAcrossRefill) {
  // Nothing to find: a pending run of 57344 bytes meets every refill.
  ExpectSameAsReference(IncompressibleBytes(kScale > 1 ? 310000 : 132000, 1), "incompressible");
  // A pending run that starts just before the first refill point.
  Rng rng(950);
  std::string input(65000, '\0');
  input += IncompressibleBytes(40000, 2);
  AddRepeats(input, kScale > 1 ? 250000 : 40000, rng);
  ExpectSameAsReference(input, "pending run at the refill");
}

TEST(qorCompressorExact, WordRunsCutByTheWindow) {
  // Units with zero high bytes, longer than a word directive and than the window ahead, at
  // starts that put the window's end at different places in the run.
  for (int start : {0, 1, 70001, 100000, 140000}) {
    Rng rng(960 + start);
    std::string input;
    // The reference searches random bytes slowly; unoptimised builds take a quicker filler.
    (kScale > 1 ? AddRandom : AddPeriodic)(input, start, rng);
    for (int i = 0; i < 90000; ++i) {
      input += static_cast<char>(Pick(rng, 1, 255));
      input += '\0';
    }
    AddRuns(input, 5000, rng);
    ExpectSameAsReference(input, "word run from " + std::to_string(start));
  }
}

}  // namespace

// The compressor against a plain transcription of its greedy algorithm with the exhaustive
// sd search: the payloads must be equal byte for byte on generated inputs of many kinds.
#include <gtest/gtest.h>

#include <algorithm>
#include <random>
#include <string>
#include <vector>

#include "tests/support/payloadrun.h"
#include "tests/support/referencecompressor.h"

namespace {

// Optimised builds run the full set; debug and sanitizer builds a smaller one.
#ifdef NDEBUG
const int kScale = 4;
#else
const int kScale = 1;
#endif

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

// Long stretches of two or three symbols make the search switch to its longer chains, other
// kinds between them switch it back; the ends of inputs fall at every distance from a switch.
// Built with -DQOR_FLIP_CHAINS the search switches every 64 searches: the whole suite must
// pass in that build too.
TEST(qorCompressorExact, SmallAlphabetsBetweenOtherKinds) {
  for (int i = 0; i < 3 * kScale; ++i) {
    Rng rng(1000 + i);
    std::string input;
    const int length = Pick(rng, 40000, 100000);
    while (static_cast<int>(input.size()) < length) {
      const char a = static_cast<char>(Pick(rng, 0, 2));
      const char b = static_cast<char>(Pick(rng, 1, 255));
      const char c = Pick(rng, 0, 1) == 0 ? a : static_cast<char>(Pick(rng, 1, 255));
      const int leng = Pick(rng, 12000, 30000);
      for (int k = 0; k < leng; ++k) {
        const int s = Pick(rng, 0, 2);
        input += s == 0 ? a : s == 1 ? b : c;
      }
      kGenerators[Pick(rng, 1, 5)](input, Pick(rng, 200, 6000), rng);
    }
    input.resize(length - Pick(rng, 0, 1000));
    ExpectSameAsReference(input, "small alphabets seed " + std::to_string(1000 + i));
  }
}

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

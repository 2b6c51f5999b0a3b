// Damaged archives against `test` and `extract` in process: every prefix and every byte
// flipped of a small archive must end in a verdict or a clean error, never a crash or a read
// outside the file (the sanitizer build watches), and a sound verdict means extract succeeds.
#include "src/unpacktest.h"

#include <gtest/gtest.h>

#include <cstdio>
#include <string>

#include "src/unpackextract.h"
#include "tests/support/linkfixture.h"

namespace {

struct Outcome_t {
  int problems;
  bool extracted;
};

Outcome_t TestAndExtract(const LinkTempDir_t& aDir, const std::string& aBytes, FILE* aSink) {
  const std::string path = aDir / "d.LB";
  WriteBytes(path, aBytes);
  qorExtractOptions_t options;
  options.force = true;
  const int problems = UnpackTest(path.c_str(), aSink);
  const std::string failure =
      FailureText([&] { UnpackExtract(path.c_str(), (aDir / "out").c_str(), options); });
  return {problems, failure == "<nothing raised>"};
}

TEST(UnpackTest, EveryPrefixAndFlippedByteEndsCleanly) {
  LinkTempDir_t dir;
  // Entries at 0 (stored, name block), 64 (compressed), 192 (compressed, empty); end record 256.
  const std::string sound =
      LinkFiles(dir, {{"a.dat", "hello"}, {"p.bin", Pattern(90, 4)}, {"e.bin", ""}},
                "a.dat nocomp setfilename\np.bin id=5\ne.bin\n");
  ASSERT_EQ(sound.size(), 320u);
  FILE* sink = fopen("/dev/null", "w");
  ASSERT_NE(sink, nullptr);
  EXPECT_EQ(TestAndExtract(dir, sound, sink).problems, 0);
  for (size_t n = 0; n < sound.size(); ++n) {
    SCOPED_TRACE(n);
    Outcome_t prefix = TestAndExtract(dir, sound.substr(0, n), sink);
    // Cut between entries, an archive without end record remains: still sound.
    EXPECT_EQ(prefix.problems == 0, n == 0 || n == 64 || n == 192 || n == 256);
    EXPECT_TRUE(prefix.problems > 0 || prefix.extracted);
    std::string flipped = sound;
    flipped[n] = static_cast<char>(flipped[n] ^ 0x5A);
    Outcome_t flip = TestAndExtract(dir, flipped, sink);
    EXPECT_TRUE(flip.problems > 0 || flip.extracted);
  }
  fclose(sink);
}

}  // namespace

// qorExpander_t: expands what the compressor writes, and rejects every malformed payload
// with " invalid file format." without reading or writing outside its buffers (the
// sanitizer build checks the latter).
#include <gtest/gtest.h>

#include <random>
#include <string>

#include "qorCompress/src/qorCompress.h"
#include "tests/support/payloadrun.h"
#include "tests/support/raisedtext.h"
#include "tests/support/teststream.h"

namespace {

const char kInvalid[] = " invalid file format.";

std::string ExpandError(const std::string& aPayload, int aRealSize) {
  return RaisedText([&] { ExpandString(aPayload, aRealSize); });
}

// Every kind of directive, short and long forms, far and near copies, and enough bytes to
// cross the expander's internal blocks.
std::string VariedInput(int aLength, uint32_t aSeed) {
  std::mt19937 rng(aSeed);
  std::string out;
  while (static_cast<int>(out.size()) < aLength) {
    const int leng = 1 + static_cast<int>(rng() % 300);
    switch (rng() % 6) {
      case 0:
        out.append(leng, '\0');
        break;
      case 1:
        out.append(leng, static_cast<char>(1 + rng() % 255));
        break;
      case 2:
        for (int i = 0; i < leng; ++i) out += static_cast<char>(rng());
        break;
      case 3:
        for (int i = 0; i < leng; ++i) {
          out += static_cast<char>(0x20 + rng() % 90);
          out += '\0';
        }
        break;
      default: {
        const size_t back = 1 + rng() % 1100;
        if (back > out.size()) break;
        for (int i = 0; i < leng; ++i) out += out[out.size() - back];
      }
    }
  }
  out.resize(aLength);
  return out;
}

TEST(qorExpander, ExpandsDirectivesTheEncoderNeverWrites) {
  const struct {
    const char* payload;
    std::string expanded;
  } kCases[] = {
      {"", ""},
      {"FF", ""},                                             // an end mark alone
      {"01 41 | 63 01 | FF", std::string(4, 'A')},            // near copy, offset 1
      {"00 02 00 41 42 | FF", "AB"},                          // long form of a short length
      {"02 41 42 | 80 03 00 02 00 | FF", "ABABA"},            // far form of a near offset
      {"01 43 | 63 01 | 62 02 | FF", "CCCCCC"},               // copies from copies
  };
  for (const auto& c : kCases) {
    EXPECT_EQ(c.expanded, ExpandString(Hex(c.payload), static_cast<int>(c.expanded.size())))
        << c.payload;
  }
}

TEST(qorExpander, RejectsMalformedPayloads) {
  const struct {
    const char* what;
    const char* payload;
    int realSize;
  } kCases[] = {
      {"empty payload for data", "", 1},
      {"end mark missing", "01 41", 1},
      {"long length cut", "20 28", 40},
      {"long length 0", "20 00 00 FF", 0},
      {"normal bytes cut", "05 41 42", 5},
      {"rle value cut", "43", 3},
      {"near offset cut", "01 41 63", 4},
      {"far offset cut", "01 41 84 2C", 5},
      {"word bytes cut", "A3 41 42", 6},
      {"offset 0", "01 41 63 00 FF", 4},
      {"offset before the start", "01 41 62 02 FF", 3},
      {"copy before any output", "63 01 FF", 3},
      {"far offset before the start", "02 41 42 84 2C 01 FF", 6},
      {"offset beyond 1024", "20 FF 07 84 01 04 FF", 2047 + 4},
      {"bytes after the end mark", "01 41 FF 00", 1},
      {"expands to less", "01 41 FF", 2},
      {"expands to more", "02 41 42 FF", 1},
      {"long run beyond realSize", "20 28 00 FF", 10},
      {"word run beyond realSize", "A2 41 42 FF", 3},
      {"negative realSize", "FF", -1},
  };
  for (const auto& c : kCases) {
    EXPECT_EQ(kInvalid, ExpandError(Hex(c.payload), c.realSize)) << c.what;
  }
  for (int d = 0xC0; d <= 0xFE; ++d) {
    std::string payload = Hex("01 41");
    payload += static_cast<char>(d);
    payload += Hex("00 00 00 FF");
    EXPECT_EQ(kInvalid, ExpandError(payload, 1)) << "directive byte " << d;
  }
}

TEST(qorExpander, RoundTripsAcrossItsBlocks) {
  const std::string kInputs[] = {
      VariedInput(700000, 1),
      std::string(2000000, '\0'),          // payload of a few bytes, output of many blocks
      IncompressibleBytes(300000, 2),      // payload larger than the input block
  };
  for (const std::string& input : kInputs) {
    const std::string payload = CompressString(input);
    EXPECT_TRUE(input == ExpandString(payload, static_cast<int>(input.size()))) << input.size();
  }
}

// Every truncation of a valid payload is rejected, as is every payload with one byte more.
TEST(qorExpander, EveryPrefixAndExtensionIsRejected) {
  for (uint32_t seed = 1; seed <= 3; ++seed) {
    const std::string input = VariedInput(1500, seed);
    const std::string payload = CompressString(input);
    const int real_size = static_cast<int>(input.size());
    for (size_t leng = 0; leng < payload.size(); ++leng) {
      ASSERT_EQ(kInvalid, ExpandError(payload.substr(0, leng), real_size)) << leng;
    }
    EXPECT_EQ(kInvalid, ExpandError(payload + '\0', real_size));
    EXPECT_EQ(kInvalid, ExpandError(payload, real_size + 1));
    EXPECT_EQ(kInvalid, ExpandError(payload, real_size - 1));
  }
}

// Random damage: the expander either produces exactly realSize bytes or rejects the payload
// with the format error; nothing else, and nothing out of bounds.
TEST(qorExpander, CorruptedPayloadsExpandToRealSizeOrAreRejected) {
  std::mt19937 rng(99);
  int rejected = 0;
  for (int round = 0; round < 600; ++round) {
    const std::string input = VariedInput(200 + static_cast<int>(rng() % 3000), rng());
    std::string payload = CompressString(input);
    const int damage = 1 + static_cast<int>(rng() % 4);
    for (int i = 0; i < damage; ++i) {
      payload[rng() % payload.size()] = static_cast<char>(rng());
    }
    const int real_size = static_cast<int>(input.size());
    try {
      EXPECT_EQ(input.size(), ExpandString(payload, real_size).size());
    } catch (const char* text) {
      ASSERT_STREQ(kInvalid, text);
      ++rejected;
    }
  }
  EXPECT_GT(rejected, 0);
}

TEST(qorExpander, SourceShorterThanPayloadLengthRaisesReadError) {
  const std::string payload = CompressString(VariedInput(5000, 4));
  TestStream_t src(payload.substr(0, payload.size() / 2), "half.bin");
  TestStream_t dst;
  EXPECT_EQ("half.bin read error.", RaisedText([&] {
              qorExpander_t().expand(dst, src, static_cast<int>(payload.size()), 5000);
            }));
}

}  // namespace

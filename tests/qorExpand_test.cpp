// qorExpander_t: expands what the compressor writes, and rejects every malformed payload
// with " invalid file format." without reading or writing outside its buffers (the
// sanitizer build checks the latter).
#include <gtest/gtest.h>

#include <algorithm>
#include <random>
#include <string>

#include "qorCompress/src/qorCompress.h"
#include "tests/support/payloadrun.h"
#include "tests/support/raisedtext.h"
#include "tests/support/referenceexpander.h"
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

// Writes a payload directive by directive, with the bytes it stands for beside it.
struct PayloadBuilder_t {
  std::string payload;
  std::string expanded;
  void Head(int aCode, int aLeng, bool aLongForm = false) {
    if (aLeng < 32 && !aLongForm) {
      payload += static_cast<char>(aCode | aLeng);
    } else {
      payload += static_cast<char>(aCode);
      payload += static_cast<char>(aLeng & 0xFF);
      payload += static_cast<char>(aLeng >> 8);
    }
  }
  void Normal(const std::string& aBytes) {
    Head(0x00, static_cast<int>(aBytes.size()));
    payload += aBytes;
    expanded += aBytes;
  }
  void Fill(unsigned char aValue, int aLeng) {
    Head(aValue == 0 ? 0x20 : 0x40, aLeng);
    if (aValue != 0) payload += static_cast<char>(aValue);
    expanded.append(aLeng, static_cast<char>(aValue));
  }
  void Copy(int aOffset, int aLeng, bool aFar) {
    Head(aFar ? 0x80 : 0x60, aLeng);
    payload += static_cast<char>(aOffset & 0xFF);
    if (aFar) payload += static_cast<char>(aOffset >> 8);
    for (int i = 0; i < aLeng; ++i) expanded += expanded[expanded.size() - aOffset];
  }
  void Words(const std::string& aLow) {
    Head(0xA0, static_cast<int>(aLow.size()));
    payload += aLow;
    for (char c : aLow) {
      expanded += c;
      expanded += '\0';
    }
  }
  // Any directive of at most 40 units, including forms the encoder never writes (rle of 0,
  // far copies from near offsets, long forms of short lengths).
  void Random(std::mt19937& aRng) {
    const int leng = 1 + static_cast<int>(aRng() % 40);
    const bool long_form = aRng() % 8 == 0;
    const int reach = static_cast<int>(std::min<size_t>(expanded.size(), 1024));
    switch (aRng() % 5) {
      case 0: {
        std::string bytes;
        for (int i = 0; i < leng; ++i) bytes += static_cast<char>(aRng());
        Head(0x00, leng, long_form);
        payload += bytes;
        expanded += bytes;
        break;
      }
      case 1:
        Fill(static_cast<unsigned char>(aRng() % 3 == 0 ? 0 : aRng()), leng);
        break;
      case 2: {
        std::string low;
        for (int i = 0; i < leng; ++i) low += static_cast<char>(aRng());
        Words(low);
        break;
      }
      default:
        if (reach == 0) break;
        const int offset = 1 + static_cast<int>(aRng() % (aRng() % 2 ? 20 : reach));
        Copy(offset < reach ? offset : reach, leng, offset > 255 || aRng() % 4 == 0);
    }
  }
};

// The expander's verdict and output against ReferenceExpand's.
void ExpectSameAsPlain(const std::string& aPayload, int aRealSize, const std::string& aWhat) {
  std::string plain;
  if (ReferenceExpand(aPayload, aRealSize, plain)) {
    ASSERT_TRUE(plain == ExpandString(aPayload, aRealSize)) << aWhat;
  } else {
    ASSERT_EQ(kInvalid, ExpandError(aPayload, aRealSize)) << aWhat;
  }
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

// Copies that reach too far or not at all, also with enough history and payload after them
// that the expander takes them on its unchecked path.
TEST(qorExpander, RejectsBadCopiesAfterLongHistory) {
  const struct {
    int offset;
    int leng;
    bool far;
    bool valid;
  } kCases[] = {
      {0, 3, false, false},    {0, 31, false, false}, {0, 4, true, false},  {1025, 4, true, false},
      {65535, 31, true, false}, {1024, 31, true, true}, {1, 31, false, true}, {255, 3, true, true},
  };
  std::mt19937 rng(3);
  for (const auto& c : kCases) {
    PayloadBuilder_t b;
    std::string bytes;
    for (int i = 0; i < 1100; ++i) bytes += static_cast<char>(rng());
    b.Normal(bytes);
    b.Head(c.far ? 0x80 : 0x60, c.leng);
    b.payload += static_cast<char>(c.offset & 0xFF);
    if (c.far) b.payload += static_cast<char>(c.offset >> 8);
    for (int i = 0; i < c.leng; ++i) {
      b.expanded += c.valid ? b.expanded[b.expanded.size() - c.offset] : '\0';
    }
    b.Normal(bytes.substr(0, 40));
    b.payload += '\xFF';
    const int real_size = static_cast<int>(b.expanded.size());
    if (c.valid) {
      EXPECT_TRUE(b.expanded == ExpandString(b.payload, real_size)) << c.offset;
    } else {
      EXPECT_EQ(kInvalid, ExpandError(b.payload, real_size)) << c.offset;
    }
  }
}

// Each kind and length of short directive ending just before, at and just after the 256 KiB
// output block, where the expander's unchecked stores must hand over to its checked ones.
TEST(qorExpander, ShortDirectivesAroundTheOutputBlockEnd) {
  const int kBlock = 0x40000;
  std::mt19937 rng(5);
  for (int kind = 0; kind < 6; ++kind) {
    for (int leng : {1, 2, 15, 16, 17, 31}) {
      for (int shift = -1; shift <= 1; ++shift) {
        PayloadBuilder_t b;
        const int out_leng = kind == 5 ? 2 * leng : leng;
        const int zeros = kBlock + shift - out_leng - 1100;
        for (int left = zeros; left > 0; left -= 0xFFFF) b.Fill(0, std::min(left, 0xFFFF));
        std::string history;
        for (int i = 0; i < 1100; ++i) history += static_cast<char>(rng());
        b.Normal(history);
        switch (kind) {
          case 0: b.Normal(history.substr(0, leng)); break;
          case 1: b.Fill(0, leng); break;
          case 2: b.Fill(0x41, leng); break;
          case 3: b.Copy(1 + leng % 7, leng, false); break;
          case 4: b.Copy(1024, leng, true); break;
          default: b.Words(history.substr(0, leng));
        }
        for (int i = 0; i < 20; ++i) b.Random(rng);
        b.payload += '\xFF';
        const int real_size = static_cast<int>(b.expanded.size());
        const std::string what = std::to_string(kind) + " " + std::to_string(leng) + " " +
                                 std::to_string(shift);
        ASSERT_TRUE(b.expanded == ExpandString(b.payload, real_size)) << what;
        ASSERT_EQ(kInvalid, ExpandError(b.payload, real_size - 1)) << what;
      }
    }
  }
}

// Directives that end just before, at and just after the end of the first payload read
// (256 KiB and one longest directive), and that straddle it, short and long.
TEST(qorExpander, DirectivesAroundThePayloadRefill) {
  const int kFirstRead = 0x40000 + 3 + 0xFFFF;
  std::mt19937 rng(11);
  std::string bytes;
  for (int i = 0; i < 0xFFFF; ++i) bytes += static_cast<char>(rng());
  for (int kind = 0; kind < 3; ++kind) {
    for (int shift = -2; shift <= 2; ++shift) {
      PayloadBuilder_t b;
      const int tested = kind == 0 ? 32 : kind == 1 ? 5 : 3 + 5000;  // payload bytes
      for (;;) {
        const int left = kFirstRead + shift - tested - static_cast<int>(b.payload.size());
        if (left <= 50000) {
          b.Normal(bytes.substr(0, left - 3));
          break;
        }
        b.Normal(bytes.substr(0, 40000));
      }
      if (kind == 0) b.Normal(bytes.substr(7, 31));
      if (kind == 1) b.Copy(1000, 40, true);
      if (kind == 2) b.Normal(bytes.substr(3, 5000));
      ASSERT_EQ(static_cast<size_t>(kFirstRead + shift), b.payload.size());
      while (b.payload.size() < static_cast<size_t>(kFirstRead) + 2000) b.Random(rng);
      b.payload += '\xFF';
      const int real_size = static_cast<int>(b.expanded.size());
      ASSERT_TRUE(b.expanded == ExpandString(b.payload, real_size)) << kind << " " << shift;
      const std::string cut = b.payload.substr(0, kFirstRead + shift - 1);
      ASSERT_EQ(kInvalid, ExpandError(cut, real_size)) << kind << " " << shift;
    }
  }
}

// Random directive streams, also of forms the encoder never writes, whole and damaged: the
// expander accepts exactly what the plain byte-by-byte reading accepts, with the same bytes.
TEST(qorExpander, AgreesWithPlainExpansionOnRandomPayloads) {
  std::mt19937 rng(7);
  for (int round = 0; round < 400; ++round) {
    PayloadBuilder_t b;
    const int target = 1 + static_cast<int>(rng() % 4000);
    while (static_cast<int>(b.expanded.size()) < target) b.Random(rng);
    b.payload += '\xFF';
    std::string payload = b.payload;
    const int real_size = static_cast<int>(b.expanded.size());
    ASSERT_TRUE(b.expanded == ExpandString(payload, real_size)) << round;
    const int damage = static_cast<int>(rng() % 4);
    for (int i = 0; i < damage; ++i) {
      const size_t at = rng() % payload.size();
      // Most damage in the directive bytes, where the checks are.
      payload[at] = static_cast<char>(rng() % 2 ? rng() : (payload[at] & 0xE0) | (rng() & 0x1F));
    }
    ExpectSameAsPlain(payload, real_size + static_cast<int>(rng() % 3) - 1, std::to_string(round));
  }
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

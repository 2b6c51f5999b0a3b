// qorCompressor_t: the documented payloads, the stream calls it makes, and its errors.
#include <gtest/gtest.h>

#include <string>
#include <vector>

#include "qorCompress/src/qorCompress.h"
#include "tests/support/payloadrun.h"
#include "tests/support/raisedtext.h"
#include "tests/support/teststream.h"

namespace {

std::string Repeat(const std::string& aUnit, int aCount) {
  std::string out;
  for (int i = 0; i < aCount; ++i) out += aUnit;
  return out;
}

// 300 bytes in which nothing repeats: a copy of some of them 300 bytes later can only be
// taken from 300 bytes back.
std::string Unrepeated300() { return IncompressibleBytes(300, 7); }

std::string NormalRun(const std::string& aBytes) {
  std::string out;
  const int leng = static_cast<int>(aBytes.size());
  if (leng <= 31) {
    out += static_cast<char>(leng);
  } else {
    out += '\0';
    out += static_cast<char>(leng & 0xFF);
    out += static_cast<char>(leng >> 8);
  }
  return out + aBytes;
}

struct Vector_t {
  const char* what;
  std::string input;
  std::string payload;
};

std::vector<Vector_t> DocumentedVectors() {
  const std::string p300 = Unrepeated300();
  std::string far_2048 = p300;
  for (int i = 0; i < 2048; ++i) far_2048 += far_2048[far_2048.size() - 300];
  return {
      {"worked example",
       Hex("41 41 41 41 41 41 00 00 00 00 61 62 63 61 62 63 61 62 63 48 00 69 00 21 00 78 79"),
       Hex("46 41 | 24 | 03 61 62 63 | 66 03 | A3 48 69 21 | 02 78 79 | FF")},
      {"40 zeros then 51", std::string(40, '\0') + Hex("51"), Hex("20 28 00 | 01 51 | FF")},
      {"forty units 48 00", Repeat(Hex("48 00"), 40),
       Hex("A0 28 00") + std::string(40, '\x48') + Hex("FF")},
      {"ten bytes from 300 back", p300 + p300.substr(0, 10),
       Hex("00 2C 01") + p300 + Hex("8A 2C 01 FF")},
      {"2048 bytes from 300 back", far_2048, Hex("00 2C 01") + p300 + Hex("80 00 08 2C 01 FF")},
      {"three bytes from 300 back stay normal", p300 + p300.substr(0, 3),
       Hex("00 2F 01") + p300 + p300.substr(0, 3) + Hex("FF")},
      {"four bytes from 300 back go far", p300 + p300.substr(0, 4),
       Hex("00 2C 01") + p300 + Hex("84 2C 01 FF")},
      {"one byte", Hex("41"), Hex("01 41 FF")},
      {"one zero byte", Hex("00"), Hex("01 00 FF")},
      {"two zero bytes", Hex("00 00"), Hex("22 FF")},
      {"31 zero bytes", std::string(31, '\0'), Hex("3F FF")},
      {"32 zero bytes", std::string(32, '\0'), Hex("20 20 00 FF")},
      {"07 07", Hex("07 07"), Hex("02 07 07 FF")},
      {"07 07 07", Hex("07 07 07"), Hex("43 07 FF")},
      {"two units", Hex("48 00 69 00"), Hex("A2 48 69 FF")},
      {"one unit", Hex("48 00"), Hex("02 48 00 FF")},
      {"word run takes a single 00 00 unit", Hex("41 00 00 00 00 42"),
       Hex("A2 41 00 | 02 00 42 | FF")},
      {"five zeros go to a zero run", Hex("41 00 00 00 00 00 42"), Hex("01 41 | 25 | 01 42 | FF")},
      {"tie keeps the zero run", Hex("00 00 00 00 51 41 41 41 00 00 00 00 51"),
       Hex("24 | 01 51 | 43 41 | 24 | 01 51 | FF")},
      {"longer sd match wins", Hex("00 00 00 00 51 41 41 41 00 00 00 00 51 41"),
       Hex("24 | 01 51 | 43 41 | 66 08 | FF")},
      {"31 units", Repeat(Hex("05 00"), 31), Hex("BF") + std::string(31, '\x05') + Hex("FF")},
      {"32 units", Repeat(Hex("05 00"), 32),
       Hex("A0 20 00") + std::string(32, '\x05') + Hex("FF")},
      {"70000 zero bytes", std::string(70000, '\0'), Hex("20 FF FF | 20 71 11 | FF")},
      {"70000 bytes 07", std::string(70000, '\x07'), Hex("40 FF FF 07 | 40 71 11 07 | FF")},
  };
}

TEST(qorCompressor, DocumentedPayloads) {
  for (const Vector_t& v : DocumentedVectors()) {
    EXPECT_EQ(v.payload, CompressString(v.input)) << v.what;
    EXPECT_EQ(v.input, ExpandString(v.payload, static_cast<int>(v.input.size()))) << v.what;
  }
}

// Nothing to compress: normal runs of 57344 bytes, also across the window's refills (a
// run pending when the window moves is written out whole).
TEST(qorCompressor, IncompressibleInputBecomesNormalRunsOfAtMost57344) {
  for (int length : {57344, 57345, 200000}) {
    const std::string input = IncompressibleBytes(length, 3);
    std::string expected;
    for (int at = 0; at < length; at += 57344) expected += NormalRun(input.substr(at, 57344));
    expected += '\xFF';
    EXPECT_TRUE(expected == CompressString(input)) << length;
  }
}

TEST(qorCompressor, LengthZeroOrNegativeTouchesNothing) {
  for (int length : {0, -5}) {
    TestStream_t src("abc");
    TestStream_t dst;
    src.FailReadAt(1);
    dst.FailWriteAt(1);
    qorCompressor_t().compress(dst, src, length);
    EXPECT_TRUE(src.ReadSizes().empty());
    EXPECT_TRUE(dst.WriteSizes().empty());
    EXPECT_EQ(0, src.GetPosition());
  }
}

// Writes of exactly 4096 bytes, then one last write of 1 to 4096 bytes.
TEST(qorCompressor, WritesWholeBlocksThenOneLast) {
  // 4092 normal bytes and their 4 bytes of framing make exactly 4096 bytes of payload.
  for (int length : {1, 4091, 4092, 4093, 20000}) {
    const std::string input = IncompressibleBytes(length, 5);
    TestStream_t src(input);
    TestStream_t dst;
    qorCompressor_t().compress(dst, src, length);
    const int payload = static_cast<int>(dst.Content().size());
    std::vector<int> expected(static_cast<size_t>((payload - 1) / 4096), 4096);
    expected.push_back(payload - 4096 * static_cast<int>(expected.size()));
    EXPECT_EQ(expected, dst.WriteSizes()) << length;
  }
}

// The window is read at the smaller of the length and 131072 bytes, then refilled.
TEST(qorCompressor, ReadsTheWindowThenRefills) {
  const struct {
    std::string input;
    std::vector<int> reads;
  } kCases[] = {
      {"A", {1}},
      {std::string(131072, '\0'), {131072}},
      // Two zero runs of 65535 bytes reach 131070; the refill keeps 8192 + 2 bytes.
      {std::string(200000, '\0'), {131072, 68928}},
      // Normal runs flushed at 57344 and 114688 bound what the refills may drop.
      {IncompressibleBytes(200000, 4), {131072, 57344, 11584}},
  };
  for (const auto& c : kCases) {
    TestStream_t src(c.input);
    TestStream_t dst;
    qorCompressor_t().compress(dst, src, static_cast<int>(c.input.size()));
    EXPECT_EQ(c.reads, src.ReadSizes()) << c.input.size();
  }
}

TEST(qorCompressor, SourceEndingEarlyRaisesReadErrorAndStaysUsable) {
  qorCompressor_t compressor;
  const struct {
    int available;
    int length;
  } kCases[] = {{100, 200}, {200000, 300000}};
  for (const auto& c : kCases) {
    TestStream_t src(IncompressibleBytes(c.available, 9), "short.bin");
    TestStream_t dst;
    EXPECT_EQ("short.bin read error.",
              RaisedText([&] { compressor.compress(dst, src, c.length); }))
        << c.length;
    // What was handed over stays: whole blocks only.
    EXPECT_EQ(0u, dst.Content().size() % 4096);
  }
  const std::string input = Hex("41 41 41 41 00 00 07");
  TestStream_t src(input);
  TestStream_t dst;
  compressor.compress(dst, src, static_cast<int>(input.size()));
  EXPECT_EQ(CompressString(input), dst.Content());
}

TEST(qorCompressor, DestinationFailingRaisesWriteErrorAndStaysUsable) {
  qorCompressor_t compressor;
  for (int failing_call : {1, 2}) {
    TestStream_t src(IncompressibleBytes(10000, 11));
    TestStream_t dst(std::string(), "out.bin");
    dst.FailWriteAt(failing_call);
    EXPECT_EQ("out.bin write error.", RaisedText([&] { compressor.compress(dst, src, 10000); }));
    EXPECT_EQ(4096u * (failing_call - 1), dst.Content().size());
  }
  const std::string input = std::string(500, '\x07') + IncompressibleBytes(3000, 12);
  TestStream_t src(input);
  TestStream_t dst;
  compressor.compress(dst, src, static_cast<int>(input.size()));
  EXPECT_EQ(CompressString(input), dst.Content());
}

// The compressor reads from the source's position and writes at the destination's.
TEST(qorCompressor, WorksFromTheStreamPositions) {
  TestStream_t src(Hex("99 99 41 42"));
  TestStream_t dst(Hex("EE"));
  src.Seek(2, 0);
  dst.Seek(1, 0);
  qorCompressor_t().compress(dst, src, 2);
  EXPECT_EQ(Hex("EE 02 41 42 FF"), dst.Content());
  EXPECT_EQ(4, src.GetPosition());
}

}  // namespace

#include "src/archivereader.h"

#include <gtest/gtest.h>

#include <string>
#include <vector>

#include "tests/support/linkfixture.h"

namespace {

std::string Entry(uint8_t aType, uint8_t aCompression, const std::string& aNameBlock,
                  const std::string& aBody, char aPadByte = 0) {
  const uint32_t file_size = static_cast<uint32_t>(16 + aNameBlock.size() + aBody.size());
  std::string bytes = EntryHeader(aType, aCompression, 0, file_size, "DAT", 0) + aNameBlock + aBody;
  return bytes + std::string(QorPadLength(file_size), aPadByte);
}

// Entries at 0 (name block, 5-byte body), 64 (100-byte body) and 192 (48-byte body, no
// padding); the end record at 256.
std::string SoundArchive() {
  return Entry(1, 0x10, std::string("a.dat") + Zeros(11), "hello") +
         Entry(1, 0, "", std::string(100, 'x')) + Entry(1, 0, "", std::string(48, 'y')) +
         EndRecord();
}

struct Walk_t {
  std::vector<int> offsets;
  qorWalkState_t state;
  std::vector<qorArchiveProblem_t> problems;
  std::vector<std::string> texts;  // Describe() of each problem
};

Walk_t WalkBytes(const LinkTempDir_t& aDir, const std::string& aBytes) {
  const std::string path = aDir / "a.LB";
  WriteBytes(path, aBytes);
  qorArchiveReader_t reader(path.c_str());
  Walk_t walk;
  while (reader.Next()) walk.offsets.push_back(reader.Entry().offset);
  walk.state = reader.State();
  walk.problems = reader.Problems();
  for (const auto& p : walk.problems) walk.texts.push_back(reader.Describe(p).c_str());
  return walk;
}

TEST(ArchiveReader, WalksEntriesToTheEndRecord) {
  LinkTempDir_t dir;
  const std::string path = dir / "a.LB";
  WriteBytes(path, SoundArchive());
  qorArchiveReader_t reader(path.c_str());
  ASSERT_TRUE(reader.Next());
  PortString_t name;
  EXPECT_TRUE(reader.Entry().NameText(name));
  EXPECT_STREQ(name.c_str(), "a.dat");
  EXPECT_EQ(reader.Entry().BodyOffset(), 32);
  EXPECT_EQ(reader.Entry().BodySize(), 5);
  EXPECT_TRUE(reader.CheckPadding());
  ASSERT_TRUE(reader.Next());
  EXPECT_EQ(reader.Entry().offset, 64);
  EXPECT_EQ(reader.Entry().index, 1);
  ASSERT_TRUE(reader.Next());
  EXPECT_EQ(reader.Entry().offset, 192);
  EXPECT_EQ(reader.Entry().PadSize(), 0);
  EXPECT_FALSE(reader.Next());
  EXPECT_EQ(reader.State(), kQorWalkEndRecord);
  EXPECT_EQ(reader.EndRecordOffset(), 256);
  EXPECT_TRUE(reader.Problems().empty());
  reader.Rewind();
  ASSERT_TRUE(reader.Next());
  EXPECT_EQ(reader.Entry().offset, 0);
}

// Every truncation is either a clean end between entries or a problem placed inside the
// bytes that exist; never a read past them (the sanitizer build watches that).
TEST(ArchiveReader, EveryPrefixEndsCleanly) {
  LinkTempDir_t dir;
  const std::string whole = SoundArchive();
  for (size_t n = 0; n <= whole.size(); ++n) {
    SCOPED_TRACE(n);
    Walk_t walk = WalkBytes(dir, whole.substr(0, n));
    if (n == 0 || n == 64 || n == 192 || n == 256) {
      EXPECT_EQ(walk.state, kQorWalkEndOfFile);
      EXPECT_TRUE(walk.problems.empty());
    } else if (n == whole.size()) {
      EXPECT_EQ(walk.state, kQorWalkEndRecord);
      EXPECT_TRUE(walk.problems.empty());
    } else {
      ASSERT_FALSE(walk.problems.empty());
      EXPECT_LE(walk.problems.front().offset, static_cast<int>(n));
    }
  }
}

TEST(ArchiveReader, ReportsDamageWithOffsetAndIndex) {
  const std::string first = Entry(1, 0, "", "hello");
  const struct {
    const char* what;
    std::string bytes;
    qorWalkState_t state;
    std::string text;  // Describe() of the first problem, after "<archive>: "
  } cases[] = {
      {"fileSize below the header", first + EntryHeader(1, 0, 0, 10, "DAT", 0) + Zeros(48),
       kQorWalkBroken,
       "entry 1, offset 64: fileSize 10 is smaller than the header and name block (16 bytes)"},
      {"fileSize below the name block", EntryHeader(1, 0x30, 0, 40, "DAT", 0) + Zeros(48),
       kQorWalkBroken,
       "entry 0, offset 0: fileSize 40 is smaller than the header and name block (64 bytes)"},
      {"huge fileSize", first + EntryHeader(1, 0, 0, 0xFFFFFFF0u, "DAT", 0) + Zeros(48),
       kQorWalkBroken,
       "entry 1, offset 64: fileSize 4294967280 runs past the end of the archive (64 bytes left)"},
      {"header cut", first + Zeros(7), kQorWalkBroken,
       "entry 1, offset 64: the archive ends inside a header (7 of 16 bytes present)"},
      {"padding cut", first.substr(0, 30), kQorWalkBroken,
       "entry 0, offset 21: the archive ends inside the padding (9 of 43 bytes present)"},
      {"end record fields", first + EntryHeader(0xFF, 1, 0, 20, "END0", 0) + Zeros(48),
       kQorWalkEndRecord, "offset 64: malformed end record: compression 1, fileSize 20"},
      {"end record cut", first + EndRecord().substr(0, 40), kQorWalkEndRecord,
       "offset 104: the archive ends inside the end record (24 of 48 zero bytes present)"},
      {"garbage after the end record", first + EndRecord() + "junk", kQorWalkEndRecord,
       "offset 128: 4 bytes follow the end record"},
      {"entry after the end record", EndRecord() + first, kQorWalkEndRecord,
       "offset 64: 64 bytes follow the end record"},
  };
  LinkTempDir_t dir;
  for (const auto& c : cases) {
    SCOPED_TRACE(c.what);
    Walk_t walk = WalkBytes(dir, c.bytes);
    EXPECT_EQ(walk.state, c.state);
    ASSERT_EQ(walk.texts.size(), 1u);
    EXPECT_EQ(walk.texts[0], dir / "a.LB: " + c.text);
  }
}

TEST(ArchiveReader, EndRecordZerosAndPaddingAreChecked) {
  LinkTempDir_t dir;
  std::string end = EndRecord();
  end[16 + 30] = 1;
  Walk_t walk = WalkBytes(dir, end);
  ASSERT_EQ(walk.problems.size(), 1u);
  EXPECT_EQ(walk.problems[0].offset, 46);
  EXPECT_STREQ(walk.problems[0].text.c_str(), "non-zero byte in the 48 zero bytes of the end record");

  const std::string path = dir / "b.LB";
  WriteBytes(path, Entry(1, 0, "", "hello", '\x07') + EndRecord());
  qorArchiveReader_t reader(path.c_str());
  ASSERT_TRUE(reader.Next());
  EXPECT_FALSE(reader.CheckPadding());
  ASSERT_EQ(reader.Problems().size(), 1u);
  EXPECT_STREQ(reader.Describe(reader.Problems()[0]).c_str(),
               (path + ": entry 0, offset 21: non-zero byte in the padding").c_str());
}

TEST(ArchiveReader, NameTextNeedsATerminator) {
  LinkTempDir_t dir;
  const std::string path = dir / "a.LB";
  WriteBytes(path, Entry(1, 0x10, std::string(16, 'n'), "") + Entry(1, 0x10, Zeros(16), ""));
  qorArchiveReader_t reader(path.c_str());
  PortString_t name("old");
  ASSERT_TRUE(reader.Next());
  EXPECT_FALSE(reader.Entry().NameText(name));
  ASSERT_TRUE(reader.Next());
  EXPECT_TRUE(reader.Entry().NameText(name));
  EXPECT_EQ(name.GetLength(), 0);
}

}  // namespace

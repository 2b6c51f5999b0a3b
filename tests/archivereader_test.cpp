// The archive reader on hand-made archives: every prefix, and the damage only it reports
// (what qorUnpack test reports is checked through the built program).
#include "src/archivereader.h"

#include <gtest/gtest.h>

#include <string>
#include <vector>

#include "tests/support/linkfixture.h"

namespace {

std::string Entry(uint8_t aCompression, const std::string& aNameBlock, const std::string& aBody) {
  const uint32_t file_size = static_cast<uint32_t>(16 + aNameBlock.size() + aBody.size());
  return EntryHeader(1, aCompression, 0, file_size, "DAT", 0) + aNameBlock + aBody +
         Zeros(QorPadLength(file_size));
}

// Entries at 0 (name block, 5-byte body), 64 (100-byte body) and 192 (48-byte body, no
// padding); the end record at 256.
std::string SoundArchive() {
  return Entry(0x10, std::string("a.dat") + Zeros(11), "hello") +
         Entry(0, "", std::string(100, 'x')) + Entry(0, "", std::string(48, 'y')) + EndRecord();
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
      EXPECT_EQ(walk.offsets, std::vector<int>({0, 64, 192}));
      EXPECT_EQ(walk.state, kQorWalkEndRecord);
      EXPECT_TRUE(walk.problems.empty());
    } else {
      ASSERT_FALSE(walk.problems.empty());
      EXPECT_LE(walk.problems.front().offset, static_cast<int>(n));
    }
  }
}

TEST(ArchiveReader, ReportsDamageWithOffsetAndIndex) {
  const std::string first = Entry(0, "", "hello");
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
      {"end record fields", first + EntryHeader(0xFF, 1, 0, 20, "END0", 0) + Zeros(48),
       kQorWalkEndRecord, "offset 64: malformed end record: compression 1, fileSize 20"},
      {"end record cut", first + EndRecord().substr(0, 40), kQorWalkEndRecord,
       "offset 104: the archive ends inside the end record (24 of 48 zero bytes present)"},
      {"end record zeros", EndRecord().substr(0, 46) + '\x01' + Zeros(17), kQorWalkEndRecord,
       "offset 46: non-zero byte in the 48 zero bytes of the end record"},
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

}  // namespace

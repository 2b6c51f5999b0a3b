// Archives written in process, compared byte for byte with archives spelled out here. The
// option words (id=, comp/nocomp, setfilename) are checked by the entries they give.
#include "src/entrywriter.h"

#include <string>

#include "gtest/gtest.h"
#include "port/src/string.h"
#include "src/linkrun.h"
#include "tests/support/linkfixture.h"
#include "tests/support/teststream.h"

namespace {

// Writes `lines` as the response file (each "@" standing for the directory) and links it.
std::string LinkLines(const LinkTempDir_t& dir, std::string lines) {
  for (size_t at = lines.find('@'); at != std::string::npos; at = lines.find('@', at)) {
    lines.replace(at, 1, dir.Path());
  }
  dir.Put("list.ls", lines);
  LinkRun((dir / "list.ls").c_str(), (dir / "out.LB").c_str());
  return ReadBytes(dir / "out.LB");
}

// Each case links one file: `directives`, then the file's line with `words`.
TEST(EntryWriter, StoredEntryHeaderNameBlockAndPadding) {
  const struct {
    std::string file;
    size_t length;
    const char* directives;
    const char* words;
    uint16_t id;
    const char* magic;  // four bytes
    size_t block;       // name block length; the block holds the file's base name
    size_t padding;
  } cases[] = {
      {"a.dat", 0, "", "nocomp", 0, "DAT", 0, 48},
      {"a.dat", 47, "", "nocomp", 0, "DAT", 0, 1},
      {"a.dat", 48, "", "nocomp", 0, "DAT", 0, 0},
      {"a.dat", 49, "", "nocomp", 0, "DAT", 0, 63},
      {"a.dat", 63, "", "nocomp", 0, "DAT", 0, 49},
      {"a.dat", 64, "", "nocomp", 0, "DAT", 0, 48},
      {"a.dat", 65, "", "nocomp", 0, "DAT", 0, 47},
      {"a.tex2d", 1, "%nocomp\n", "", 0, "TEX2", 0, 47},
      {"x", 1, "%nocomp\n", "", 0, "\0\0\0", 0, 47},
      {"x.tmxa", 1, "%nocomp\n", "", 0, "TMXA", 0, 47},
      {"x.Tm2", 1, "%nocomp\n", "", 0, "TM2", 0, 47},
      {"x.tm", 1, "%nocomp\n", "", 0, "TM\0", 0, 47},
      {"d.v/x", 1, "%nocomp\n", "", 0, "\0\0\0", 0, 47},
      {"x.", 1, "%nocomp\n", "", 0, "\0\0\0", 0, 47},
      {"x.a-b", 1, "%nocomp\n", "", 0, "A-B", 0, 47},
      {"a.dat", 5, "", "nocomp id=0x10", 16, "DAT", 0, 43},
      {"a.dat", 5, "", "nocomp id=010", 8, "DAT", 0, 43},
      {"a.dat", 5, "", "nocomp id=", 0, "DAT", 0, 43},
      {"a.dat", 5, "", "nocomp id=-1", 0xFFFF, "DAT", 0, 43},
      {"a.dat", 5, "", "nocomp id=65536", 0, "DAT", 0, 43},
      {"a.dat", 5, "", "ID=5 nocomp", 5, "DAT", 0, 43},
      {"a.dat", 5, "", "nocomp id=3 id=7", 3, "DAT", 0, 43},
      {"a.dat", 5, "%comp\n%setfilename\n", "NoCompress NOSETFILENAME x", 0, "DAT", 0, 43},
      {"a.dat", 5, "%nocomp\n", "compression setfile idx=4", 0, "DAT", 0, 43},
      {"a.dat", 5, "", "nocomp setfilename", 0, "DAT", 16, 27},
      {"data/img/a.dat", 5, "%setfilename\n%nocomp\n", "", 0, "DAT", 16, 27},
      {std::string(11, 'f') + ".bin", 5, "%setfilename\n%nocomp\n", "", 0, "BIN", 16, 27},
      {std::string(12, 'g') + ".bin", 5, "%setfilename\n%nocomp\n", "", 0, "BIN", 32, 11},
      {std::string(43, 'h') + ".bin", 5, "%setfilename\n%nocomp\n", "", 0, "BIN", 48, 59},
  };
  for (const auto& c : cases) {
    SCOPED_TRACE(c.file + " " + c.words);
    LinkTempDir_t dir;
    const std::string data = Pattern(c.length, 3);
    dir.Put(c.file, data);
    const std::string base = c.file.substr(c.file.rfind('/') + 1);
    const std::string block = c.block == 0 ? "" : base + Zeros(c.block - base.size());
    const uint32_t file_size = static_cast<uint32_t>(16 + c.block + c.length);
    EXPECT_EQ(LinkLines(dir, c.directives + ("@/" + c.file) + " " + c.words + "\n"),
              EntryHeader(1, static_cast<uint8_t>(c.block), c.id, file_size, c.magic, 0) + block +
                  data + Zeros(c.padding) + EndRecord());
  }
}

// A name ending in a separator has no base name to put in a block.
TEST(EntryWriter, NameBlockForAnEmptyBaseNameIsRefused) {
  TestStream_t dst;
  TestStream_t src("hello");
  PortFilename_t name("dir\\");
  qorStdFileHeader_t header = {};
  header.fileSize = 21;
  PortStringToken_t token;
  token.parse("setfilename");
  EXPECT_EQ(FailureText([&] { NormalWrite(dst, src, name, header, token, false, false); }),
            "'dir\\' illegal filename.");
  EXPECT_EQ(dst.Content(), "");
}

TEST(EntryWriter, OwnHeaderFileKeepsItsHeader) {
  const std::string body = "0123456789abcdefXYZ";  // 19 bytes
  const std::string stored = EntryHeader(0x22, 0x00, 7, 35, "MDL\0", 0) + body;
  const struct {
    std::string file;
    std::string options;
    std::string entry;
  } cases[] = {
      {stored, "", stored + Zeros(29)},
      {stored, "id=0x1234", EntryHeader(0x22, 0x00, 0x1234, 35, "MDL\0", 0) + body + Zeros(29)},
      {stored + "trailing bytes", "", stored + Zeros(29)},
      // A body already compressed is taken over, also when the line asks to compress.
      {EntryHeader(0x22, 0x01, 7, 35, "MDL\0", 500) + body, "comp setfilename",
       EntryHeader(0x22, 0x11, 7, 51, "MDL\0", 500) + "h.MB" + Zeros(12) + body + Zeros(13)},
      // Its own name block is skipped; the entry's block follows this line.
      {EntryHeader(0x22, 0x10, 7, 51, "MDL\0", 0) + "old" + Zeros(13) + body, "",
       stored + Zeros(29)},
      {EntryHeader(0x22, 0x21, 7, 67, "MDL\0", 9) + "old" + Zeros(29) + body, "setfilename",
       EntryHeader(0x22, 0x11, 7, 51, "MDL\0", 9) + "h.MB" + Zeros(12) + body + Zeros(13)},
  };
  for (const auto& c : cases) {
    LinkTempDir_t dir;
    dir.Put("h.MB", c.file);
    EXPECT_EQ(LinkLines(dir, "%nocomp\n@/h.MB " + c.options + "\n"), c.entry + EndRecord())
        << c.options;
  }
}

// Entries are read back to back up to an end record; raw files are copied and padded.
TEST(EntryWriter, ArchiveEntriesAreCopiedUpToTheEndRecord) {
  const std::string first = EntryHeader(1, 0x00, 0, 21, "DAT\0", 0) + "hello";
  const std::string second = EntryHeader(9, 0x11, 4, 64, "PAK\0", 99) + Pattern(48, 4);
  const std::string third = EntryHeader(1, 0x20, 0, 50, "TXT\0", 0) + "t.txt" + Zeros(27) + "xy";
  LinkTempDir_t dir;
  dir.Put("m.PB", first + second + third + EndRecord() + "ignored");
  dir.Put("e.pb", EndRecord() + first);
  dir.Put("r.TB", "raw bytes");
  std::string archive =
      LinkLines(dir, "@/m.PB id=zz comp comp\n@/e.pb\n@/r.TB setfilename nocomp nocomp\n");
  EXPECT_EQ(archive, first + Zeros(43) + second + third + Zeros(14) + "raw bytes" + Zeros(55) +
                         EndRecord());
}

// Every truncation of a merged input fails cleanly with the file's read error.
TEST(EntryWriter, TruncatedInputsRaiseReadError) {
  const std::string archive = EntryHeader(1, 0x10, 0, 37, "DAT\0", 0) + "a.dat" + Zeros(11) +
                              "hello" + EntryHeader(1, 0, 0, 17, "X\0\0\0", 0) + "x" + EndRecord();
  const std::string own = EntryHeader(0x22, 0x10, 0, 37, "MDL\0", 0) + "name" + Zeros(12) + "hello";
  const struct {
    const std::string* bytes;
    int merge_mode;
    const char* options;
  } cases[] = {{&archive, kQorMergeArchive, ""}, {&own, kQorMergeOwnHeader, "nocomp"},
               {&own, kQorMergeOwnHeader, "comp"}};
  for (const auto& c : cases) {
    size_t needed = c.merge_mode == kQorMergeArchive ? c.bytes->size() - 48 : c.bytes->size();
    for (size_t length = 0; length < needed; ++length) {
      TestStream_t dst;
      TestStream_t src(c.bytes->substr(0, length), "in.file");
      PortFilename_t name("in.file");
      PortStringToken_t token;
      token.parse(c.options);
      EXPECT_EQ(FailureText([&] { WriteEntry(dst, src, name, c.merge_mode, token, true, false); }),
                "in.file read error.")
          << length;
    }
  }
}

TEST(EntryWriter, NoEndRecordEndsWithTheLastPadding) {
  LinkTempDir_t dir;
  dir.Put("a.dat", "hello");
  EXPECT_EQ(LinkLines(dir, "%noendrecord\n"), "");
  const std::string entry = EntryHeader(1, 0, 0, 21, "DAT\0", 0) + "hello" + Zeros(43);
  EXPECT_EQ(LinkLines(dir, "%NoCompress\n@/a.dat\n%noendrecord\n"), entry);
  EXPECT_EQ(LinkLines(dir, "%NOCOMP now\n@/a.dat#old comp\n%noendrecord x\n@/a.dat\n"),
            entry + entry);
}

// The payload is taken from the archive and checked by expanding it with the decoder.
TEST(EntryWriter, CompressedBodyExpandsToTheInput) {
  const struct {
    std::string name;
    std::string data;
    const char* lines;
    uint8_t compression;
    size_t block;
  } cases[] = {
      {"empty.dat", "", "@/empty.dat\n", 0x01, 0},
      {"tile.dat", Pattern(5000, 5), "@/tile.dat\n", 0x01, 0},
      {"tile.dat", Pattern(150000, 6), "@/tile.dat setfilename\n", 0x11, 16},
      {"noise.bin", Pattern(777, 7), "%nocompress\n@/noise.bin Comp\n", 0x01, 0},
  };
  for (const auto& c : cases) {
    SCOPED_TRACE(c.lines);
    LinkTempDir_t dir;
    dir.Put(c.name, c.data);
    std::string archive = LinkLines(dir, c.lines);
    ASSERT_GE(archive.size(), 128u);
    uint32_t file_size = Le32At(archive, 4);
    ASSERT_GE(file_size, 16 + c.block);
    std::string magic = c.name.substr(c.name.find('.') + 1);
    for (char& ch : magic) ch = static_cast<char>(toupper(ch));
    std::string payload = archive.substr(16 + c.block, file_size - 16 - c.block);
    std::string expected = EntryHeader(1, c.compression, 0, file_size, magic.c_str(),
                                       static_cast<uint32_t>(c.data.size()));
    if (c.block) expected += c.name + Zeros(c.block - c.name.size());
    expected += payload + Zeros((64 - file_size % 64) % 64) + EndRecord();
    EXPECT_EQ(archive, expected);
    EXPECT_EQ(Expand(payload, static_cast<uint32_t>(c.data.size())), c.data);
  }
}

}  // namespace

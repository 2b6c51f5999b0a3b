// Archives written in process, compared byte for byte with archives spelled out here.
#include "src/entrywriter.h"

#include <string>

#include "gtest/gtest.h"
#include "port/src/string.h"
#include "src/linkrun.h"
#include "tests/support/linkfixture.h"
#include "tests/support/raisedtext.h"
#include "tests/support/teststream.h"

namespace {

std::string FromHex(const char* hex) {
  std::string bytes;
  for (const char* p = hex; p[0] != '\0' && p[1] != '\0'; p += (p[2] == ' ' ? 3 : 2)) {
    bytes += static_cast<char>(std::stoi(std::string(p, 2), nullptr, 16));
  }
  return bytes;
}

// Writes `lines` as the response file (each "@" standing for the directory) and links it.
std::string LinkLines(const LinkTempDir_t& dir, std::string lines) {
  for (size_t at = lines.find('@'); at != std::string::npos; at = lines.find('@', at)) {
    lines.replace(at, 1, dir.Path());
  }
  dir.Put("list.ls", lines);
  LinkRun((dir / "list.ls").c_str(), (dir / "out.LB").c_str());
  return ReadBytes(dir / "out.LB");
}

TEST(EntryWriter, DocumentedHelloExample) {
  LinkTempDir_t dir;
  dir.Put("a.dat", "hello");
  const std::string stored =
      FromHex("01 00 00 00 15 00 00 00 44 41 54 00 00 00 00 00") + "hello" + Zeros(43);
  const std::string named = FromHex("01 10 00 00 25 00 00 00 44 41 54 00 00 00 00 00") +
                            "a.dat" + Zeros(11) + "hello" + Zeros(27);
  const std::string end = FromHex("FF 00 00 00 10 00 00 00 45 4E 44 30 00 00 00 00") + Zeros(48);
  std::string archive = LinkLines(dir, "%nocompress\n@/a.dat\n");
  EXPECT_EQ(archive.size(), 128u);
  EXPECT_EQ(archive, stored + end);
  EXPECT_EQ(LinkLines(dir, "%nocompress\n@/a.dat setfilename\n"), named + end);
}

TEST(EntryWriter, StoredBodyIsPaddedToSixtyFour) {
  struct Case {
    size_t length;
    size_t padding;
  } cases[] = {{0, 48}, {47, 1}, {48, 0}, {49, 63}, {63, 49}, {64, 48}, {65, 47}, {4096, 48}};
  for (const Case& c : cases) {
    LinkTempDir_t dir;
    std::string data = Pattern(c.length, 3);
    dir.Put("a.dat", data);
    std::string expected = EntryHeader(1, 0, 0, static_cast<uint32_t>(c.length + 16), "DAT\0", 0) +
                           data + Zeros(c.padding) + EndRecord();
    EXPECT_EQ(LinkLines(dir, "@/a.dat nocomp\n"), expected) << c.length;
  }
}

TEST(EntryWriter, MagicCodeFromExtension) {
  struct Case {
    const char* name;
    const char magic[4];
  } cases[] = {
      {"a.dat", {'D', 'A', 'T', 0}}, {"a.tex2d", {'T', 'E', 'X', '2'}}, {"x", {0, 0, 0, 0}},
      {"x.tmxa", {'T', 'M', 'X', 'A'}}, {"x.Tm2", {'T', 'M', '2', 0}}, {"x.tm", {'T', 'M', 0, 0}},
      {"d.v/x", {0, 0, 0, 0}}, {"x.", {0, 0, 0, 0}}, {"x.a-b", {'A', '-', 'B', 0}},
  };
  for (const Case& c : cases) {
    LinkTempDir_t dir;
    dir.Put(c.name, "z");
    std::string expected = EntryHeader(1, 0, 0, 17, c.magic, 0) + "z" + Zeros(47) + EndRecord();
    EXPECT_EQ(LinkLines(dir, std::string("%nocomp\n@/") + c.name + "\n"), expected) << c.name;
  }
}

TEST(EntryWriter, UserIdIsLow16BitsOfTheIdOption) {
  struct Case {
    const char* options;
    uint16_t id;
  } cases[] = {{"id=0x10", 16}, {"id=010", 8}, {"id=", 0}, {"id=-1", 0xFFFF},
               {"id=65536", 0}, {"ID=5", 5}, {"id=3 id=7", 3}, {"", 0}};
  for (const Case& c : cases) {
    LinkTempDir_t dir;
    dir.Put("a.dat", "hello");
    std::string expected =
        EntryHeader(1, 0, c.id, 21, "DAT\0", 0) + "hello" + Zeros(43) + EndRecord();
    EXPECT_EQ(LinkLines(dir, std::string("@/a.dat nocomp ") + c.options + "\n"), expected)
        << c.options;
  }
}

TEST(EntryWriter, NameBlockHoldsBaseNameRoundedToSixteen) {
  struct Case {
    std::string name;
    const char magic[4];
    size_t block;
  } cases[] = {{"data/img/a.dat", {'D', 'A', 'T', 0}, 16},
               {std::string(11, 'f') + ".bin", {'B', 'I', 'N', 0}, 16},
               {std::string(12, 'g') + ".bin", {'B', 'I', 'N', 0}, 32},
               {std::string(43, 'h') + ".bin", {'B', 'I', 'N', 0}, 48}};
  for (const Case& c : cases) {
    LinkTempDir_t dir;
    dir.Put(c.name, "hello");
    std::string base = c.name.substr(c.name.rfind('/') + 1);
    uint32_t file_size = static_cast<uint32_t>(16 + c.block + 5);
    std::string expected = EntryHeader(1, static_cast<uint8_t>(c.block), 0, file_size, c.magic, 0) +
                           base + Zeros(c.block - base.size()) + "hello" +
                           Zeros((64 - file_size % 64) % 64) + EndRecord();
    EXPECT_EQ(LinkLines(dir, "%setfilename\n%nocomp\n@/" + c.name + "\n"), expected) << c.name;
  }
}

TEST(EntryWriter, NameBlockForAnEmptyBaseNameIsRefused) {
  TestStream_t dst;
  TestStream_t src("hello");
  PortFilename_t name("dir\\");
  qorStdFileHeader_t header = {};
  header.fileSize = 21;
  PortStringToken_t token;
  token.parse("setfilename");
  EXPECT_EQ(RaisedText([&] { NormalWrite(dst, src, name, header, token, false, false); }),
            "'dir\\' illegal filename.");
  EXPECT_EQ(dst.Content(), "");
}

TEST(EntryWriter, OwnHeaderFileKeepsItsHeader) {
  const std::string body = "0123456789abcdefXYZ";  // 19 bytes
  struct Case {
    std::string file;
    std::string options;
    std::string entry;
  } cases[] = {
      {EntryHeader(0x22, 0x00, 7, 35, "MDL\0", 0) + body, "", 
       EntryHeader(0x22, 0x00, 7, 35, "MDL\0", 0) + body + Zeros(29)},
      {EntryHeader(0x22, 0x00, 7, 35, "MDL\0", 0) + body, "id=0x1234",
       EntryHeader(0x22, 0x00, 0x1234, 35, "MDL\0", 0) + body + Zeros(29)},
      {EntryHeader(0x22, 0x00, 7, 35, "MDL\0", 0) + body + "trailing bytes", "",
       EntryHeader(0x22, 0x00, 7, 35, "MDL\0", 0) + body + Zeros(29)},
      // A body already compressed is taken over, also when the line asks to compress.
      {EntryHeader(0x22, 0x01, 7, 35, "MDL\0", 500) + body, "comp setfilename",
       EntryHeader(0x22, 0x11, 7, 51, "MDL\0", 500) + "h.MB" + Zeros(12) + body + Zeros(13)},
      // Its own name block is skipped; the entry's block follows this line.
      {EntryHeader(0x22, 0x10, 7, 51, "MDL\0", 0) + "old" + Zeros(13) + body, "",
       EntryHeader(0x22, 0x00, 7, 35, "MDL\0", 0) + body + Zeros(29)},
      {EntryHeader(0x22, 0x21, 7, 67, "MDL\0", 9) + "old" + Zeros(29) + body, "setfilename",
       EntryHeader(0x22, 0x11, 7, 51, "MDL\0", 9) + "h.MB" + Zeros(12) + body + Zeros(13)},
  };
  for (const Case& c : cases) {
    LinkTempDir_t dir;
    dir.Put("h.MB", c.file);
    EXPECT_EQ(LinkLines(dir, "%nocomp\n@/h.MB " + c.options + "\n"), c.entry + EndRecord())
        << c.options;
  }
}

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
  struct Case {
    const std::string* bytes;
    int merge_mode;
    const char* options;
  } cases[] = {{&archive, kQorMergeArchive, ""}, {&own, kQorMergeOwnHeader, "nocomp"},
               {&own, kQorMergeOwnHeader, "comp"}};
  for (const Case& c : cases) {
    size_t needed = c.merge_mode == kQorMergeArchive ? c.bytes->size() - 48 : c.bytes->size();
    for (size_t length = 0; length < needed; ++length) {
      TestStream_t dst;
      TestStream_t src(c.bytes->substr(0, length), "in.file");
      PortFilename_t name("in.file");
      PortStringToken_t token;
      token.parse(c.options);
      EXPECT_EQ(RaisedText([&] { WriteEntry(dst, src, name, c.merge_mode, token, true, false); }),
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

TEST(EntryWriter, CompressedBodyExpandsToTheInput) {
  struct Case {
    std::string name;
    std::string data;
    const char* line;
    uint8_t compression;
    size_t block;
  } cases[] = {
      {"empty.dat", "", "@/empty.dat", 0x01, 0},
      {"tile.dat", Pattern(5000, 5), "@/tile.dat", 0x01, 0},
      {"tile.dat", Pattern(150000, 6), "@/tile.dat setfilename", 0x11, 16},
      {"noise.bin", Pattern(777, 7), "@/noise.bin comp", 0x01, 0},
  };
  for (const Case& c : cases) {
    LinkTempDir_t dir;
    dir.Put(c.name, c.data);
    std::string archive = LinkLines(dir, c.line + std::string("\n"));
    ASSERT_GE(archive.size(), 128u);
    uint32_t file_size = Le32At(archive, 4);
    ASSERT_GE(file_size, 16 + c.block);
    size_t padded = (file_size + 63) / 64 * 64;
    std::string magic = c.name.substr(c.name.find('.') + 1);
    for (char& ch : magic) ch = static_cast<char>(toupper(ch));
    std::string payload = archive.substr(16 + c.block, file_size - 16 - c.block);
    std::string expected = EntryHeader(1, c.compression, 0, file_size, magic.c_str(),
                                       static_cast<uint32_t>(c.data.size()));
    if (c.block) expected += c.name + Zeros(c.block - c.name.size());
    expected += payload + Zeros(padded - file_size) + EndRecord();
    EXPECT_EQ(archive, expected) << c.name;
    EXPECT_EQ(Expand(payload, static_cast<uint32_t>(c.data.size())), c.data) << c.name;
  }
}

}  // namespace

// The built qorUnpack run on archives that the built qorLink makes from real files in a
// private directory: exact listings, every damage named with its offset, and extraction whose
// response file relinks the archive byte for byte without writing outside its directory.
#include <dirent.h>
#include <sys/stat.h>

#include <algorithm>
#include <cstdlib>
#include <string>
#include <vector>

#include "gtest/gtest.h"
#include "src/qorArchive.h"
#include "tests/support/linkfixture.h"

namespace {

const char kUsage[] =
    "usage: qorUnpack list ARCHIVE\n"
    "       qorUnpack test ARCHIVE\n"
    "       qorUnpack extract ARCHIVE [-C DIR] [-f] [--no-verify]\n"
    "       qorUnpack --version\n";

ToolRun_t Unpack(const LinkTempDir_t& aDir, const std::vector<std::string>& aArgs) {
  return RunTool(QOR_UNPACK_BIN, aArgs, aDir.Path());
}

// Extracts aDir/aArchive into aDir/rt, relinks there and expects the very same bytes back.
void ExpectRoundTrip(const LinkTempDir_t& aDir, const std::string& aArchive) {
  ToolRun_t run = Unpack(aDir, {"extract", aArchive, "-C", "rt"});
  ASSERT_EQ(run.status, 0) << run.err;
  EXPECT_EQ(run.err, "");
  const std::string stem = aArchive.substr(0, aArchive.rfind('.'));
  run = RunTool(QOR_LINK_BIN, {stem + ".ls", "-o", stem + ".LB"}, aDir / "rt");
  ASSERT_EQ(run.status, 0) << run.err;
  EXPECT_TRUE(ReadBytes(aDir / aArchive) == ReadBytes(aDir / ("rt/" + stem + ".LB")))
      << ReadBytes(aDir / ("rt/" + stem + ".ls"));
}

std::string OwnHeaderFile(uint8_t aType, uint8_t aCompression, const std::string& aBody,
                          uint32_t aRealSize) {
  return EntryHeader(aType, aCompression, 9, static_cast<uint32_t>(16 + aBody.size()), "MDL",
                     aRealSize) + aBody;
}

// Every path below aRoot, relative to it, sorted.
std::vector<std::string> Tree(const std::string& aRoot, const std::string& aRel = "") {
  std::vector<std::string> paths;
  DIR* d = opendir((aRoot + "/" + aRel).c_str());
  while (struct dirent* ent = d != nullptr ? readdir(d) : nullptr) {
    const std::string name = ent->d_name;
    if (name == "." || name == "..") continue;
    const std::string rel = aRel.empty() ? name : aRel + "/" + name;
    paths.push_back(rel);
    if (ent->d_type == DT_DIR) {
      for (const std::string& below : Tree(aRoot, rel)) paths.push_back(below);
    }
  }
  if (d != nullptr) closedir(d);
  std::sort(paths.begin(), paths.end());
  return paths;
}

TEST(QorUnpackCli, EveryMergeModeRoundTrips) {
  // An input archive whose entries lie back to back, as the archive merge reads them.
  const std::string merged = EntryHeader(3, 0, 1, 64, "SUB", 0) + std::string(48, 's') +
                             EntryHeader(1, 0x10, 0, 64, "DAT", 0) + "m.dat" + Zeros(11) +
                             std::string(32, 'm') + EndRecord();
  const FileSet_t files = {
      {"a.dat", "hello"}, {"big.txt", Pattern(300000, 1)}, {"empty.bin", ""},
      {"noext", Pattern(700, 2)}, {"d1/same.dat", "first"}, {"d2/same.dat", "second"},
      {"x.tex2d", std::string(48, 't')}, {"m.MB", OwnHeaderFile(1, 0, Pattern(100, 3), 0)},
      {"c.AB", OwnHeaderFile(7, 1, "\x43\x41\xFF", 3)}, {"in.PB", merged},
      {"raw.TB", EntryHeader(2, 0, 0, 21, "RAW", 0) + "as is" + Zeros(43)}};
  const struct {
    const char* what;
    std::string resp;
  } cases[] = {
      {"plain files", "%nocompress\na.dat id=3\nbig.txt comp\nempty.bin\nnoext id=0x10\n"
                      "%comp\nempty.bin\nx.tex2d id=65535\na.dat setfilename\n"},
      {"name blocks and duplicates", "%setfilename\nd1/same.dat\nd2/same.dat nocomp\n"
                                     "a.dat\nd1/same.dat id=2\nnoext\n%nosetfilename\na.dat\n"},
      {"own headers, archives, raw files", "m.MB\nm.MB nocomp setfilename\nc.AB\nin.PB\nraw.TB\n"},
      {"without end record", "%noendrecord\na.dat\nbig.txt nocomp\n"},
      {"empty without end record", "%noendrecord\n"},
      {"end record alone", "; nothing\n"},
  };
  for (const auto& c : cases) {
    SCOPED_TRACE(c.what);
    LinkTempDir_t dir;
    LinkFiles(dir, files, c.resp);
    ToolRun_t run = Unpack(dir, {"test", "a.LB"});
    EXPECT_EQ(run.status, 0) << run.out;
    ExpectRoundTrip(dir, "a.LB");
  }
}

TEST(QorUnpackCli, ListAndExtractNameEveryEntry) {
  LinkTempDir_t dir;
  LinkFiles(dir,
            {{"a.dat", "hello"}, {"z.bin", Zeros(40)}, {"e", ""}, {"d1/same.dat", "first"},
             {"d2/same.dat", "second"}, {"m.MB", OwnHeaderFile(4, 0, "body", 0)}},
            "%nocompress\na.dat id=3\n%comp\nz.bin setfilename\ne nocomp\n%setfilename\n"
            "d1/same.dat nocomp\nd2/same.dat id=7 nocomp\n%nosetfilename\nm.MB nocomp\n");
  ToolRun_t run = Unpack(dir, {"list", "a.LB"});
  EXPECT_EQ(run.status, 0);
  EXPECT_EQ(run.err, "");
  EXPECT_EQ(run.out,
            "    offset type method     userId   fileSize   realSize magic            name\n"
            "         0   01 stored          3         21          0 DAT              -\n"
            "        64   01 compressed      0         36         40 BIN              z.bin\n"
            "       128   01 stored          0         16          0 \\x00             -\n"
            "       192   01 stored          0         37          0 DAT              same.dat\n"
            "       256   01 stored          7         38          0 DAT              same.dat\n"
            "       320   04 stored          9         20          0 MDL              -\n"
            "6 entries, 24 bytes stored, 60 bytes expanded, end record at offset 384\n");

  run = Unpack(dir, {"extract", "a.LB", "-C", "x"});
  EXPECT_EQ(run.status, 0) << run.err;
  EXPECT_EQ(Tree(dir / "x"), std::vector<std::string>({"0000.dat", "0002", "0004", "0004/same.dat",
                                                       "0005.TB", "a.ls", "same.dat", "z.bin"}));
  EXPECT_EQ(ReadBytes(dir / "x/0004/same.dat"), "second");
  EXPECT_EQ(ReadBytes(dir / "x/a.ls"),
            "; extracted by qorUnpack; to rebuild the archive, run in this directory:\n"
            ";   qorLink a.ls -o a.LB\n"
            "%nocompress\n0000.dat id=3\n%compress\n%setfilename\nz.bin\n"
            "%nocompress\n%nosetfilename\n0002\n%setfilename\nsame.dat\n0004/same.dat id=7\n"
            "0005.TB\n");
}

std::string With(std::string aBytes, size_t aOffset, char aByte) {
  aBytes[aOffset] = aByte;
  return aBytes;
}

TEST(QorUnpackCli, TestNamesEveryDamageWithItsOffset) {
  LinkTempDir_t base;
  // Entry 0 at 0: "hello" stored; entry 1 at 64: 40 zero bytes compressed to 20 28 00 FF
  // (payload at 80..83); entry 2 at 128: 100 bytes stored; the end record at 256.
  const std::string sound = LinkFiles(
      base, {{"a.dat", "hello"}, {"z.bin", Zeros(40)}, {"c.dat", std::string(100, 'c')}},
      "a.dat nocomp\nz.bin\nc.dat nocomp\n");
  ASSERT_EQ(sound.size(), 320u);
  ASSERT_EQ(sound.substr(80, 4), std::string("\x20\x28\x00\xFF", 4));
  const std::string prefix = "a.LB: ";
  const struct {
    const char* what;
    std::string bytes;
    std::vector<std::string> lines;
    const char* absent;  // what a failed extract has not written; nullptr: extract relinks
  } cases[] = {
      {"cut in a header", sound.substr(0, 136),
       {"entry 2, offset 128: the archive ends inside a header (8 of 16 bytes present)"}, "x"},
      {"cut in a body", sound.substr(0, 200),
       {"entry 2, offset 128: fileSize 116 runs past the end of the archive (72 bytes left)"}, "x"},
      {"cut in the padding", sound.substr(0, 250),
       {"entry 2, offset 244: the archive ends inside the padding (6 of 12 bytes present)"}, "x"},
      {"huge fileSize", sound.substr(0, 132) + "\xF0\xFF\xFF\xFF" + sound.substr(136),
       {"entry 2, offset 128: fileSize 4294967280 runs past the end of the archive (192 bytes left)"},
       "x"},
      {"garbage after the end record", sound + "trailing",
       {"offset 320: 8 bytes follow the end record"}, "x"},
      {"lost end mark", With(sound, 83, 0),
       {"entry 1, offset 80: the compressed body (4 bytes) does not expand to exactly realSize 40 bytes"},
       "x/a.ls"},
      // Kept as they are, in raw files.
      {"name block without its zero byte", With(sound, 129, 0x10),
       {"entry 2, offset 144: the name block holds no terminating zero byte"}, nullptr},
      {"non-zero padding, twice", With(With(sound, 30, 1), 250, 'p'),
       {"entry 0, offset 30: non-zero byte in the padding",
        "entry 2, offset 250: non-zero byte in the padding"},
       nullptr},
  };
  for (const auto& c : cases) {
    SCOPED_TRACE(c.what);
    LinkTempDir_t dir;
    dir.Put("a.LB", c.bytes);
    std::string want;
    for (const std::string& line : c.lines) want += prefix + line + "\n";
    want += prefix + std::to_string(c.lines.size()) + (c.lines.size() == 1 ? " problem" : " problems") +
            " found\n";
    ToolRun_t run = Unpack(dir, {"test", "a.LB"});
    EXPECT_EQ(run.status, 1);
    EXPECT_EQ(run.out, want);
    if (c.absent == nullptr) {
      ExpectRoundTrip(dir, "a.LB");
      continue;
    }
    const std::string failure = "qorUnpack: " + prefix + c.lines[0] + "\n";
    run = Unpack(dir, {"extract", "a.LB", "-C", "x"});
    EXPECT_EQ(run.status, 1);
    EXPECT_EQ(run.err, failure);
    EXPECT_FALSE(FileExists(dir / c.absent));
    if (c.absent == std::string("x")) {  // a damaged structure stops list as well
      run = Unpack(dir, {"list", "a.LB"});
      EXPECT_EQ(run.status, 1);
      EXPECT_EQ(run.err, failure);
    }
  }
}

std::string NamedEntry(const std::string& aName, const std::string& aBody) {
  const std::string block = aName + Zeros(16 - aName.size() % 16);
  const uint32_t file_size = static_cast<uint32_t>(16 + block.size() + aBody.size());
  const uint8_t compression = static_cast<uint8_t>(block.size());
  return EntryHeader(1, compression, 0, file_size, "DAT", 0) + block + aBody +
         Zeros(QorPadLength(file_size));
}

TEST(QorUnpackCli, HostileNamesStayInsideTheDirectory) {
  LinkTempDir_t dir;
  const char* names[] = {"../up.dat", "/tmp/abs.dat", "a/b.dat", "", "a\x01.dat",
                         "..",        "a\\b.dat",     "%p.dat",  "ok.dat", "ok.dat"};
  std::string archive;
  for (const char* name : names) archive += NamedEntry(name, "data");
  dir.Put("a.LB", archive + EndRecord());
  dir.Put("x/keep", "");
  ToolRun_t run = Unpack(dir, {"extract", "a.LB", "-C", "x"});
  ASSERT_EQ(run.status, 0) << run.err;
  EXPECT_EQ(Tree(dir.Path()),
            std::vector<std::string>({"a.LB", "x", "x/0000.TB", "x/0001.TB", "x/0002.TB",
                                      "x/0003.TB", "x/0004.TB", "x/0005.TB", "x/0006.TB",
                                      "x/0007.TB", "x/0009", "x/0009/ok.dat", "x/a.ls", "x/keep",
                                      "x/ok.dat"}));
  ExpectRoundTrip(dir, "a.LB");
}

TEST(QorUnpackCli, PayloadsFromAnotherEncoderAreKeptRaw) {
  LinkTempDir_t dir;
  // "AAA" as a normal run: valid, but qorLink's compressor writes 43 41 FF for it.
  const std::string payload("\x03" "AAA" "\xFF", 5);
  dir.Put("a.LB", EntryHeader(1, 1, 0, 21, "DAT", 3) + payload + Zeros(43) + EndRecord());
  EXPECT_EQ(Unpack(dir, {"test", "a.LB"}).status, 0);
  ExpectRoundTrip(dir, "a.LB");
  EXPECT_EQ(ReadBytes(dir / "rt/0000.TB").size(), 64u);
  // Unverified, the payload is taken for qorLink's own: the data comes out, the relink differs.
  ASSERT_EQ(Unpack(dir, {"extract", "a.LB", "-C", "nv", "--no-verify"}).status, 0);
  EXPECT_EQ(ReadBytes(dir / "nv/0000.dat"), "AAA");
}

TEST(QorUnpackCli, ExistingFilesAreReplacedOnlyWithForce) {
  LinkTempDir_t dir;
  LinkFiles(dir, {{"a.dat", "hello"}}, "a.dat setfilename\n");
  ASSERT_EQ(Unpack(dir, {"extract", "a.LB", "-C", "x"}).status, 0);
  dir.Put("x/a.dat", "changed");
  ToolRun_t run = Unpack(dir, {"extract", "a.LB", "-C", "x"});
  EXPECT_EQ(run.status, 1);
  EXPECT_EQ(run.err, "qorUnpack: x/a.dat: already exists (-f overwrites)\n");
  EXPECT_EQ(ReadBytes(dir / "x/a.dat"), "changed");
  run = Unpack(dir, {"extract", "-f", "a.LB", "-C", "x"});
  EXPECT_EQ(run.status, 0) << run.err;
  EXPECT_EQ(ReadBytes(dir / "x/a.dat"), "hello");

  // An entry named like the archive itself never replaces it, forced or not.
  dir.Put("out/keep", "");
  ASSERT_EQ(RunTool(QOR_LINK_BIN, {"a.ls", "-o", "out/a.dat"}, dir.Path()).status, 0);
  const std::string archive = ReadBytes(dir / "out/a.dat");
  run = Unpack(dir, {"extract", "-f", "out/a.dat", "-C", "out"});
  EXPECT_EQ(run.status, 1);
  EXPECT_EQ(run.err, "qorUnpack: out/a.dat: is the archive being extracted\n");
  EXPECT_EQ(ReadBytes(dir / "out/a.dat"), archive);
}

// Usage errors exit with 2, failures with 1.
TEST(QorUnpackCli, CommandLineStatusesAndTexts) {
  const std::string usage = kUsage;
  const struct {
    std::vector<std::string> args;
    int status;
    std::string out;
    std::string err;
  } cases[] = {
      {{}, 2, "", "qorUnpack: no command given\n" + usage},
      {{"unpack", "a.LB"}, 2, "", "qorUnpack: unknown command 'unpack'\n" + usage},
      {{"list"}, 2, "", "qorUnpack: no archive given\n" + usage},
      {{"test", "a.LB", "b.LB"}, 2, "",
       "qorUnpack: more than one archive given ('b.LB')\n" + usage},
      {{"extract", "a.LB", "-C"}, 2, "", "qorUnpack: -C needs a directory\n" + usage},
      {{"extract", "a.LB", "-x"}, 2, "", "qorUnpack: unknown option '-x'\n" + usage},
      {{"list", "a.LB", "-f"}, 2, "", "qorUnpack: unknown option '-f'\n" + usage},
      {{"--version"}, 0, "qorUnpack version 0.01\n", ""},
      {{"test", "missing.LB"}, 1, "", "qorUnpack: missing.LB could't open.\n"},
  };
  LinkTempDir_t dir;
  for (const auto& c : cases) {
    ToolRun_t run = Unpack(dir, c.args);
    EXPECT_EQ(run.status, c.status);
    EXPECT_EQ(run.out, c.out);
    EXPECT_EQ(run.err, c.err);
  }
}

// The real-data case: set QOR_CORPUS_DIR to a directory made by bench/make-corpus.sh.
TEST(QorUnpackCli, CorpusArchiveRoundTrips) {
  const char* corpus = getenv("QOR_CORPUS_DIR");
  if (corpus == nullptr || !FileExists(std::string(corpus) + "/freedoom.ls")) {
    GTEST_SKIP() << "QOR_CORPUS_DIR is not set to a corpus directory";
  }
  LinkTempDir_t dir;
  ToolRun_t run = RunTool(QOR_LINK_BIN, {"freedoom.ls", "-o", dir / "freedoom.LB"}, corpus);
  ASSERT_EQ(run.status, 0) << run.err;
  run = Unpack(dir, {"test", "freedoom.LB"});
  EXPECT_EQ(run.status, 0) << run.out;
  ExpectRoundTrip(dir, "freedoom.LB");
}

}  // namespace

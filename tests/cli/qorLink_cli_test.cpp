// The built qorLink run in a private directory: exact standard output, standard error and
// exit status, and which files exist afterwards.
#include <sys/stat.h>
#include <unistd.h>

#include <map>
#include <string>
#include <vector>

#include "gtest/gtest.h"
#include "tests/support/linkfixture.h"

namespace {

const std::string kUsage =
    "\n  usage: qorLink [options] respfile.ext<cr>\n\n  options:\n"
    "    -o or --output, <file> : set output filename <file>.\n\n";

typedef std::map<std::string, std::string> Files_t;

ToolRun_t Link(const LinkTempDir_t& dir, const std::vector<std::string>& args) {
  return RunTool(QOR_LINK_BIN, args, dir.Path());
}

void PutAll(const LinkTempDir_t& dir, const Files_t& files) {
  for (const auto& file : files) dir.Put(file.first, file.second);
}

TEST(QorLinkCli, CommandLineErrorsAndVersion) {
  struct Case {
    std::vector<std::string> args;
    std::string out;
    std::string err;
  } cases[] = {
      {{}, "", "\nError : no response file name.\n"},
      {{"-o"}, "", "\nError : too few arguments.\n"},
      {{"list", "--output"}, "", "\nError : too few arguments.\n"},
      {{"--version"}, "\nqorLink version 0.01\n", ""},
      {{"list", "--version"}, "\nqorLink version 0.01\n", ""},
      {{"-"}, "", "\nError : unknown option.[]\n" + kUsage},
      {{"-version"}, "", "\nError : unknown option.[version]\n" + kUsage},
      {{"-output", "x"}, "", "\nError : unknown option.[output]\n" + kUsage},
      {{"-x", "list"}, "", "\nError : unknown option.[x]\n" + kUsage},
      {{"--version", "-x"}, "\nqorLink version 0.01\n", ""},
      {{"list", "other"}, "", kUsage},
      {{"-o", "out"}, "", "\nError : no response file name.\n"},
  };
  ASSERT_EQ(kUsage.size(), 115u);
  for (const Case& c : cases) {
    LinkTempDir_t dir;
    dir.Put("list.ls", "a.dat\n");
    dir.Put("a.dat", "hello");
    ToolRun_t run = Link(dir, c.args);
    std::string shown = c.args.empty() ? "(none)" : c.args[0] + " ...";
    EXPECT_EQ(run.status, 1) << shown;
    EXPECT_EQ(run.out, c.out) << shown;
    EXPECT_EQ(run.err, c.err) << shown;
    EXPECT_FALSE(FileExists(dir / "list.LB")) << shown;
    EXPECT_FALSE(FileExists(dir / "out.LB")) << shown;
  }
}

// The response file holds no line, so each output is the end record alone.
TEST(QorLinkCli, OutputNameDerivation) {
  struct Case {
    std::string resp_file;
    std::vector<std::string> args;
    std::string output;
  } cases[] = {
      {"lists/stage1.ls", {"lists/stage1"}, "stage1.LB"},
      {"a.b.ls", {"a.b.ls"}, "a.b.LB"},
      {"lists/x.txt", {"lists\\x.txt"}, "x.LB"},
      {"list.ls", {"list", "-o", "out"}, "out.LB"},
      {"list.ls", {"-o", "out/all", "list"}, "out/all.LB"},
      {"list.ls", {"list", "--output", "all.bin"}, "all.bin"},
      {"list.ls", {"list", "-o", "first", "-o", "-last"}, "-last.LB"},
      {"dir.old/list.ls", {"dir.old/list"}, "list.LB"},
  };
  for (const Case& c : cases) {
    LinkTempDir_t dir;
    dir.Put(c.resp_file, "");
    dir.Put("out/keep", "");
    ToolRun_t run = Link(dir, c.args);
    EXPECT_EQ(run.status, 0) << c.output << ": " << run.err;
    EXPECT_EQ(run.err, "");
    EXPECT_EQ(ReadBytes(dir / c.output), EndRecord()) << c.output;
  }
}

// Every failure prints one line and exits 1; an archive already created is removed.
TEST(QorLinkCli, FailureTextsAndArchiveRemoval) {
  const std::string own_header_short = EntryHeader(0x22, 0x00, 0, 16 + 8, "MDL\0", 0) + "1234";
  const std::string own_header_bad = EntryHeader(0x22, 0x10, 0, 16 + 15, "MDL\0", 0) + Zeros(40);
  const std::string name48(48, 'n');
  struct Case {
    Files_t files;
    std::vector<std::string> args;
    std::string err;
    std::string output;
  } cases[] = {
      {{}, {"list"}, "Exception : list.ls could't open.\n", "list.LB"},
      {{{"lists/a.ls", "a.dat\n; note\n%foo\n"}, {"a.dat", "hello"}},
       {"lists/a"},
       "Exception : lists/a:3: unknow directive %foo.\n",
       "a.LB"},
      {{{"list.ls", "% nocompress\n"}}, {"list"}, "Exception : list:1: unknow directive %.\n",
       "list.LB"},
      {{{"list.ls", "a.dat\nmissing.dat id=zz\n"}, {"a.dat", "hello"}},
       {"list"},
       "Exception : missing.dat could't open.\n",
       "list.LB"},
      {{{"list.ls", "sub\\missing.dat\n"}}, {"list"},
       "Exception : sub/missing.dat could't open.\n", "list.LB"},
      {{{"list.ls", "%setfilename\nsub\\\n"}, {"sub/keep", ""}},
       {"list"},
       "Exception : sub/ could't open.\n",
       "list.LB"},
      {{{"list.ls", "a.dat id=12a\n"}, {"a.dat", "hello"}},
       {"list"},
       "Exception : Error : option id=12a\n\n",
       "list.LB"},
      {{{"list.ls", "a.dat comp COMP\n"}, {"a.dat", "hello"}},
       {"list"},
       "Exception : Error : duplicate compress-options.\n",
       "list.LB"},
      {{{"list.ls", "a.dat setfilename nosetfilename\n"}, {"a.dat", "hello"}},
       {"list"},
       "Exception : Error : duplicate setfilename-options.\n",
       "list.LB"},
      {{{"list.ls", "%setfilename\nd/" + name48 + "\n"}, {"d/" + name48, "x"}},
       {"list"},
       "Exception : " + name48 + "it too long.\n\n",
       "list.LB"},
      {{{"list.ls", "x.MB\n"}, {"x.MB", "0123456789"}},
       {"list"},
       "Exception : x.MB read error.\n",
       "list.LB"},
      {{{"list.ls", "x.MB nocomp\n"}, {"x.MB", own_header_short}},
       {"list"},
       "Exception : x.MB read error.\n",
       "list.LB"},
      {{{"list.ls", "x.AB\n"}, {"x.AB", own_header_bad}},
       {"list"},
       "Exception : x.AB invalid file format.\n",
       "list.LB"},
      {{{"list.ls", "x.PB\n"}, {"x.PB", EntryHeader(1, 0, 0, 15, "DAT\0", 0) + Zeros(64)}},
       {"list"},
       "Exception : x.PB invalid file format.\n",
       "list.LB"},
      {{{"list.ls", "x.PB\n"}, {"x.PB", EntryHeader(1, 0, 0, 21, "DAT\0", 0) + "hello"}},
       {"list"},
       "Exception : x.PB read error.\n",
       "list.LB"},
      {{{"list.ls", "a.dat\n"}, {"a.dat", "hello"}},
       {"list", "-o", "list.ls"},
       "Exception : list.ls could't create.\n",
       ""},
      {{{"list.ls", "a.dat\n"}, {"a.dat", "hello"}},
       {"list", "-o", "nodir\\x"},
       "Exception : nodir/x.LB could't create.\n",
       "nodir"},
      {{{"list.ls", "a.dat\nlist.LB\n"}, {"a.dat", "hello"}},
       {"list"},
       "Exception : list.LB could't open.\n",
       "list.LB"},
  };
  for (const Case& c : cases) {
    LinkTempDir_t dir;
    PutAll(dir, c.files);
    ToolRun_t run = Link(dir, c.args);
    EXPECT_EQ(run.status, 1) << c.err;
    EXPECT_EQ(run.out, "");
    EXPECT_EQ(run.err, c.err);
    if (!c.output.empty()) {
      EXPECT_FALSE(FileExists(dir / c.output)) << c.err;
    }
    for (const auto& file : c.files) EXPECT_EQ(ReadBytes(dir / file.first), file.second);
  }
}

TEST(QorLinkCli, MissingResponseFileLeavesExistingOutputAlone) {
  LinkTempDir_t dir;
  dir.Put("list.LB", "older archive");
  ToolRun_t run = Link(dir, {"list"});
  EXPECT_EQ(run.status, 1);
  EXPECT_EQ(run.err, "Exception : list.ls could't open.\n");
  EXPECT_EQ(ReadBytes(dir / "list.LB"), "older archive");
}

TEST(QorLinkCli, ArchiveReachedThroughAnotherNameIsNotListed) {
  LinkTempDir_t dir;
  dir.Put("list.ls", "alias.dat\n");
  dir.Put("list.LB", "older archive");
  ASSERT_EQ(link((dir / "list.LB").c_str(), (dir / "alias.dat").c_str()), 0);
  ToolRun_t run = Link(dir, {"list"});
  EXPECT_EQ(run.status, 1);
  EXPECT_EQ(run.err, "Exception : alias.dat could't open.\n");
  EXPECT_FALSE(FileExists(dir / "list.LB"));
}

// A name without extension gets ".LB", so a device is reached here through a link.
TEST(QorLinkCli, FailedRunKeepsOutputThatIsNoRegularFile) {
  LinkTempDir_t dir;
  dir.Put("list.ls", "a.dat nocomp\n");
  dir.Put("a.dat", "hello");
  ASSERT_EQ(symlink("/dev/full", (dir / "full.LB").c_str()), 0);
  ToolRun_t run = Link(dir, {"list", "-o", "full.LB"});
  EXPECT_EQ(run.status, 1);
  EXPECT_EQ(run.err, "Exception : full.LB write error.\n");
  struct stat info;
  ASSERT_EQ(lstat("/dev/full", &info), 0);
  EXPECT_TRUE(S_ISCHR(info.st_mode));
  ASSERT_EQ(lstat((dir / "full.LB").c_str(), &info), 0);
  EXPECT_TRUE(S_ISLNK(info.st_mode));
}

// The run of the overview: a comment, directives, an id, a file with its own header
// compressed with a name block, and an archive merged entry by entry.
TEST(QorLinkCli, TypicalRun) {
  LinkTempDir_t dir;
  const std::string logo = Pattern(100, 1);
  const std::string hero_body = Pattern(300, 2);
  const std::string music_a = EntryHeader(1, 0x00, 0, 16 + 5, "DAT\0", 0) + "hello";
  const std::string music_b = EntryHeader(2, 0x10, 9, 16 + 16 + 3, "BIN\0", 0) + "b.bin" +
                              Zeros(11) + "abc";
  dir.Put("stage1.ls",
          "; first stage\r\n%nocompress\nlogo.tim id=3\n%comp\n%setfilename\nmodel/hero.MB\n"
          "music.PB");
  dir.Put("logo.tim", logo);
  dir.Put("model/hero.MB", EntryHeader(0x22, 0x00, 7, 16 + 300, "HERO", 0) + hero_body);
  dir.Put("music.PB", music_a + music_b + EndRecord() + "after the end");

  ToolRun_t run = Link(dir, {"stage1"});
  ASSERT_EQ(run.status, 0) << run.err;
  EXPECT_EQ(run.out + run.err, "");
  std::string archive = ReadBytes(dir / "stage1.LB");

  std::string expected = EntryHeader(1, 0x00, 3, 116, "TIM\0", 0) + logo + Zeros(12);
  ASSERT_GE(archive.size(), 128u + 48);
  uint32_t hero_size = Le32At(archive, 128 + 4);
  ASSERT_GT(hero_size, 32u);
  size_t hero_padded = (hero_size + 63) / 64 * 64;
  expected += EntryHeader(0x22, 0x11, 7, hero_size, "HERO", 300) + "hero.MB" + Zeros(9);
  std::string payload = archive.substr(128 + 32, hero_size - 32);
  expected += payload + Zeros(hero_padded - hero_size);
  expected += music_a + Zeros(43) + music_b + Zeros(29) + EndRecord();
  EXPECT_EQ(archive, expected);
  EXPECT_EQ(Expand(payload, 300), hero_body);
}

}  // namespace

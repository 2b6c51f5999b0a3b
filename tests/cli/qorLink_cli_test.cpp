// The built qorLink run in a private directory: exact standard output, standard error and
// exit status, and which files exist afterwards.
#include <unistd.h>

#include <string>
#include <vector>

#include "gtest/gtest.h"
#include "tests/support/linkfixture.h"

namespace {

const std::string kUsage =
    "\n  usage: qorLink [options] respfile.ext<cr>\n\n  options:\n"
    "    -o or --output, <file> : set output filename <file>.\n\n";

ToolRun_t Link(const LinkTempDir_t& dir, const std::vector<std::string>& args) {
  return RunTool(QOR_LINK_BIN, args, dir.Path());
}

void PutAll(const LinkTempDir_t& dir, const FileSet_t& files) {
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

// Every failure prints one line and exits 1. Each run finds an older list.LB: an archive
// the run created is removed, one it never opened keeps its bytes, and no input changes.
TEST(QorLinkCli, FailureTextsAndArchiveRemoval) {
  const std::string own_header_short = EntryHeader(0x22, 0x00, 0, 16 + 8, "MDL\0", 0) + "1234";
  const std::string own_header_bad = EntryHeader(0x22, 0x10, 0, 16 + 15, "MDL\0", 0) + Zeros(40);
  const std::string name48(48, 'n');
  const std::string long_name_list = "%setfilename\nd/" + name48 + "\n";
  const struct {
    const char* list;  // list.ls, or nullptr for none
    std::string err;   // after "Exception : "
    FileSet_t files;
    std::vector<std::string> args;
    bool removed;  // list.LB was created and is gone
  } cases[] = {
      {nullptr, "list.ls could't open.\n", {}, {"list"}, false},
      {"", "lists/a:3: unknow directive %foo.\n", {{"lists/a.ls", "a.dat\n; note\n%foo\n"}},
       {"lists/a"}, false},
      {"% nocompress\n", "list:1: unknow directive %.\n", {}, {"list"}, true},
      {"a.dat\nmissing.dat id=zz\n", "missing.dat could't open.\n", {}, {"list"}, true},
      {"sub\\missing.dat\n", "sub/missing.dat could't open.\n", {}, {"list"}, true},
      {"%setfilename\nsub\\\n", "sub/ could't open.\n", {{"sub/keep", ""}}, {"list"}, true},
      {"a.dat id=12a\n", "Error : option id=12a\n\n", {}, {"list"}, true},
      {"a.dat comp COMP\n", "Error : duplicate compress-options.\n", {}, {"list"}, true},
      {"a.dat setfilename nosetfilename\n", "Error : duplicate setfilename-options.\n", {},
       {"list"}, true},
      {long_name_list.c_str(), name48 + "it too long.\n\n", {{"d/" + name48, "x"}}, {"list"}, true},
      {"x.MB\n", "x.MB read error.\n", {{"x.MB", "0123456789"}}, {"list"}, true},
      {"x.MB nocomp\n", "x.MB read error.\n", {{"x.MB", own_header_short}}, {"list"}, true},
      {"x.AB\n", "x.AB invalid file format.\n", {{"x.AB", own_header_bad}}, {"list"}, true},
      {"x.PB\n", "x.PB invalid file format.\n",
       {{"x.PB", EntryHeader(1, 0, 0, 15, "DAT\0", 0) + Zeros(64)}}, {"list"}, true},
      {"x.PB\n", "x.PB read error.\n", {{"x.PB", EntryHeader(1, 0, 0, 21, "DAT\0", 0) + "hello"}},
       {"list"}, true},
      // The archive is the response file, or a listed file reaches it through a link.
      {"a.dat\n", "list.ls could't create.\n", {}, {"list", "-o", "list.ls"}, false},
      {"a.dat\nalias.dat\n", "alias.dat could't open.\n", {}, {"list"}, true},
      {"a.dat\n", "nodir/x.LB could't create.\n", {}, {"list", "-o", "nodir\\x"}, false},
  };
  for (const auto& c : cases) {
    SCOPED_TRACE(c.err);
    LinkTempDir_t dir;
    FileSet_t files = c.files;
    files["a.dat"] = "hello";
    if (c.list != nullptr) files["list.ls"] = c.list;
    PutAll(dir, files);
    dir.Put("list.LB", "older archive");
    ASSERT_EQ(symlink("list.LB", (dir / "alias.dat").c_str()), 0);
    ToolRun_t run = Link(dir, c.args);
    EXPECT_EQ(run.status, 1);
    EXPECT_EQ(run.out, "");
    EXPECT_EQ(run.err, "Exception : " + c.err);
    if (c.removed) {
      EXPECT_FALSE(FileExists(dir / "list.LB"));
    } else {
      EXPECT_EQ(ReadBytes(dir / "list.LB"), "older archive");
    }
    EXPECT_FALSE(FileExists(dir / "nodir"));
    for (const auto& file : files) EXPECT_EQ(ReadBytes(dir / file.first), file.second);
  }
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

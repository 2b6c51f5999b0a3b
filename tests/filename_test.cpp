#include "port/src/filename.h"

#include <string>

#include <gtest/gtest.h>

#include "tests/support/raisedtext.h"

namespace {

// Exposes the protected raise for testing.
class CheckedName_t : public PortFilename_t {
 public:
  explicit CheckedName_t(const char* aStr) : PortFilename_t(aStr) {}
  void Reject() { Error(); }
};

TEST(PortFilename, Parts) {
  const struct {
    const char* name;
    const char* filename;
    int base;
    const char* dir;
    const char* base_file;
    const char* base_name;
    const char* ext;
  } cases[] = {
      {"D:\\data\\list.txt", "D:/data/list.txt", 8, "D:/data/", "list.txt", "list", ".txt"},
      {"archive.tar.gz", "archive.tar.gz", 0, "", "archive.tar.gz", "archive.tar", ".gz"},
      {"dir.old/list", "dir.old/list", 8, "dir.old/", "list", "list", ""},
      {"list.", "list.", 0, "", "list.", "list", "."},
      {".profile", ".profile", 0, "", ".profile", "", ".profile"},
      {"dir/", "dir/", 4, "dir/", "", "", ""},
      {"", "", 0, "", "", "", ""},
      {"a/b\\c.d", "a/b/c.d", 4, "a/b/", "c.d", "c", ".d"},
      {"..", "..", 0, "", "..", ".", "."},
  };
  for (const auto& c : cases) {
    const PortFilename_t name(c.name);
    EXPECT_STREQ(c.name, name.GetNakedStr().c_str());
    EXPECT_STREQ(c.filename, name.GetFilename().c_str()) << c.name;
    EXPECT_EQ(c.base, name.GetBaseNameIndex()) << c.name;
    EXPECT_STREQ(c.dir, name.GetDirName().c_str()) << c.name;
    EXPECT_STREQ(c.base_file, name.GetBaseFileName().c_str()) << c.name;
    EXPECT_STREQ(c.base_name, name.GetBaseName().c_str()) << c.name;
    EXPECT_STREQ(c.ext, name.GetExtName().c_str()) << c.name;
  }
}

TEST(PortFilename, ChangeAndDefaultExt) {
  const struct {
    const char* name;
    const char* ext;
    const char* changed;
    const char* defaulted;
  } cases[] = {
      {"dir.old/list", ".LB", "dir.old/list.LB", "dir.old/list.LB"},
      {"list.", ".LB", "list.LB", "list."},
      {".profile", ".LB", ".LB", ".profile"},
      {"dir/", ".ls", "dir/.ls", "dir/.ls"},
      {"", ".ls", ".ls", ".ls"},
      {"list.txt", "LB", "listLB", "list.txt"},
      {"a\\b.txt", ".LB", "a/b.LB", "a/b.txt"},
  };
  for (const auto& c : cases) {
    PortFilename_t changed(c.name);
    changed.ChangeExt(c.ext);
    EXPECT_STREQ(c.changed, changed.GetFilename().c_str()) << c.name << " " << c.ext;
    EXPECT_STREQ(c.changed, changed.GetNakedStr().c_str()) << c.name << " " << c.ext;

    PortFilename_t defaulted(c.name);
    defaulted.DefaultExt(c.ext);
    EXPECT_STREQ(c.defaulted, defaulted.GetFilename().c_str()) << c.name << " " << c.ext;
  }
}

TEST(PortFilename, ClearAndError) {
  PortFilename_t name("a\\b.txt");
  const PortFilename_t copy(name);
  name.Clear();
  EXPECT_EQ(0, name.GetNakedStr().GetLength());
  EXPECT_EQ(0, name.GetFilename().GetLength());
  EXPECT_STREQ("a/b.txt", copy.GetFilename().c_str());
  const PortFilename_t from_string(PortString_t("c\\d"));
  EXPECT_STREQ("c/d", static_cast<const PortString_t&>(from_string).c_str());

  CheckedName_t checked("dir\\a?b");  // quoted as set
  EXPECT_EQ("'dir\\a?b' illegal filename.", RaisedText([&] { checked.Reject(); }));
}

}  // namespace

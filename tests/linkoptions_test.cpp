#include "src/linkoptions.h"

#include <string>

#include "gtest/gtest.h"
#include "port/src/string.h"
#include "tests/support/raisedtext.h"

namespace {

std::string Words(const PortStringToken_t& token) {
  std::string words;
  for (int i = 0; i < token.count(); ++i) words += std::string(i ? " " : "") + token.get(i).c_str();
  return words;
}

TEST(LinkOptions, UserIdTakesFirstIdWordOnly) {
  struct Case {
    const char* line;
    bool found;
    int id;
    const char* left;
  } cases[] = {
      {"id=0x10", true, 16, ""},       {"id=010", true, 8, ""},
      {"id=", true, 0, ""},            {"id=-1", true, -1, ""},
      {"x ID=5 y", true, 5, "x y"},    {"id=3 id=7", true, 3, "id=7"},
      {"id=2147483647", true, 2147483647, ""},
      {"comp idx=4 id", false, 99, "comp idx=4 id"},
  };
  for (const Case& c : cases) {
    PortStringToken_t token;
    token.parse(c.line);
    int id = 99;
    EXPECT_EQ(CheckOptUserId(token, id), c.found) << c.line;
    EXPECT_EQ(id, c.id) << c.line;
    EXPECT_EQ(Words(token), c.left) << c.line;
  }
}

TEST(LinkOptions, UserIdThatIsNoNumberThrowsTheWord) {
  for (const char* word : {"id=12a", "Id=08", "id=2147483648", "id=1.5", "id=0x"}) {
    PortStringToken_t token;
    token.parse(word);
    int id = 99;
    try {
      CheckOptUserId(token, id);
      ADD_FAILURE() << word;
    } catch (PortString_t& text) {
      EXPECT_EQ(std::string(text.c_str()), "Error : option " + std::string(word) + "\n");
    }
    EXPECT_EQ(id, 99);
    EXPECT_EQ(token.count(), 1);
  }
}

TEST(LinkOptions, SwitchWordsOverrideTheDefaultAndAreRemoved) {
  struct Case {
    const char* line;
    bool comp_default;
    bool comp;
    bool fname_default;
    bool fname;
    const char* left;
  } cases[] = {
      {"", true, true, false, false, ""},
      {"nocomp", true, false, false, false, ""},
      {"NoCompress x", true, false, true, true, "x"},
      {"Comp setfilename", false, true, false, true, ""},
      {"compress NOSETFILENAME id=1", false, true, true, false, "id=1"},
      {"compression setfile", false, false, true, true, "compression setfile"},
  };
  for (const Case& c : cases) {
    PortStringToken_t token;
    token.parse(c.line);
    EXPECT_EQ(CheckOptSetFileName(token, c.fname_default), c.fname) << c.line;
    EXPECT_EQ(CheckOptCompress(token, c.comp_default), c.comp) << c.line;
    EXPECT_EQ(Words(token), c.left) << c.line;
  }
}

TEST(LinkOptions, SecondSwitchWordOnALineThrows) {
  for (const char* line : {"comp nocomp", "comp comp", "nocompress x COMPRESS"}) {
    PortStringToken_t token;
    token.parse(line);
    EXPECT_EQ(RaisedText([&] { CheckOptCompress(token, true); }),
              "Error : duplicate compress-options.")
        << line;
  }
  for (const char* line : {"setfilename nosetfilename", "nosetfilename nosetfilename"}) {
    PortStringToken_t token;
    token.parse(line);
    EXPECT_EQ(RaisedText([&] { CheckOptSetFileName(token, false); }),
              "Error : duplicate setfilename-options.")
        << line;
  }
}

}  // namespace

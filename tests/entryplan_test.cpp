#include "src/entryplan.h"

#include <gtest/gtest.h>

#include <cstring>
#include <string>

namespace {

TEST(EntryPlan, SafeNamesAreSingleResponseFileWords) {
  const struct {
    std::string name;
    bool safe;
  } cases[] = {
      {"a.dat", true},         {"0001_THINGS.map", true}, {"x", true},
      {".profile", true},      {"caf\xC3\xA9.txt", true}, {"", false},
      {".", false},            {"..", false},             {"../x", false},
      {"a..b", false},         {"/etc/passwd", false},    {"a/b", false},
      {"a\\b", false},         {"a b", false},            {"a#b", false},
      {"a;b", false},          {"%x", false},             {"a\tb", false},
      {"a\nb", false},         {"a\x1b", false},          {"a\x7f", false},
  };
  for (const auto& c : cases) {
    SCOPED_TRACE(c.name);
    EXPECT_EQ(IsSafeEntryName(PortString_t(c.name.data(), static_cast<int>(c.name.size()))),
              c.safe);
  }
}

uint32_t Magic(const char* aText) {
  unsigned char bytes[4] = {0, 0, 0, 0};
  memcpy(bytes, aText, strnlen(aText, 4));
  return bytes[0] | bytes[1] << 8 | bytes[2] << 16 | static_cast<uint32_t>(bytes[3]) << 24;
}

TEST(EntryPlan, DefaultNamesCarryTheMagicCodeLowerCased) {
  EXPECT_STREQ(DefaultEntryName(7, Magic("DAT")).c_str(), "0007.dat");
  EXPECT_STREQ(DefaultEntryName(12345, Magic("TEX2")).c_str(), "12345.tex2");
  EXPECT_STREQ(DefaultEntryName(0, 0).c_str(), "0000");
  EXPECT_STREQ(DefaultEntryName(3, Magic("A\0B")).c_str(), "0003.a");
}

qorArchiveEntry_t MakeEntry(uint8_t aType, uint8_t aCompression, const std::string& aBlock,
                            uint32_t aMagic, uint32_t aRealSize) {
  qorArchiveEntry_t e{};
  e.index = 5;
  e.header.fileType = aType;
  e.header.compression = aCompression;
  e.header.fileSize = static_cast<uint32_t>(16 + aBlock.size() + 10);
  e.header.magicCode = aMagic;
  e.header.realSize = aRealSize;
  memcpy(e.nameBlock, aBlock.data(), aBlock.size());
  return e;
}

std::string Block(const std::string& aName, size_t aSize) {
  return aName + std::string(aSize - aName.size(), '\0');
}

TEST(EntryPlan, OnlyEntriesQorLinkWouldWriteAgainArePlain) {
  const uint32_t dat = Magic("DAT");
  const struct {
    const char* what;
    qorArchiveEntry_t entry;
    bool padding_zero;
    bool plain;
    const char* name;
    bool compressed;
    bool set_file_name;
  } cases[] = {
      {"stored, no name block", MakeEntry(1, 0, "", dat, 0), true, true, "0005.dat", false, false},
      {"compressed, name block", MakeEntry(1, 0x11, Block("a.dat", 16), dat, 99), true, true,
       "a.dat", true, true},
      {"47-character name", MakeEntry(1, 0x30, Block(std::string(43, 'n') + ".dat", 48), dat, 0),
       true, true, nullptr, false, true},
      {"another fileType", MakeEntry(2, 0, "", dat, 0), true, false, "0005.TB", false, false},
      {"non-zero padding", MakeEntry(1, 0, "", dat, 0), false, false, "0005.TB", false, false},
      {"stored with a realSize", MakeEntry(1, 0, "", dat, 4), true, false, "0005.TB", false, false},
      {"unknown method", MakeEntry(1, 2, "", dat, 0), true, false, "0005.TB", false, false},
      {"lower-case magic", MakeEntry(1, 0, "", Magic("dat"), 0), true, false, "0005.TB", false,
       false},
      {"magic with a dot", MakeEntry(1, 0, "", Magic("A.B"), 0), true, false, "0005.TB", false,
       false},
      {"magic of an archive", MakeEntry(1, 0, "", Magic("PB"), 0), true, false, "0005.TB", false,
       false},
      {"name gives another magic", MakeEntry(1, 0x10, Block("a.txt", 16), dat, 0), true, false,
       "0005.TB", false, false},
      {"name of a raw file", MakeEntry(1, 0x10, Block("a.tb", 16), Magic("TB"), 0), true, false,
       "0005.TB", false, false},
      {"block too long for the name", MakeEntry(1, 0x20, Block("a.dat", 32), dat, 0), true,
       false, "0005.TB", false, false},
      {"bytes after the name", MakeEntry(1, 0x10, Block("a.dat", 15) + "x", dat, 0), true, false,
       "0005.TB", false, false},
      {"unterminated block", MakeEntry(1, 0x10, "0123456789abcdef", 0, 0), true, false,
       "0005.TB", false, false},
      {"empty name", MakeEntry(1, 0x10, Block("", 16), 0, 0), true, false, "0005.TB", false,
       false},
      {"climbing name", MakeEntry(1, 0x10, Block("../x.dat", 16), dat, 0), true, false,
       "0005.TB", false, false},
      {"absolute name", MakeEntry(1, 0x10, Block("/etc/x.dat", 16), dat, 0), true, false,
       "0005.TB", false, false},
  };
  for (const auto& c : cases) {
    SCOPED_TRACE(c.what);
    qorEntryPlan_t plan = PlanEntry(c.entry, c.padding_zero);
    EXPECT_EQ(plan.plain, c.plain);
    if (c.name != nullptr) {
      EXPECT_STREQ(plan.name.c_str(), c.name);
    }
    EXPECT_EQ(plan.compressed, c.compressed);
    EXPECT_EQ(plan.setFileName, c.set_file_name);
  }
}

}  // namespace

#include "port/src/error.h"

#include <string>

#include <gtest/gtest.h>

namespace {

std::string ThrownBy(int aErrorNum) {
  try {
    PortErrorThrow(aErrorNum);
  } catch (const char* text) {
    return text;
  }
  return "(nothing thrown)";
}

TEST(PortError, MessageTable) {
  const char* const expected[] = {
      " no error.",        " unknown error.",          " program error.",
      " illegal parameter.", " memory not enough.",    " not found.",
      " could't create.",  " could't open.",           " write error.",
      " read error.",      " could't write.",          " could't read.",
      " file operation invalid.", " file operation fail.", " illegal filename.",
      " invalid file format.",
  };
  for (int code = 0; code < 16; ++code) {
    EXPECT_STREQ(expected[code], PortErrorGetMsg(code).c_str()) << code;
    EXPECT_EQ(expected[code], ThrownBy(code)) << code;
  }
  for (int code : {16, -1, 1000, -2147483647 - 1}) {
    EXPECT_STREQ(" unknown error.", PortErrorGetMsg(code).c_str()) << code;
    EXPECT_EQ(" unknown error.", ThrownBy(code)) << code;
  }
}

TEST(PortError, GetStrEmptiesLastErrorString) {
  try {
    PortErrorThrow(4);
  } catch (const char* text) {
    EXPECT_STREQ(" memory not enough.", text);
    EXPECT_EQ(0, PortErrorGetStr().GetLength());
  }
}

TEST(PortError, SecondRaiseReplacesFirst) {
  EXPECT_EQ(" could't open.", ThrownBy(7));
  EXPECT_EQ(" read error.", ThrownBy(9));
  try {
    PortErrorThrow(PortErrorGetStr());
  } catch (const char* text) {
    EXPECT_STREQ("", text);
  }
}

TEST(PortError, ComposedMessage) {
  try {
    PortString_t& message = PortErrorGetStr();
    message = "list.ls" + PortErrorGetMsg(7);
    PortErrorThrow(message);
  } catch (const char* text) {
    EXPECT_STREQ("list.ls could't open.", text);
  }
}

}  // namespace

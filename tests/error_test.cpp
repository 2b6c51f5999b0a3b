#include "port/src/error.h"

#include <string>

#include <gtest/gtest.h>

#include "tests/support/raisedtext.h"

namespace {

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
    EXPECT_EQ(expected[code], RaisedText([&] { PortErrorThrow(code); })) << code;
  }
  for (int code : {16, -1, 1000, -2147483647 - 1}) {
    EXPECT_STREQ(" unknown error.", PortErrorGetMsg(code).c_str()) << code;
    EXPECT_EQ(" unknown error.", RaisedText([&] { PortErrorThrow(code); })) << code;
  }
}

// The thrown text is the last-error string, which GetStr empties for composing a message.
TEST(PortError, LastErrorStringCarriesTheComposedMessage) {
  EXPECT_EQ(" could't open.", RaisedText([] { PortErrorThrow(7); }));
  EXPECT_EQ("", RaisedText([] { PortErrorThrow(PortErrorGetStr()); }));
  EXPECT_EQ("list.ls could't open.", RaisedText([] {
              PortString_t& message = PortErrorGetStr();
              message = "list.ls" + PortErrorGetMsg(7);
              PortErrorThrow(message);
            }));
}

}  // namespace

#include "port/src/stringtoken.h"

#include <gtest/gtest.h>

#include <climits>
#include <string>
#include <vector>

#include "tests/support/raisedtext.h"

namespace {

typedef std::vector<std::string> Words;

Words WordsOf(const PortStringToken_t& aToken) {
  Words words;
  for (int i = 0; i < aToken.count(); ++i) {
    words.push_back(std::string(aToken.get(i).c_str(), aToken.get(i).GetLength()));
  }
  return words;
}

Words Parse(const PORT_char_t* aComments, const PortString_t& aLine) {
  PortStringToken_t token;
  token.setCommentChar(aComments);
  const int n = token.parse(aLine);
  EXPECT_EQ(token.count(), n);
  return WordsOf(token);
}

}  // namespace

TEST(StringToken, SplitsAtSeparatorsAndStopsAtComments) {
  const struct {
    const char* comments;
    PortString_t line;
    Words words;
  } cases[] = {
      {"", "", {}},
      {"", " \t  \t", {}},
      {"", "  a\tb \r", {"a", "b"}},
      {"", "a\nb", {"a", "b"}},
      {"", "a\fb\vc", {"a\fb\vc"}},
      {"", "\"two words\"", {"\"two", "words\""}},
      {"", "back\\ slash", {"back\\", "slash"}},
      {"", "#x ;y", {"#x", ";y"}},
      {nullptr, "#x ;y", {"#x", ";y"}},
      {"#;", "#comment line", {}},
      {"#;", "   ; indented", {}},
      {"#;", "x.bin ; more text", {"x.bin"}},
      {"#;", "abc#def ghi", {"abc"}},
      {"#;", "a b;c d", {"a", "b"}},
      {"abcde", "xay", {"x"}},  // only the first four count
      {"abcde", "zdq", {"z"}},
      {"abcde", "e fe", {"e", "fe"}},
      {"", PortString_t("ab c\0d e", 8), {"ab", "c"}},  // a NUL ends the line
      {"", PortString_t("\0abc", 4), {}},
  };
  for (const auto& c : cases) {
    EXPECT_EQ(c.words, Parse(c.comments, c.line))
        << (c.comments ? c.comments : "null") << " | " << c.line.c_str();
  }
}

TEST(StringToken, NewCommentCharactersReplaceTheOldOnes) {
  PortStringToken_t token;
  token.setCommentChar("#;");
  token.setCommentChar("#");
  token.parse("x;y #z");
  EXPECT_EQ(Words({"x;y"}), WordsOf(token));
  token.setCommentChar(nullptr);
  token.parse("x;y #z");
  EXPECT_EQ(Words({"x;y", "#z"}), WordsOf(token));
}

TEST(StringToken, EraseInAndOutOfRange) {
  PortStringToken_t token;
  ASSERT_EQ(3, token.parse("one two three"));
  for (int index : {3, -1, INT_MIN}) {
    EXPECT_EQ("Error : PortStringToken_t::erase   out of index.",
              RaisedText([&] { token.erase(index); })) << index;
  }
  EXPECT_EQ(Words({"one", "two", "three"}), WordsOf(token));
  token.erase(0);
  EXPECT_EQ(Words({"two", "three"}), WordsOf(token));
  token.erase(1);
  EXPECT_EQ(Words({"two"}), WordsOf(token));
  EXPECT_EQ(2, token.parse("new line"));  // a new parse starts from an empty list
  EXPECT_EQ(Words({"new", "line"}), WordsOf(token));
  PortStringToken_t empty;
  EXPECT_THROW(empty.erase(0), const char*);
}

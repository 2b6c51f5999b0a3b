#include "port/src/stringtoken.h"

#include <gtest/gtest.h>

#include <climits>
#include <cstring>
#include <string>
#include <vector>

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
    const char* line;
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
      {"#;", "#comment line", {}},
      {"#;", "   ; indented", {}},
      {"#;", "x.bin ; more text", {"x.bin"}},
      {"#;", "abc#def ghi", {"abc"}},
      {"#;", "a b;c d", {"a", "b"}},
      {"#;", "logo.tim id=3", {"logo.tim", "id=3"}},
  };
  for (const auto& c : cases) {
    EXPECT_EQ(c.words, Parse(c.comments, c.line)) << c.comments << " | " << c.line;
  }
}

TEST(StringToken, KeepsAtMostFourCommentCharacters) {
  EXPECT_EQ(Words({"x"}), Parse("abcde", "xay"));
  EXPECT_EQ(Words({"z"}), Parse("abcde", "zdq"));
  EXPECT_EQ(Words({"e", "fe"}), Parse("abcde", "e fe"));
  EXPECT_EQ(Words({"#x", ";y"}), Parse(nullptr, "#x ;y"));
}

TEST(StringToken, NewCommentCharactersReplaceTheOldOnes) {
  PortStringToken_t token;
  token.setCommentChar("#;");
  token.setCommentChar("#");
  token.parse("x;y #z");
  EXPECT_EQ(Words({"x;y"}), WordsOf(token));
  token.setCommentChar("");
  token.parse("x;y #z");
  EXPECT_EQ(Words({"x;y", "#z"}), WordsOf(token));
  token.setCommentChar("#;");
  token.setCommentChar(nullptr);
  token.parse("# ;");
  EXPECT_EQ(Words({"#", ";"}), WordsOf(token));
}

TEST(StringToken, NulInsideTheStringEndsTheParse) {
  EXPECT_EQ(Words({"ab", "c"}), Parse("", PortString_t("ab c\0d e", 8)));
  EXPECT_EQ(Words(), Parse("", PortString_t("\0abc", 4)));
}

TEST(StringToken, EraseMovesLaterWordsDown) {
  PortStringToken_t token;
  ASSERT_EQ(3, token.parse("one two three"));
  token.erase(0);
  EXPECT_EQ(Words({"two", "three"}), WordsOf(token));
  token.erase(1);
  EXPECT_EQ(Words({"two"}), WordsOf(token));
  EXPECT_EQ(2, token.parse("new line"));
  EXPECT_EQ(Words({"new", "line"}), WordsOf(token));
}

TEST(StringToken, EraseOutOfRangeRaisesAndKeepsTheWords) {
  for (int index : {3, 4, -1, INT_MIN, INT_MAX}) {
    PortStringToken_t token;
    token.parse("one two three");
    try {
      token.erase(index);
      ADD_FAILURE() << "no error for index " << index;
    } catch (const char* text) {
      EXPECT_STREQ("Error : PortStringToken_t::erase   out of index.", text);
    }
    EXPECT_EQ(Words({"one", "two", "three"}), WordsOf(token)) << index;
  }
  PortStringToken_t empty;
  EXPECT_THROW(empty.erase(0), const char*);
}

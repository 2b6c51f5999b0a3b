#include "port/src/string.h"

#include <climits>
#include <cstring>
#include <initializer_list>
#include <string>
#include <utility>
#include <vector>

#include <gtest/gtest.h>

#include "tests/support/raisedtext.h"

// Test-only view of a string's body.
struct PortStringInspector_t {
  static int RefCount(const PortString_t& aStr) { return aStr.data->refCount; }
  static int Capacity(const PortString_t& aStr) { return aStr.data->allocLength; }
  static const PortStringData_t* Body(const PortString_t& aStr) { return aStr.data; }
  static void Alloc(PortString_t& aStr, int aLength) { aStr.Alloc(aLength); }
  static void Append(PortString_t& aStr, const char* aRun, int aLength) {
    aStr.Append(aRun, aLength);
  }
};

namespace {

using Inspect = PortStringInspector_t;

std::string Text(const PortString_t& aStr) { return std::string(aStr.c_str(), aStr.GetLength()); }

TEST(PortString, EmptyStringsShareOneBody) {
  const PortString_t a;
  EXPECT_STREQ("", a.c_str());
  for (const PortString_t& s : {PortString_t("abc", 0), PortString_t("abc", -1),
                                PortString_t(nullptr, 3), PortString_t("")}) {
    EXPECT_EQ(Inspect::Body(a), Inspect::Body(s));
  }
}

TEST(PortString, CopyOnWrite) {
  PortString_t a("abc");
  PortString_t b(a);
  EXPECT_EQ(Inspect::Body(a), Inspect::Body(b));
  EXPECT_EQ(2, Inspect::RefCount(a));

  EXPECT_EQ(0, b.Replace('z', 'x'));
  EXPECT_EQ(Inspect::Body(a), Inspect::Body(b));

  EXPECT_EQ(1, b.Replace('a', 'x'));
  EXPECT_EQ(1, Inspect::RefCount(a));
  EXPECT_EQ(1, Inspect::RefCount(b));
  EXPECT_EQ("abc", Text(a));
  EXPECT_EQ("xbc", Text(b));

  // A private body is written in place, however many matches.
  PortString_t c("a.b.c");
  const PortStringData_t* body = Inspect::Body(c);
  EXPECT_EQ(2, c.Replace('.', '/'));
  EXPECT_EQ("a/b/c", Text(c));
  EXPECT_EQ(body, Inspect::Body(c));

  PortString_t d;
  d = a;
  d = d;
  EXPECT_EQ(2, Inspect::RefCount(a));
  d = "";
  EXPECT_EQ(1, Inspect::RefCount(a));
}

// Runs read from the body that is being replaced.
TEST(PortString, TextFromItsOwnBody) {
  PortString_t a("ab");
  a += a;
  EXPECT_EQ("abab", Text(a));

  const std::string thirty(30, 'k');  // doubled, it outgrows the body
  PortString_t b(thirty.c_str());
  b += b;
  EXPECT_EQ(thirty + thirty, Text(b));

  PortString_t c(thirty.c_str());
  const PortString_t shared(c);
  c += c.c_str() + 25;
  EXPECT_EQ(thirty + "kkkkk", Text(c));
  EXPECT_EQ(thirty, Text(shared));
  EXPECT_EQ(1, Inspect::RefCount(shared));

  PortString_t d("hello");
  d = d.c_str() + 1;
  EXPECT_EQ("ello", Text(d));
}

TEST(PortString, CapacityRule) {
  const std::pair<int, int> cases[] = {{0, 16}, {1, 32}, {16, 32}, {17, 48}, {32, 48}, {33, 64}};
  for (const auto& c : cases) {
    PortString_t s;
    Inspect::Alloc(s, c.first);
    EXPECT_EQ(c.second, Inspect::Capacity(s)) << c.first;
    if (c.first > 0) {
      EXPECT_EQ(c.second, Inspect::Capacity(PortString_t('x', c.first))) << c.first;
    }
  }
}

TEST(PortString, GrowthOneCharacterAtATime) {
  PortString_t s;
  std::vector<int> grown_at;
  std::vector<int> capacities;
  const PortStringData_t* body = Inspect::Body(s);
  for (int i = 1; i <= 100; ++i) {
    s += static_cast<char>('a' + i % 26);
    if (Inspect::Body(s) != body) {
      body = Inspect::Body(s);
      grown_at.push_back(i);
      capacities.push_back(Inspect::Capacity(s));
    }
  }
  EXPECT_EQ(100, s.GetLength());
  EXPECT_EQ((std::vector<int>{1, 33, 65, 97}), grown_at);
  EXPECT_EQ((std::vector<int>{32, 64, 96, 128}), capacities);
}

TEST(PortString, ConstructAssignAndRefusedSizes) {
  EXPECT_EQ("---", Text(PortString_t('-', 3)));
  EXPECT_EQ(" illegal parameter.", RaisedText([] { PortString_t('x', 0); }));
  EXPECT_EQ(" illegal parameter.", RaisedText([] { PortString_t('x', -5); }));
  EXPECT_EQ(" memory not enough.", RaisedText([] { PortString_t('x', INT_MAX); }));
  EXPECT_EQ(std::string("a\0b", 3), Text(PortString_t("a\0b", 3)));

  PortString_t q("abc");
  q = 'q';
  EXPECT_EQ(0, memcmp(q.c_str(), "q", 2));
  q += static_cast<const char*>(nullptr);
  q += "rs";
  q += 't';
  EXPECT_EQ("qrst", Text(q));

  // A failed growth leaves the string as it was.
  EXPECT_EQ(" memory not enough.", RaisedText([&] { Inspect::Append(q, "x", INT_MAX); }));
  EXPECT_EQ("qrst", Text(q));
}

TEST(PortString, Concatenation) {
  const PortString_t ab("ab");
  const PortString_t empty;
  // An empty side shares the other side's body.
  for (const PortString_t& sum : {"" + ab, ab + "", ab + empty, empty + ab}) {
    EXPECT_EQ(Inspect::Body(ab), Inspect::Body(sum));
  }
  EXPECT_EQ(Inspect::Body(empty), Inspect::Body(empty + empty));
  EXPECT_EQ(1, Inspect::RefCount(ab + PortString_t("cd")));

  const std::pair<PortString_t, const char*> sums[] = {
      {ab + PortString_t("cd"), "abcd"}, {ab + "cd", "abcd"}, {"cd" + ab, "cdab"},
      {empty + "cd", "cd"}, {"cd" + empty, "cd"}, {ab + 'c', "abc"},
      {'c' + ab, "cab"}, {empty + 'c', "c"}, {'c' + empty, "c"},
  };
  for (const auto& s : sums) EXPECT_EQ(s.second, Text(s.first));
}

TEST(PortString, Comparison) {
  const PortString_t upper("NoComp");
  const PortString_t lower("nocomp");
  EXPECT_EQ(0, CaseCompare(upper, lower));
  EXPECT_NE(0, Compare(upper, lower));
  EXPECT_EQ(0, CaseCompare(PortString_t("ID=7"), PortString_t("id="), 3));
  EXPECT_NE(0, CaseCompare(PortString_t("ID=7"), PortString_t("id="), 4));
  EXPECT_EQ(0, Compare(PortString_t("abX"), PortString_t("abY"), 2));
  EXPECT_EQ(0, Compare(PortString_t("a"), PortString_t("b"), -1));  // no characters compared
  EXPECT_GT(Compare(PortString_t("\x80"), PortString_t("a")), 0);  // bytes are unsigned

  const PortString_t nul1("ab\0x", 4);
  EXPECT_TRUE(nul1 == PortString_t("ab\0y", 4));
  EXPECT_TRUE(nul1 == "ab");
  EXPECT_TRUE(upper != lower);
  EXPECT_TRUE(upper != "nocomp");
  EXPECT_FALSE(upper != "NoComp");
}

TEST(PortString, FindAndReverseFind) {
  const PortString_t hello("hello");
  const std::pair<int, int> cases[] = {
      {hello.Find('l'), 2},           {hello.Find('z'), -1},
      {hello.Find('o', 4), -1},       {hello.Find('o', 5), 4},
      {hello.Find('h', 0), -1},       {hello.Find('o', 99), 4},
      {hello.ReverseFind('l'), 3},    {hello.ReverseFind('z'), -1},
      {hello.ReverseFind('l', 4), 3}, {hello.ReverseFind('h', 1), 0},
      {hello.ReverseFind('x', 9), 4}, {hello.ReverseFind('h', -3), 0},
      {PortString_t().ReverseFind('a', 0), -1},
  };
  for (size_t i = 0; i < sizeof cases / sizeof cases[0]; ++i) {
    EXPECT_EQ(cases[i].second, cases[i].first) << "case " << i;
  }
}

TEST(PortString, SubstrAndLabelString) {
  const PortString_t hello("hello");
  const struct {
    int from, length;
    const char* expected;
  } cases[] = {
      {1, 3, "ell"}, {-2, 4, "he"}, {3, 10, "lo"}, {5, 1, ""},       {6, 1, ""},
      {0, 0, ""},    {-9, 4, ""},   {2, -1, ""},   {0, INT_MAX, "hello"}, {INT_MIN, INT_MAX, ""},
  };
  for (const auto& c : cases) {
    EXPECT_EQ(c.expected, Text(hello.Substr(c.from, c.length))) << c.from << "," << c.length;
  }
  EXPECT_NE(Inspect::Body(hello), Inspect::Body(hello.Substr(0, 5)));

  const std::pair<const char*, const char*> labels[] = {
      {"3d-model.x", "_3d_model_x"}, {"a b", "a_b"}, {"", ""}, {"7", "_7"}, {"Ab9\xe9", "Ab9_"},
  };
  for (const auto& l : labels) EXPECT_EQ(l.second, Text(PortString_t(l.first).LabelString()));
}

template <typename T>
struct Conversion {
  const char* text;
  T value;
  bool error;
};

template <typename T>
void CheckConversions(T (PortString_t::*aConvert)(bool*) const,
                      std::initializer_list<Conversion<T>> aCases) {
  for (const auto& c : aCases) {
    bool error = !c.error;
    EXPECT_EQ(c.value, (PortString_t(c.text).*aConvert)(&error)) << c.text;
    EXPECT_EQ(c.error, error) << c.text;
  }
}

TEST(PortString, NumberConversion) {
  CheckConversions<int>(&PortString_t::ToInt,
                        {{"0x1A", 26, false}, {"010", 8, false}, {" 12", 12, false},
                         {"", 0, false}, {"-2147483648", INT_MIN, false},
                         {"2147483647", INT_MAX, false}, {"12 ", 0, true}, {"08", 0, true},
                         {"1.5", 0, true}, {"2147483648", 0, true}, {"-2147483649", 0, true},
                         {"0xFFFFFFFF", 0, true}, {"abc", 0, true}});
  CheckConversions<unsigned int>(
      &PortString_t::ToUint,
      {{"4294967295", 4294967295u, false}, {"-1", 4294967295u, false},
       {"-4294967295", 1u, false}, {"0xffffffff", 4294967295u, false},
       {"4294967296", 0u, true}, {"-4294967296", 0u, true}, {"18446744073709551615", 0u, true},
       {"-18446744073709551615", 0u, true}, {"99999999999999999999", 0u, true}});
  CheckConversions<double>(&PortString_t::ToFloat,
                           {{"1.5", 1.5, false}, {"-2e3", -2000.0, false}, {"", 0.0, false},
                            {"1e400", 0.0, true}, {"1.5x", 0.0, true}});

  // The whole text must convert, a NUL inside it included.
  bool error = false;
  EXPECT_EQ(0, PortString_t("12\0" "3", 4).ToInt(&error));
  EXPECT_TRUE(error);

  EXPECT_EQ(-7, PortString_t("-7").ToInt(nullptr));
  EXPECT_EQ("ERROR : PortString_t::ToInt", RaisedText([] { PortString_t("x").ToInt(nullptr); }));
  EXPECT_EQ("ERROR : PortString_t::ToInt", RaisedText([] { PortString_t("-").ToUint(nullptr); }));
  EXPECT_EQ("ERROR : PortString_t::ToFloat",
            RaisedText([] { PortString_t("1e400").ToFloat(nullptr); }));
}

TEST(PortString, Format) {
  EXPECT_EQ("id=3 'a.tim'", Text(PortString_t::Format("id=%d '%s'", 3, "a.tim")));
  EXPECT_EQ(0, PortString_t::Format("%s", "").GetLength());
  for (int length : {1023, 1024, 1025, 5000}) {
    const std::string body(length - 1, 'z');
    EXPECT_EQ(body + "!", Text(PortString_t::Format("%s!", body.c_str()))) << length;
  }
  // A wide character the "C" locale cannot encode makes the formatter fail whatever the size.
  EXPECT_EQ(" illegal parameter.", RaisedText([] { PortString_t::Format("%ls", L"\x20AC"); }));
}

}  // namespace

#include "port/src/serialize.h"

#include <gtest/gtest.h>

#include <cstdio>
#include <cstring>
#include <functional>
#include <memory>
#include <new>
#include <string>
#include <utility>
#include <vector>

#include "tests/support/raisedtext.h"
#include "tests/support/teststream.h"

namespace {

const char kReadError[] = "<test stream> read error.";
const char kInvalidFormat[] = " invalid file format.";

std::string Hex(const std::string& aBytes) {
  std::string out;
  char cell[4];
  for (unsigned char c : aBytes) {
    snprintf(cell, sizeof cell, out.empty() ? "%02X" : " %02X", c);
    out += cell;
  }
  return out;
}

// 32-bit little-endian words, the layout of IDs, counts and tags.
std::string Words(std::initializer_list<int32_t> aWords) {
  std::string out;
  for (int32_t w : aWords) out.append(reinterpret_cast<const char*>(&w), 4);
  return out;
}

// A writer on a fresh test stream, and a reader (or a reader-derived view) on given bytes.
struct Written {
  TestStream_t strm;
  PortSerializeWriter_t w;
  Written() { w.SetStream(&strm); }
};

template <typename Reader = PortSerializeReader_t>
struct Reading {
  TestStream_t strm;
  Reader r;
  explicit Reading(const std::string& aBytes) : strm(aBytes) { r.SetStream(&strm); }
};

// Exposes the registry's size and buckets.
struct RegistryView : PortSerializeReader_t {
  int Count() const { return ptrList.GetCount(); }
  int Capacity() const { return ptrList.GetCapacity(); }
  int Bucket(int aKey) const { return hashIdx[aKey]; }
  using PortSerialize_t::AddPtr;
};

struct Node {
  int32_t value = 0;
  char label[8] = {};
  Node* next = nullptr;
  Node* other = nullptr;
};

// The graph is written node by node; a node's pointers may name nodes defined later.
void WriteGraph(PortSerializeWriter_t& aWriter, const std::vector<Node*>& aNodes) {
  aWriter.Write(static_cast<int>(aNodes.size()));
  for (Node* n : aNodes) {
    aWriter.WritePtrID(n, nullptr);
    aWriter.Write(n->value);
    aWriter.Write(n->label);
    aWriter.WritePtr(n->next);
    aWriter.WritePtr(n->other);
  }
}

std::vector<std::unique_ptr<Node>> ReadGraph(PortSerializeReader_t& aReader) {
  std::vector<std::unique_ptr<Node>> nodes;
  int count;
  aReader.Read(count);
  for (int i = 0; i < count; ++i) {
    nodes.emplace_back(new Node);
    Node* n = nodes.back().get();
    aReader.ReadRegistPtr(n);
    aReader.Read(n->value);
    aReader.Read(n->label, sizeof n->label);
    aReader.ReadPtr(&n->next);
    aReader.ReadPtr(&n->other);
  }
  return nodes;
}

// A cycle a->b->c->a, c shared by a and b, d pointing at itself, null pointers, and
// references to b, c and d written before their definitions.
struct Graph {
  Node a, b, c, d;
  std::vector<Node*> order{&a, &b, &c, &d};
  Graph() {
    a = {1, "a", &b, &c};
    b = {2, "bee", &c, nullptr};
    c = {3, "", &a, &d};
    d = {4, "dd", &d, nullptr};
  }
  std::string Stream() {
    Written out;
    WriteGraph(out.w, order);
    EXPECT_EQ(out.w.GetUnresolveCount(), 0);
    return out.strm.Content();
  }
};

}  // namespace

TEST(SerializeWriter, GivesIdsInOrderOfFirstMeeting) {
  Written out;
  PortSerializeWriter_t& w = out.w;
  int a, b, c;
  PortSerializePtrID_t id = -7;
  struct Step {
    std::function<int()> op;
    int result;
    const char* bytes;
    int unresolved;
  } steps[] = {
      {[&] { return w.WritePtr(nullptr); }, 0, "00 00 00 00", 0},
      {[&] { return w.WritePtr(&a); }, 0, "01 00 00 00", 1},
      {[&] { return w.WritePtr(&a); }, 0, "01 00 00 00", 1},
      {[&] { return w.WritePtrID(&b, &id); }, 0, "02 00 00 00", 1},
      {[&] { return w.WritePtrID(&a, &id); }, 0, "01 00 00 00", 0},
      {[&] { return w.WritePtrID(&a, &id); }, 1, "", 0},
      {[&] { return w.WritePtr(&c); }, 0, "03 00 00 00", 1},
      {[&] { return w.WritePtrID(nullptr, &id); }, 0, "00 00 00 00", 1},
  };
  for (size_t i = 0; i < sizeof steps / sizeof steps[0]; ++i) {
    SCOPED_TRACE(i);
    size_t before = out.strm.Content().size();
    EXPECT_EQ(steps[i].op(), steps[i].result);
    EXPECT_EQ(Hex(out.strm.Content().substr(before)), steps[i].bytes);
    EXPECT_EQ(w.GetUnresolveCount(), steps[i].unresolved);
  }
  EXPECT_EQ(id, 0);
  EXPECT_EQ(RaisedText([&] { w.Term(); }), " program error.");
  EXPECT_EQ(w.SearchPtrID(&b), 2);
  EXPECT_EQ(w.SearchPtrID(nullptr), 0);
  EXPECT_EQ(w.SearchPtrID(&id), -1);
}

TEST(Serialize, HashesBitsTwoToSeventeenOfTheLow32Bits) {
  RegistryView v;
  const std::pair<uintptr_t, int> cases[] = {
      {0x4, 0x01}, {0x400, 0x01}, {0x3FC, 0xFF}, {0x12345678, 0x9F},
      {static_cast<uintptr_t>(0x7FFF00000010ULL), 0x04}};
  for (const auto& c : cases) {
    SCOPED_TRACE(c.first);
    const void* p = reinterpret_cast<const void*>(c.first);
    PortSerializePtrID_t id = v.AddPtr(p);
    EXPECT_EQ(v.Bucket(c.second), id);
    EXPECT_EQ(v.SearchPtrID(p), id);
  }
  EXPECT_EQ(v.SearchPtrID(reinterpret_cast<const void*>(0x4)), 1);  // behind 0x400 in its bucket
  EXPECT_EQ(v.Bucket(0), 0);
}

TEST(SerializeWriter, WritesValuesAndTextsInTheirLayouts) {
  int a, b;
  typedef PortSerializeWriter_t W;
  const std::pair<std::function<void(W&)>, const char*> cases[] = {
      {[](W& w) { w.Write("abc"); }, "03 00 00 00 61 62 63"},
      {[](W& w) { w.Write(""); }, "00 00 00 00"},
      {[](W& w) { w.Write((unsigned char)0xAB); }, "AB"},
      {[](W& w) { w.Write((short)-2); }, "FE FF"},
      {[](W& w) { w.Write(0x01020304u); }, "04 03 02 01"},
      {[](W& w) { w.Write(1.0f); }, "00 00 80 3F"},
      {[](W& w) { w.Write(-2.0); }, "00 00 00 00 00 00 00 C0"},
      {[](W& w) { PortString_t("ab").Write(w); }, "02 00 00 00 02 00 00 00 61 62"},
      {[&](W& w) {  // the header's example
         w.WritePtr(&b);
         w.WritePtrID(&a, nullptr);
         w.WritePtrID(&b, nullptr);
         w.Write("hi");
       },
       "01 00 00 00 02 00 00 00 01 00 00 00 02 00 00 00 68 69"},
  };
  for (const auto& c : cases) {
    Written out;
    c.first(out.w);
    EXPECT_EQ(Hex(out.strm.Content()), c.second);
  }
}

TEST(Serialize, LongsTravelAsFourBytesAndNothingWithoutAStream) {
  PortSerializeWriter_t unbound_writer;
  PortSerializeReader_t unbound_reader;
  int v;
  EXPECT_EQ(RaisedText([&] { unbound_writer.Write(1); }), " file operation invalid.");
  EXPECT_EQ(RaisedText([&] { unbound_reader.Read(v); }), " file operation invalid.");
  Written out;
  for (long wide : {0x100000000L, -0x80000001L}) {
    EXPECT_EQ(RaisedText([&] { out.w.Write(wide); }), " illegal parameter.");
  }
  EXPECT_EQ(RaisedText([&] { out.w.Write(0x100000000UL); }), " illegal parameter.");
  out.w.Write(-2L);
  out.w.Write(0xFFFFFFFEUL);
  EXPECT_EQ(out.strm.Content(), Words({-2, -2}));
  Reading<> in(out.strm.Content());
  long l;
  unsigned long ul;
  in.r.Read(l);
  in.r.Read(ul);
  EXPECT_EQ(l, -2L);
  EXPECT_EQ(ul, 0xFFFFFFFEUL);
}

TEST(Serialize, TagsFollowTheVerboseBit) {
  const PortFourcc_t tag = 0x54534554;  // "TEST"
  for (int flag : {0, PortSerialize_t::kVerbose}) {
    SCOPED_TRACE(flag);
    Written out;
    out.w.SetFlag(flag);
    out.w.WriteFourcc(tag, true);
    out.w.WriteFourcc(tag, false);
    EXPECT_EQ(out.strm.Content(), flag ? "TESTTEST" : "TEST");

    Reading<> in(out.strm.Content());
    in.r.SetFlag(flag);
    in.r.CheckFourcc(tag, true);
    EXPECT_EQ(in.strm.GetPosition(), flag ? 4 : 0);
    in.r.CheckFourcc(tag, false);
    EXPECT_EQ(in.strm.GetPosition(), flag ? 8 : 4);
  }
}

TEST(SerializeReader, TextReadCutsLongTextsAndSkipsTheirRest) {
  Reading<> in(Words({3}) + "abc" + Words({0}) + Words({6}) + "abcdef" + Words({42}));
  char buf[8];
  memset(buf, 'x', sizeof buf);
  in.r.Read(buf, 8);
  EXPECT_STREQ(buf, "abc");
  EXPECT_EQ(in.strm.GetPosition(), 7);
  in.r.Read(buf, 8);  // the empty text leaves the buffer as it was
  EXPECT_STREQ(buf, "abc");
  EXPECT_EQ(in.strm.GetPosition(), 11);
  in.r.Read(buf, 4);
  EXPECT_STREQ(buf, "abc");
  int after;
  in.r.Read(after);
  EXPECT_EQ(after, 42);
}

TEST(SerializeReader, WaitingVariablesChainUntilTheirObjectIsRegistered) {
  Reading<> in(Words({1, 1, 1, 1, 1}));
  PortSerializeReader_t& r = in.r;
  void* first = &in;
  void* second = &in;
  void* later = nullptr;
  int obj, other;
  r.ReadPtr(&first);
  r.ReadPtr(&second);
  EXPECT_EQ(first, nullptr);
  EXPECT_EQ(second, &first);
  r.ReadRegistPtr(&obj);
  EXPECT_EQ(first, &obj);
  EXPECT_EQ(second, &obj);
  r.ReadPtr(&later);  // already registered: the address at once
  EXPECT_EQ(later, &obj);
  r.ReadRegistPtr(&other);  // the first registration stands
  r.RegistPtr(0, &other);   // ID 0 stays null
  EXPECT_EQ(r.SearchPtrID(&obj), 1);
  EXPECT_EQ(r.SearchPtrID(&other), -1);
  r.Term();

  // Term leaves no chain link behind in variables whose object never came.
  TestStream_t dangling(Words({2, 2}));
  r.SetStream(&dangling);
  r.ReadPtr(&first);
  r.ReadPtr(&second);
  EXPECT_EQ(second, &first);
  EXPECT_EQ(RaisedText([&] { r.Term(); }), kInvalidFormat);
  EXPECT_EQ(first, nullptr);
  EXPECT_EQ(second, nullptr);
}

TEST(Serialize, RoundTripRebuildsThePointerGraph) {
  Graph g;
  Reading<> in(g.Stream());
  std::vector<std::unique_ptr<Node>> nodes = ReadGraph(in.r);
  in.r.Term();
  ASSERT_EQ(nodes.size(), 4u);
  EXPECT_EQ(in.strm.GetPosition(), in.strm.GetLength());
  auto rebuilt = [&](const Node* original) -> Node* {
    for (size_t i = 0; i < g.order.size(); ++i) {
      if (g.order[i] == original) return nodes[i].get();
    }
    return nullptr;
  };
  for (size_t i = 0; i < nodes.size(); ++i) {
    SCOPED_TRACE(i);
    EXPECT_EQ(nodes[i]->value, g.order[i]->value);
    EXPECT_STREQ(nodes[i]->label, g.order[i]->label);
    EXPECT_EQ(nodes[i]->next, rebuilt(g.order[i]->next));
    EXPECT_EQ(nodes[i]->other, rebuilt(g.order[i]->other));
  }
  EXPECT_EQ(nodes[0]->next->next->next, nodes[0].get());
  EXPECT_EQ(nodes[3]->next, nodes[3].get());
}

TEST(SerializeReader, EveryTruncationOfAGraphRaisesReadError) {
  const std::string full = Graph().Stream();
  for (size_t len = 0; len < full.size(); ++len) {
    Reading<> in(full.substr(0, len));
    EXPECT_EQ(RaisedText([&] { ReadGraph(in.r); }), kReadError) << len;
  }
}

TEST(SerializeReader, StringsComeBackThroughReadAndRejectImpossibleLengths) {
  for (const char* text : {"", "a", "hello world", "0123456789abcdef0123456789abcdef!"}) {
    Written out;
    PortString_t(text).Write(out.w);
    Reading<> in(out.strm.Content());
    PortString_t back("previous");
    back.Read(in.r);
    EXPECT_EQ(back, text);
  }

  // Cut inside a record: a length field beyond the bytes left is a format error, a cut
  // anywhere else a read error; either way the string is left empty.
  const std::string full = Words({5, 5}) + "hello";
  for (size_t len = 0; len < full.size(); ++len) {
    SCOPED_TRACE(len);
    Reading<> in(full.substr(0, len));
    PortString_t back("previous");
    const bool length_impossible = len >= 4 && len - 4 < 5;
    EXPECT_EQ(RaisedText([&] { back.Read(in.r); }),
              length_impossible ? kInvalidFormat : kReadError);
    EXPECT_EQ(back, "");
  }
  Reading<> negative(Words({-1, 0}));
  PortString_t back;
  EXPECT_EQ(RaisedText([&] { back.Read(negative.r); }), kInvalidFormat);
}

TEST(SerializeReader, RejectsNegativeIdsAndWrongTags) {
  typedef PortSerializeReader_t R;
  const std::function<void(R&)> cases[] = {
      [](R& r) { void* p; r.ReadPtr(&p); },
      [](R& r) { int o = 0; r.ReadRegistPtr(&o); },
      [](R& r) { int o = 0; r.RegistPtr(-1, &o); },
      [](R& r) { r.CheckFourcc(0xFFFFFFFE, false); },
  };
  for (const auto& op : cases) {
    Reading<> in(Words({-1}));
    EXPECT_EQ(RaisedText([&] { op(in.r); }), kInvalidFormat) << &op - cases;
  }
}

// 32 entries at a time would copy the registry n / 32 times: quadratic in the stream's
// length. An ID far above the count extends it in one step, if the stream is long enough
// to have given it out.
TEST(SerializeReader, RegistryGrowsGeometricallyAndReachesFarIdsInOneStep) {
  const int n = 10000;
  std::string ids;
  for (int32_t id = 1; id <= n; ++id) ids += Words({id});
  Reading<RegistryView> in(ids);
  std::vector<void*> vars(n);
  std::vector<int> capacities{in.r.Capacity()};
  for (void*& v : vars) {
    in.r.ReadPtr(&v);
    if (in.r.Capacity() != capacities.back()) capacities.push_back(in.r.Capacity());
  }
  EXPECT_EQ(in.r.Count(), n + 1);
  EXPECT_LE(capacities.size(), 20u);
  for (int c : capacities) EXPECT_EQ(c % 32, 0) << c;

  const int32_t far = 1000000;
  Reading<RegistryView> big(Words({far, far}) + std::string(4 * far, '\0'));
  void* p = &big;
  big.r.ReadPtr(&p);
  EXPECT_EQ(p, nullptr);
  EXPECT_EQ(big.r.Count(), far + 1);
  EXPECT_EQ(big.r.Capacity(), 1000032);
  int obj;
  big.r.ReadRegistPtr(&obj);
  EXPECT_EQ(p, &obj);

  for (int32_t id : {far, INT32_MAX}) {
    Reading<RegistryView> small(Words({id}));
    EXPECT_EQ(RaisedText([&] { small.r.ReadPtr(&p); }), kInvalidFormat) << id;
    EXPECT_EQ(small.r.Count(), 1);
  }
  RegistryView unbound;  // no stream to bound it: the allocator's failure, not a crash
  EXPECT_THROW(unbound.RegistPtr(INT32_MAX, &obj), std::bad_alloc);
}

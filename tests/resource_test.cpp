#include <gtest/gtest.h>

#include <cstdio>
#include <string>
#include <vector>

#include "port/src/resource.h"

// Test-only view of the anchor stack and of each anchor's list of resources.
struct PortResourceInspector_t {
  static PortResourceAnchor_t* Current() { return PortResourceAnchor_t::current; }
  static PortResourceAnchor_t* Prev(PortResourceAnchor_t* aAnchor) { return aAnchor->prev; }
  static PortResourceAnchor_t* Next(PortResourceAnchor_t* aAnchor) { return aAnchor->next; }
  static const PortResourceAnchor_t* AnchorOf(const PortResource_t& aRes) { return aRes.anchor; }
  // Ends an anchor directly, as its enclosing anchor would, even one that is not current.
  static void Destroy(PortResourceAnchor_t* aAnchor) { delete aAnchor; }

  // The list from head to tail; also checks that the backward links mirror it.
  static std::vector<const PortResource_t*> List(const PortResourceAnchor_t* aAnchor) {
    std::vector<const PortResource_t*> forward;
    for (const PortResource_t* r = aAnchor->head; r != nullptr; r = r->next) forward.push_back(r);
    std::vector<const PortResource_t*> backward;
    for (const PortResource_t* r = aAnchor->tail; r != nullptr; r = r->prev) backward.push_back(r);
    EXPECT_EQ(std::vector<const PortResource_t*>(backward.rbegin(), backward.rend()), forward);
    EXPECT_EQ(aAnchor->count, static_cast<int>(forward.size()));
    return forward;
  }
};
using Inspect = PortResourceInspector_t;

namespace {

// Appends its name to a log when destroyed; without a log it writes "~name" to stderr,
// which is what a death test can see.
class Tracked_t : public PortResource_t {
 public:
  Tracked_t(const char* aName, std::string* aLog) : name(aName), log(aLog) {}
  ~Tracked_t() override {
    if (log != nullptr) {
      *log += name;
    } else {
      std::fprintf(stderr, "~%s", name);
    }
  }

 private:
  const char* name;
  std::string* log;
};

// Every test starts and ends without any anchor, the state of a fresh process.
class Resource : public ::testing::Test {
 protected:
  void SetUp() override { ASSERT_EQ(Inspect::Current(), nullptr); }
  void TearDown() override {
    while (Inspect::Current() != nullptr) PortResourceAnchor_t::Release(false);
  }
};

TEST_F(Resource, FirstResourceCreatesTheRootAnchor) {
  std::string log;
  Tracked_t* p = new Tracked_t("P", &log);
  PortResourceAnchor_t* root = Inspect::Current();
  ASSERT_NE(root, nullptr);
  EXPECT_EQ(PortResourceAnchor_t::GetCurrent(), root);
  EXPECT_EQ(Inspect::Prev(root), nullptr);
  EXPECT_EQ(Inspect::AnchorOf(*p), root);
  EXPECT_EQ(root->GetCount(), 1);
  delete p;
  EXPECT_EQ(root->GetCount(), 0);
  EXPECT_EQ(Inspect::Current(), root);  // an anchor outlives its resources
  EXPECT_EQ(log, "P");
}

TEST_F(Resource, DestroyingOneResourceUnlinksItInPlace) {
  struct Case {
    int removed;
    std::vector<int> left;
  };
  const Case cases[] = {{0, {1, 2}}, {1, {0, 2}}, {2, {0, 1}}};
  for (const Case& c : cases) {
    SCOPED_TRACE(c.removed);
    PortResourceAnchor_t* anchor = PortResourceAnchor_t::NewAnchor();
    std::string log;
    Tracked_t* res[3] = {new Tracked_t("P", &log), new Tracked_t("Q", &log),
                         new Tracked_t("S", &log)};
    EXPECT_EQ(Inspect::List(anchor),
              (std::vector<const PortResource_t*>{res[0], res[1], res[2]}));
    delete res[c.removed];
    std::vector<const PortResource_t*> expected;
    for (int i : c.left) expected.push_back(res[i]);
    EXPECT_EQ(Inspect::List(anchor), expected);
    // Removing the new head then leaves one resource as head and tail.
    delete res[c.left[0]];
    EXPECT_EQ(Inspect::List(anchor), (std::vector<const PortResource_t*>{res[c.left[1]]}));
    delete res[c.left[1]];
    EXPECT_TRUE(Inspect::List(anchor).empty());
    PortResourceAnchor_t::Release(false);
  }
}

TEST_F(Resource, ReleaseDeletesNewestFirst) {
  std::string log;
  new Tracked_t("P", &log);
  new Tracked_t("Q", &log);
  new Tracked_t("S", &log);
  PortResourceAnchor_t::Release(false);
  EXPECT_EQ(log, "SQP");
  EXPECT_EQ(Inspect::Current(), nullptr);  // the root is gone too
}

TEST_F(Resource, ReleaseWithoutAnchorDoesNothing) {
  PortResourceAnchor_t::Release(false);
  EXPECT_EQ(Inspect::Current(), nullptr);
}

TEST_F(Resource, NestedAnchorOwnsOnlyLaterResources) {
  std::string log;
  Tracked_t* x = new Tracked_t("X", &log);
  PortResourceAnchor_t* root = Inspect::Current();
  PortResourceAnchor_t* inner = PortResourceAnchor_t::NewAnchor();
  EXPECT_EQ(Inspect::Current(), inner);
  EXPECT_EQ(Inspect::Prev(inner), root);
  EXPECT_EQ(Inspect::Next(root), inner);
  Tracked_t* y = new Tracked_t("Y", &log);
  EXPECT_EQ(Inspect::AnchorOf(*y), inner);
  EXPECT_EQ(root->GetCount(), 1);

  PortResourceAnchor_t::Release(false);
  EXPECT_EQ(log, "Y");
  EXPECT_EQ(Inspect::Current(), root);
  EXPECT_EQ(Inspect::Next(root), nullptr);
  EXPECT_EQ(Inspect::List(root), (std::vector<const PortResource_t*>{x}));
  delete x;  // before its log goes out of scope
}

TEST_F(Resource, EndingAnAnchorEndsItsInnerAnchorsFirst) {
  std::string log;
  new Tracked_t("a", &log);
  new Tracked_t("b", &log);
  PortResourceAnchor_t* root = Inspect::Current();
  PortResourceAnchor_t::NewAnchor();
  new Tracked_t("c", &log);
  new Tracked_t("d", &log);
  PortResourceAnchor_t::NewAnchor();
  new Tracked_t("e", &log);
  Inspect::Destroy(root);
  EXPECT_EQ(log, "edcba");
  EXPECT_EQ(Inspect::Current(), nullptr);
}

TEST(ResourceDeathTest, ReleaseForExitEndsEveryAnchorThenExitsWithStatus3) {
  // Run in a child process; the parent's anchors are not touched.
  EXPECT_EXIT(
      {
        new Tracked_t("A", nullptr);
        new Tracked_t("B", nullptr);
        PortResourceAnchor_t::NewAnchor();
        new Tracked_t("C", nullptr);
        PortResourceAnchor_t::NewAnchor();
        new Tracked_t("D", nullptr);
        new Tracked_t("E", nullptr);
        PortResourceAnchor_t::Release(true);
      },
      ::testing::ExitedWithCode(3), "^~E~D~C~B~A$");
  EXPECT_EXIT(PortResourceAnchor_t::Release(true), ::testing::ExitedWithCode(3), "^$");
}

}  // namespace

#include <gtest/gtest.h>

#include <cstdio>
#include <string>
#include <vector>

#include "port/src/resource.h"

typedef std::vector<const PortResource_t*> Resources;

// Test-only view of the anchor stack and of each anchor's list of resources.
struct PortResourceInspector_t {
  static PortResourceAnchor_t* Current() { return PortResourceAnchor_t::current; }
  static PortResourceAnchor_t* Prev(PortResourceAnchor_t* aAnchor) { return aAnchor->prev; }
  static PortResourceAnchor_t* Next(PortResourceAnchor_t* aAnchor) { return aAnchor->next; }
  static const PortResourceAnchor_t* AnchorOf(const PortResource_t& aRes) { return aRes.anchor; }
  // Ends an anchor directly, as its enclosing anchor would, even one that is not current.
  static void Destroy(PortResourceAnchor_t* aAnchor) { delete aAnchor; }

  // The list from head to tail; also checks that the backward links mirror it.
  static Resources List(const PortResourceAnchor_t* aAnchor) {
    Resources forward;
    for (const PortResource_t* r = aAnchor->head; r != nullptr; r = r->next) forward.push_back(r);
    Resources backward;
    for (const PortResource_t* r = aAnchor->tail; r != nullptr; r = r->prev) backward.push_back(r);
    EXPECT_EQ(Resources(backward.rbegin(), backward.rend()), forward);
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

TEST_F(Resource, RootAnchorIsMadeOnDemandAndReleasesNewestFirst) {
  PortResourceAnchor_t::Release(false);  // no anchor: nothing to do
  EXPECT_EQ(Inspect::Current(), nullptr);
  std::string log;
  Tracked_t* p = new Tracked_t("P", &log);
  PortResourceAnchor_t* root = Inspect::Current();
  ASSERT_NE(root, nullptr);
  EXPECT_EQ(PortResourceAnchor_t::GetCurrent(), root);
  EXPECT_EQ(Inspect::Prev(root), nullptr);
  EXPECT_EQ(Inspect::AnchorOf(*p), root);
  delete p;
  EXPECT_EQ(root->GetCount(), 0);
  EXPECT_EQ(Inspect::Current(), root);  // an anchor outlives its resources
  log.clear();
  new Tracked_t("P", &log);
  new Tracked_t("Q", &log);
  new Tracked_t("S", &log);
  PortResourceAnchor_t::Release(false);
  EXPECT_EQ(log, "SQP");
  EXPECT_EQ(Inspect::Current(), nullptr);  // the root is gone too
}

TEST_F(Resource, DestroyingOneResourceUnlinksItInPlace) {
  for (int removed = 0; removed < 3; ++removed) {
    SCOPED_TRACE(removed);
    PortResourceAnchor_t* anchor = PortResourceAnchor_t::NewAnchor();
    std::string log;
    Tracked_t* res[3] = {new Tracked_t("P", &log), new Tracked_t("Q", &log),
                         new Tracked_t("S", &log)};
    EXPECT_EQ(Inspect::List(anchor), (Resources{res[0], res[1], res[2]}));
    Resources left;
    for (int i = 0; i < 3; ++i) {
      if (i != removed) left.push_back(res[i]);
    }
    delete res[removed];
    EXPECT_EQ(Inspect::List(anchor), left);
    // Removing the new head then leaves one resource as head and tail.
    delete left[0];
    EXPECT_EQ(Inspect::List(anchor), (Resources{left[1]}));
    delete left[1];
    EXPECT_TRUE(Inspect::List(anchor).empty());
    PortResourceAnchor_t::Release(false);
  }
}

// A nested anchor owns only the resources made after it; ending an outer anchor ends
// the inner ones first.
TEST_F(Resource, NestedAnchors) {
  std::string log;
  Tracked_t* a = new Tracked_t("a", &log);
  Tracked_t* b = new Tracked_t("b", &log);
  PortResourceAnchor_t* root = Inspect::Current();
  PortResourceAnchor_t* inner = PortResourceAnchor_t::NewAnchor();
  EXPECT_EQ(Inspect::Current(), inner);
  EXPECT_EQ(Inspect::Prev(inner), root);
  EXPECT_EQ(Inspect::Next(root), inner);
  Tracked_t* x = new Tracked_t("x", &log);
  EXPECT_EQ(Inspect::AnchorOf(*x), inner);
  PortResourceAnchor_t::Release(false);
  EXPECT_EQ(log, "x");
  EXPECT_EQ(Inspect::Current(), root);
  EXPECT_EQ(Inspect::Next(root), nullptr);
  EXPECT_EQ(Inspect::List(root), (Resources{a, b}));

  log.clear();
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

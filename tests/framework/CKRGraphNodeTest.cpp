// Nodes and edges: joining, directions, releases that leave no node listing
// a dead edge, and graphs stored in the memory store and loaded back
// (directed edges, cycles, parallel edges, derived classes), then torn down
// node by node or by a release walk.
#include <krCoreLib/framework/CKRGraphNode.h>

#include "KRFrameworkStore.h"
#include "KRGraphTestObjects.h"
#include "KRTestSeed.h"

#include <gtest/gtest.h>

#include <algorithm>
#include <random>
#include <sstream>

namespace {

using EdgeList = std::vector<CKRGraphEdge*>;

// The nodes of the connected part of `start`, edges taken either way.
std::vector<CKRGraphNode*> Component(CKRGraphNode* start) {
  std::vector<CKRGraphNode*> nodes{start};
  for (std::size_t at = 0; at < nodes.size(); ++at)
    for (CKRGraphEdge* edge : Edges(nodes[at]))
      for (CKRGraphNode* end : {edge->GetPrimary(), edge->GetSecondary()})
        if (end != nullptr && std::find(nodes.begin(), nodes.end(), end) == nodes.end())
          nodes.push_back(end);
  return nodes;
}

// The connected part as text: nodes in name order with class and edges in
// list order, each edge with class, ends, direction and connected state.
std::string Shape(CKRGraphNode* start) {
  std::vector<std::string> lines;
  for (CKRGraphNode* node : Component(start)) {
    std::ostringstream line;
    line << PlaceName(node) << (node->IsTypeOf(CKRTestTown::TypeID) ? "(town):" : ":");
    for (CKRGraphEdge* edge : Edges(node))
      line << " " << PlaceName(edge->GetPrimary()) << "-"
           << PlaceName(edge->GetSecondary()) << "/" << edge->GetDirection() << (edge->IsConnected() ? "" : "!")
           << (edge->IsTypeOf(CKRTestOneWay::TypeID) ? "one" : edge->IsTypeOf(CKRTestBackWay::TypeID) ? "back" : "");
    lines.push_back(line.str());
  }
  std::sort(lines.begin(), lines.end());
  std::string text;
  for (const std::string& line : lines)
    text += line + "\n";
  return text;
}

void ReleaseComponent(CKRGraphNode* start) {
  for (CKRGraphNode* node : Component(start))
    node->Release();
}

// A cycle A-B-C with a one-way and a back-way road, a road parallel to
// A-B, and a spur D-C; everything is reachable from A along the
// directions.
CKRGraphNode* BuildMap() {
  CKRTestPlace* a = NewPlace(L"A");
  CKRTestPlace* b = NewPlace(L"B", true);
  CKRTestPlace* c = NewPlace(L"C", true);
  NewRoad(a, b);
  NewRoad(b, c, CKRTestOneWay::TypeID);
  NewRoad(c, a, CKRTestBackWay::TypeID);
  NewRoad(a, b);
  NewRoad(NewPlace(L"D"), c);
  return a;
}

}  // namespace

// Connecting lists an edge at both ends once; a loop never connects;
// disconnecting takes it out of both lists. Releasing a node releases its
// edges and their other ends forget them; an edge that refuses its release
// survives unjoined and listed nowhere.
TEST(CKRGraphEdge, ConnectAndReleaseKeepBothListsInStep) {
  CKRTestPlace* a = NewPlace(L"A");
  CKRTestPlace* b = NewPlace(L"B");
  CKRTestRoad* ab = NewRoad(a, b);
  EXPECT_EQ(Edges(a), EdgeList{ab});
  EXPECT_EQ(Edges(b), EdgeList{ab});
  EXPECT_EQ(ab->SetNodes(b, a), 0);  // connected: keeps its nodes
  EXPECT_EQ(ab->Connect(), 0);       // and is not listed twice
  EXPECT_EQ(a->GetEdgeCollection()->GetCount(), 1);
  for (const int index : {-1, 1})
    EXPECT_EQ(a->GetEdge(index), nullptr);
  CKRTestRoad* loop = NewRoad(a, a);
  EXPECT_FALSE(loop->IsConnected());
  EXPECT_EQ(Edges(a), EdgeList{ab});
  EXPECT_EQ(loop->SetNodes(nullptr, b), 0);
  loop->Release();

  EXPECT_EQ(ab->Disconnect(), 1);
  EXPECT_EQ(ab->GetPrimary(), nullptr);
  EXPECT_EQ(Edges(a), EdgeList{});
  EXPECT_EQ(Edges(b), EdgeList{});
  EXPECT_EQ(ab->Disconnect(), 0);
  EXPECT_EQ(ab->SwapNodes(), 0);
  ab->Release();

  CKRTestPlace* c = NewPlace(L"C");
  CKRTestRoad* ab2 = NewRoad(a, b);
  CKRTestRoad* ca = NewRoad(c, a);
  CKRTestRoad* bc = NewRoad(b, c);
  ca->m_RefuseRelease = true;
  EXPECT_EQ(a->Release(), 1);
  EXPECT_FALSE(IsAlive(ab2));
  ASSERT_TRUE(IsAlive(ca));
  EXPECT_EQ(ca->GetPrimary(), nullptr);
  EXPECT_EQ(Edges(b), EdgeList{bc});
  EXPECT_EQ(Edges(c), EdgeList{bc});
  ca->m_RefuseRelease = false;
  ca->Release();
  EXPECT_EQ(bc->Release(), 1);  // a connected edge on its own leaves both lists
  EXPECT_EQ(Edges(b), EdgeList{});
  b->Release();
  c->Release();
}

TEST(CKRGraphEdge, DirectionDecidesWhichWayTheEdgeIsFollowed) {
  struct SKRCase {
    CKRGuid m_Type;
    bool m_FromPrimary;
    bool m_FromSecondary;
  };
  for (const SKRCase& test : {SKRCase{CKRTestRoad::TypeID, true, true}, SKRCase{CKRTestBackWay::TypeID, false, true},
                              SKRCase{CKRTestOneWay::TypeID, true, false}}) {
    CKRTestPlace* a = NewPlace(L"A");
    CKRTestPlace* b = NewPlace(L"B");
    CKRTestRoad* edge = NewRoad(a, b, test.m_Type);
    SCOPED_TRACE(testing::Message() << "direction " << edge->GetDirection());
    EXPECT_EQ(a->GetNeighbor(0), test.m_FromPrimary ? b : nullptr);
    EXPECT_EQ(b->GetNeighbor(0), test.m_FromSecondary ? a : nullptr);
    EXPECT_EQ(b->GetEdgeToNeighbor(a), test.m_FromSecondary ? edge : nullptr);
    // Swapped, the direction turns round with respect to the nodes.
    EXPECT_EQ(edge->SwapNodes(), 1);
    EXPECT_EQ(edge->GetNeighbor(b), test.m_FromPrimary ? a : nullptr);
    EXPECT_EQ(edge->GetNeighbor(a), test.m_FromSecondary ? b : nullptr);
    a->Release();
    b->Release();
    EXPECT_FALSE(IsAlive(edge));
  }
}

// Storing any edge stores the whole connected part (an edge its two node
// links, a node its edge list). Loading gives the same shape (classes,
// edge order, ends, directions from the edge classes, cycles, parallel
// edges), one live object per stored object, every loaded edge connected. Torn down node by node in random
// order or by a release walk, no live node ever lists a released edge or
// is joined to a released node, and nothing loaded stays alive.
TEST(CKRGraphNode, LoadedGraphsKeepTheirShapeAndReleaseCleanly) {
  std::mt19937 random(KRTestSeed());
  CKRGraphNode* original = BuildMap();
  for (const bool byVisitor : {false, true}) {
    SCOPED_TRACE(byVisitor ? "release walk" : "node by node");
    CKRFrameworkStore store;
    ASSERT_EQ(store.Save({original->GetEdge(0)}), 1);
    EXPECT_EQ(store.Stored().m_Objects.size(), 4u + 5u);
    auto* loaded = store.Load<CKRGraphNode>(original->GetInstanceID(), CKRTestPlace::TypeID);
    ASSERT_NE(loaded, nullptr);
    EXPECT_EQ(Shape(loaded), Shape(original));
    std::vector<CKRGraphNode*> nodes = Component(loaded);
    std::set<const IKRObject*> loadedObjects(nodes.begin(), nodes.end());
    for (CKRGraphNode* node : nodes)
      for (CKRGraphEdge* edge : Edges(node))
        loadedObjects.insert(edge);
    ASSERT_EQ(loadedObjects.size(), 9u);
    ASSERT_EQ(loaded->GetEdge(0)->SwapNodes(), 1);

    if (byVisitor) {
      auto* visitor = NewObject<CKRReleaseVisitor>(CKRReleaseVisitor::GetCKRReleaseVisitorType());
      EXPECT_EQ(visitor->Start(loaded), 1);
      visitor->Release();
    } else {
      std::shuffle(nodes.begin(), nodes.end(), random);
      for (std::size_t i = 0; i < nodes.size(); ++i) {
        EXPECT_EQ(nodes[i]->Release(), 1);
        for (std::size_t j = i + 1; j < nodes.size(); ++j)
          for (CKRGraphEdge* edge : Edges(nodes[j])) {
            ASSERT_TRUE(IsAlive(edge)) << "a node lists a released edge";
            ASSERT_TRUE(IsAlive(edge->GetPrimary()) && IsAlive(edge->GetSecondary()));
          }
      }
    }
    for (const IKRObject* object : loadedObjects)
      EXPECT_FALSE(IsAlive(object));
  }
  ReleaseComponent(original);
}

// A stored edge that only one of its nodes lists loads unconnected: the
// other node's release leaves it alone, and releasing the listing node
// releases it without reaching for the released one.
TEST(CKRGraphNode, HalfListedStoredEdgeLoadsUnconnected) {
  CKRFrameworkStore store;
  CKRTestPlace* a = NewPlace(L"A");
  CKRTestPlace* b = NewPlace(L"B");
  CKRTestRoad* ab = NewRoad(a, b);
  ASSERT_EQ(store.Save({a}), 1);
  store.Stored().m_Objects.at(b->GetInstanceID()).m_Links.begin()->second.clear();
  auto* loadedA = store.Load<CKRGraphNode>(a->GetInstanceID(), CKRTestPlace::TypeID);
  ASSERT_NE(loadedA, nullptr);
  CKRGraphEdge* loadedEdge = loadedA->GetEdge(0);
  ASSERT_NE(loadedEdge, nullptr);
  EXPECT_FALSE(loadedEdge->IsConnected());
  CKRGraphNode* loadedB = loadedEdge->GetSecondary();
  ASSERT_NE(loadedB, nullptr);
  EXPECT_EQ(loadedB->GetEdgeCollection()->GetCount(), 0);
  EXPECT_EQ(loadedB->Release(), 1);
  EXPECT_EQ(loadedA->Release(), 1);
  EXPECT_FALSE(IsAlive(loadedEdge));
  ab->Release();
  a->Release();
  b->Release();
}

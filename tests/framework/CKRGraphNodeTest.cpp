// Nodes and edges: joining and unjoining, directions, releases that leave
// no node listing a dead edge, and graphs stored in the memory store and
// loaded back (directed edges, cycles, derived classes), then torn down
// node by node.
#include <krCoreLib/framework/CKRGraphNode.h>
#include <krCoreLib/serialization/IKRField.h>

#include "KRFrameworkStore.h"
#include "KRGraphTestObjects.h"
#include "KRTestSeed.h"

#include <gtest/gtest.h>

#include <algorithm>
#include <map>
#include <random>
#include <set>
#include <sstream>

namespace {

std::vector<CKRGraphEdge*> Edges(CKRGraphNode* node) {
  std::vector<CKRGraphEdge*> edges;
  auto it = node->GetEdgeIterator();
  for (CKRGraphEdge* edge = it.Next(1); edge != nullptr; edge = it.Next(0))
    edges.push_back(edge);
  return edges;
}

bool IsAlive(const IKRObject* object) {
  return KRLiveGraphObjects().count(object) != 0;
}

// Every node reachable from `start` over edges either way (all the nodes of
// its connected part).
std::vector<CKRGraphNode*> Component(CKRGraphNode* start) {
  std::vector<CKRGraphNode*> nodes{start};
  std::set<CKRGraphNode*> seen{start};
  for (std::size_t at = 0; at < nodes.size(); ++at)
    for (CKRGraphEdge* edge : Edges(nodes[at]))
      for (CKRGraphNode* end : {edge->GetPrimary(), edge->GetSecondary()})
        if (end != nullptr && seen.insert(end).second)
          nodes.push_back(end);
  return nodes;
}

// The shape of a connected part as text: each node (by name, in name order)
// with its class and its edges in list order, each edge with its class,
// ends, direction and connected state.
std::string Shape(CKRGraphNode* start) {
  std::vector<CKRGraphNode*> nodes = Component(start);
  std::sort(nodes.begin(), nodes.end(), [](CKRGraphNode* a, CKRGraphNode* b) { return PlaceName(a) < PlaceName(b); });
  std::ostringstream text;
  for (CKRGraphNode* node : nodes) {
    text << PlaceName(node) << (node->IsTypeOf(CKRTestTown::TypeID) ? "(town):" : ":");
    for (CKRGraphEdge* edge : Edges(node))
      text << " [" << (edge->IsTypeOf(CKRTestOneWay::TypeID) ? "oneway " : edge->IsTypeOf(CKRTestBackWay::TypeID) ? "backway " : "road ")
           << PlaceName(edge->GetPrimary()) << "-" << PlaceName(edge->GetSecondary()) << " d" << edge->GetDirection()
           << (edge->IsConnected() ? "" : " unjoined") << "]";
    text << "\n";
  }
  return text.str();
}

// Releases the nodes of a connected part (one of them is `start`).
void ReleaseComponent(CKRGraphNode* start) {
  for (CKRGraphNode* node : Component(start))
    node->Release();
}

// A test graph: towns and places in a cycle with a one-way and a back-way
// road, two parallel roads and a spur. Every node is reachable from the
// first along the directions.
std::vector<CKRTestPlace*> BuildMap() {
  CKRTestPlace* a = NewPlace(L"A");
  CKRTestPlace* b = NewTown(L"B");
  CKRTestPlace* c = NewTown(L"C");
  CKRTestPlace* d = NewPlace(L"D");
  NewRoad(a, b);
  NewRoad(b, c, CKRTestOneWay::TypeID);
  NewRoad(c, a, CKRTestBackWay::TypeID);
  NewRoad(a, b);
  NewRoad(d, c);
  return {a, b, c, d};
}

}  // namespace

TEST(CKRGraphEdge, ConnectListsTheEdgeAtBothNodesAndDisconnectUnlistsIt) {
  CKRTestPlace* a = NewPlace(L"A");
  CKRTestPlace* b = NewPlace(L"B");
  CKRTestPlace* c = NewPlace(L"C");
  CKRTestRoad* ab = NewRoad(a, b);
  ASSERT_TRUE(ab->IsConnected());
  EXPECT_EQ(Edges(a), std::vector<CKRGraphEdge*>{ab});
  EXPECT_EQ(Edges(b), std::vector<CKRGraphEdge*>{ab});
  EXPECT_EQ(ab->HasNode(b), 1);
  EXPECT_EQ(ab->HasNode(c), 0);
  EXPECT_EQ(ab->HasNode(nullptr), 0);
  EXPECT_EQ(a->GetNeighbor(0), b);
  EXPECT_EQ(b->GetNeighbor(0), a);
  EXPECT_EQ(a->GetEdgeToNeighbor(b), ab);
  EXPECT_EQ(a->GetEdgeToNeighbor(c), nullptr);
  EXPECT_EQ(a->GetEdgeToNeighbor(nullptr), nullptr);
  for (const int index : {-1, 1, 1 << 30}) {
    SCOPED_TRACE(index);
    EXPECT_EQ(a->GetEdge(index), nullptr);
    EXPECT_EQ(a->GetNeighbor(index), nullptr);
  }

  // A connected edge keeps its nodes and is not listed twice.
  EXPECT_EQ(ab->SetNodes(c, b), 0);
  EXPECT_EQ(ab->Connect(), 0);
  EXPECT_EQ(a->GetEdgeCollection()->GetCount(), 1);
  EXPECT_EQ(ab->GetPrimary(), a);

  // An edge from a node to itself cannot connect and leaves the list alone.
  CKRTestRoad* loop = NewRoad(a, a);
  EXPECT_FALSE(loop->IsConnected());
  EXPECT_EQ(loop->Connect(), 0);
  EXPECT_EQ(Edges(a), std::vector<CKRGraphEdge*>{ab});
  EXPECT_EQ(loop->SetNodes(nullptr, b), 0);
  EXPECT_EQ(loop->GetPrimary(), a);
  EXPECT_EQ(loop->SwapNodes(), 0);

  // Second in both lists; Connect refused by the secondary undoes the first
  // listing.
  CKRTestRoad* bc = NewRoad(b, c);
  EXPECT_EQ(b->GetEdge(1), bc);
  EXPECT_EQ(b->GetNeighbor(1), c);
  CKRTestRoad* again = NewRoad(c, b);
  EXPECT_TRUE(again->IsConnected());  // parallel edges are separate edges
  EXPECT_EQ(c->GetEdgeCollection()->GetCount(), 2);

  EXPECT_EQ(ab->Disconnect(), 1);
  EXPECT_FALSE(ab->IsConnected());
  EXPECT_EQ(ab->GetPrimary(), nullptr);
  EXPECT_EQ(ab->GetSecondary(), nullptr);
  EXPECT_EQ(Edges(a), std::vector<CKRGraphEdge*>{});
  EXPECT_EQ(Edges(b), (std::vector<CKRGraphEdge*>{bc, again}));
  EXPECT_EQ(ab->Disconnect(), 0);
  EXPECT_EQ(ab->Connect(), 0);
  // Named again, it joins again.
  EXPECT_EQ(ab->SetNodes(b, a), 1);
  EXPECT_EQ(ab->Connect(), 1);
  EXPECT_EQ(b->GetEdge(2), ab);

  for (CKRGraphEdge* edge : {static_cast<CKRGraphEdge*>(loop)})
    edge->Release();
  for (CKRGraphNode* node : {a, b, c})
    node->Release();
  EXPECT_FALSE(IsAlive(bc));
  EXPECT_FALSE(IsAlive(ab));
}

TEST(CKRGraphEdge, DirectionDecidesWhichWayTheEdgeIsFollowed) {
  struct SKRCase {
    CKRGuid m_Type;
    std::uint16_t m_Direction;
    bool m_FromPrimary;
    bool m_FromSecondary;
  };
  const SKRCase cases[] = {
      {CKRTestRoad::TypeID, CKRGraphEdge::KR_EDGE_BOTH_WAYS, true, true},
      {CKRTestBackWay::TypeID, CKRGraphEdge::KR_EDGE_SECONDARY_TO_PRIMARY, false, true},
      {CKRTestOneWay::TypeID, CKRGraphEdge::KR_EDGE_PRIMARY_TO_SECONDARY, true, false},
  };
  for (const SKRCase& test : cases) {
    SCOPED_TRACE(testing::Message() << "direction " << test.m_Direction);
    CKRTestPlace* a = NewPlace(L"A");
    CKRTestPlace* b = NewPlace(L"B");
    CKRTestRoad* edge = NewRoad(a, b, test.m_Type);
    EXPECT_EQ(edge->GetDirection(), test.m_Direction);
    EXPECT_EQ(edge->GetNeighbor(a), test.m_FromPrimary ? b : nullptr);
    EXPECT_EQ(edge->GetNeighbor(b), test.m_FromSecondary ? a : nullptr);
    EXPECT_EQ(a->GetNeighbor(0), test.m_FromPrimary ? b : nullptr);
    EXPECT_EQ(a->GetEdgeToNeighbor(b), test.m_FromPrimary ? edge : nullptr);
    EXPECT_EQ(b->GetEdgeToNeighbor(a), test.m_FromSecondary ? edge : nullptr);
    // Swapped, the direction turns round with respect to the nodes.
    EXPECT_EQ(edge->SwapNodes(), 1);
    EXPECT_EQ(edge->GetPrimary(), b);
    EXPECT_EQ(edge->GetNeighbor(b), test.m_FromPrimary ? a : nullptr);
    EXPECT_EQ(edge->GetNeighbor(a), test.m_FromSecondary ? b : nullptr);
    EXPECT_EQ(Edges(a), std::vector<CKRGraphEdge*>{edge});
    EXPECT_EQ(Edges(b), std::vector<CKRGraphEdge*>{edge});
    EXPECT_EQ(edge->GetNeighbor(nullptr), nullptr);
    a->Release();
    b->Release();
  }
}

// Releasing a node releases its edges first to last; the other end of each
// no longer lists it. An edge that refuses its release survives unjoined,
// listed nowhere.
TEST(CKRGraphNode, ReleasingANodeReleasesItsEdgesAndTheirOtherEndsForgetThem) {
  CKRTestPlace* hub = NewPlace(L"hub");
  std::vector<CKRTestPlace*> spokes;
  std::vector<CKRTestRoad*> roads;
  for (const wchar_t* name : {L"1", L"2", L"3"}) {
    spokes.push_back(NewPlace(name));
    roads.push_back(NewRoad(spokes.size() % 2 != 0 ? hub : spokes.back(), spokes.size() % 2 != 0 ? spokes.back() : hub));
  }
  roads[1]->m_RefuseRelease = true;
  CKRTestRoad* rim = NewRoad(spokes[0], spokes[2]);

  EXPECT_EQ(hub->Release(), 1);
  EXPECT_FALSE(IsAlive(hub));
  EXPECT_FALSE(IsAlive(roads[0]));
  EXPECT_FALSE(IsAlive(roads[2]));
  ASSERT_TRUE(IsAlive(roads[1]));
  EXPECT_FALSE(roads[1]->IsConnected());
  EXPECT_EQ(roads[1]->GetPrimary(), nullptr);
  EXPECT_EQ(Edges(spokes[0]), std::vector<CKRGraphEdge*>{rim});
  EXPECT_EQ(Edges(spokes[1]), std::vector<CKRGraphEdge*>{});
  EXPECT_EQ(Edges(spokes[2]), std::vector<CKRGraphEdge*>{rim});

  // A connected edge released on its own leaves both lists.
  EXPECT_EQ(rim->Release(), 1);
  EXPECT_EQ(spokes[0]->GetEdgeCollection()->GetCount(), 0);
  EXPECT_EQ(spokes[2]->GetEdgeCollection()->GetCount(), 0);

  roads[1]->m_RefuseRelease = false;
  EXPECT_EQ(roads[1]->Release(), 1);
  for (CKRTestPlace* spoke : spokes)
    spoke->Release();
}

// The descriptors say what stored archives carry: the edge's two node
// links, then the node's edge list, with their IDs, data types and flags.
TEST(CKRGraphNode, StoredFieldsAreTheNodeLinksAndTheEdgeList) {
  CKRFrameworkStore store;
  struct SKRExpected {
    CKRSerialObjectTypeImpl* m_pType;
    CKRGuid m_FieldID;
    const wchar_t* m_Name;
    CKRGuid m_DataType;
    int m_Flags;
  };
  const SKRExpected expected[] = {
      {CKRGraphEdge::GetCKRGraphEdgeType(), CKRGuid::Literal("{1212F592-7438-407D-8ACB-7A5E5B7AC239}"),
       L"m_pPrimaryNode", KRDT_OBJECT_LINK, 0x427},
      {CKRGraphEdge::GetCKRGraphEdgeType(), CKRGuid::Literal("{6DAE28D0-BFB9-4421-B142-F5671EF3A55A}"),
       L"m_pSecondaryNode", KRDT_OBJECT_LINK, 0x427},
      {CKRGraphNode::GetCKRGraphNodeType(), CKRGuid::Literal("{BC46ABAF-175D-4139-9B08-1B063477ADDE}"), L"m_EdgeList",
       KRDT_OBJECT_COLLECTION, 0x447},
  };
  for (const SKRExpected& field : expected) {
    SCOPED_TRACE(field.m_Name);
    IKRField* descriptor = field.m_pType->GetField(field.m_FieldID);
    ASSERT_NE(descriptor, nullptr);
    EXPECT_EQ(descriptor->GetName(), field.m_Name);
    EXPECT_EQ(descriptor->GetDescription(), field.m_Name);
    EXPECT_EQ(descriptor->GetDataTypeID(), field.m_DataType);
    EXPECT_EQ(descriptor->GetFlags(), field.m_Flags);
    EXPECT_EQ(descriptor->GetOriginType(), field.m_pType);
    EXPECT_EQ(descriptor->GetVersion(), 0.0);
  }

  CKRTestPlace* a = NewPlace(L"A");
  CKRTestPlace* b = NewPlace(L"B");
  CKRTestRoad* ab = NewRoad(a, b, CKRTestOneWay::TypeID);
  ASSERT_EQ(store.Save({ab}), 1);
  const SKRStoredObject& edge = store.Stored().m_Objects.at(ab->GetInstanceID());
  EXPECT_EQ(edge.m_WriteOrder, (std::vector<CKRGuid>{expected[0].m_FieldID, expected[1].m_FieldID}));
  EXPECT_EQ(edge.m_Links.at(expected[1].m_FieldID).at(0).m_InstanceID, b->GetInstanceID());
  const SKRStoredObject& node = store.Stored().m_Objects.at(a->GetInstanceID());
  ASSERT_EQ(node.m_Links.at(expected[2].m_FieldID).size(), 1u);
  EXPECT_EQ(node.m_Links.at(expected[2].m_FieldID)[0].m_TypeID, CKRTestOneWay::TypeID);
  EXPECT_EQ(store.Stored().m_Objects.size(), 3u);
  a->Release();
  b->Release();
}

// Storing any node or edge stores the whole connected part; loading it
// gives the same shape: classes, edge order, ends, directions (from the
// edge classes), cycles and parallel edges, one live object per stored one,
// every loaded edge connected.
TEST(CKRGraphNode, GraphsRoundTripWithDirectionsCyclesAndDerivedClasses) {
  CKRFrameworkStore store;
  std::vector<CKRTestPlace*> map = BuildMap();
  const std::string shape = Shape(map[0]);
  for (CKRGraphNode* root : {static_cast<CKRGraphNode*>(map[3]), static_cast<CKRGraphNode*>(map[1])}) {
    SCOPED_TRACE(PlaceName(root));
    ASSERT_EQ(store.Save({root}), 1);
    EXPECT_EQ(store.Stored().m_Objects.size(), 4u + 5u);
    auto* loaded = store.Load<CKRTestPlace>(map[0]->GetInstanceID(), CKRTestPlace::TypeID);
    ASSERT_NE(loaded, nullptr);
    EXPECT_NE(loaded, map[0]);
    EXPECT_EQ(Shape(loaded), shape);
    EXPECT_EQ(Component(loaded).size(), 4u);
    ReleaseComponent(loaded);
  }
  // A lone node stores and loads with an empty edge list.
  CKRTestPlace* lone = NewTown(L"lone");
  ASSERT_EQ(store.Save({lone}), 1);
  auto* loaded = store.Load<CKRGraphNode>(lone->GetInstanceID(), CKRTestTown::TypeID);
  ASSERT_NE(loaded, nullptr);
  EXPECT_EQ(Shape(loaded), "lone(town):\n");
  loaded->Release();
  lone->Release();
  ReleaseComponent(map[0]);
}

// A loaded graph torn down node by node (in random order) or by a release
// walk: at every step no live node lists a released edge or is joined by an
// edge to a released node, and at the end nothing loaded is alive.
TEST(CKRGraphNode, LoadedGraphsReleaseWithoutDeadEdges) {
  std::mt19937 random(KRTestSeed());
  std::vector<CKRTestPlace*> map = BuildMap();
  for (const bool byVisitor : {false, true}) {
    SCOPED_TRACE(byVisitor ? "release walk" : "node by node");
    CKRFrameworkStore store;
    ASSERT_EQ(store.Save({map[0]}), 1);
    auto* loaded = store.Load<CKRTestPlace>(map[0]->GetInstanceID(), CKRTestPlace::TypeID);
    ASSERT_NE(loaded, nullptr);
    std::vector<CKRGraphNode*> nodes = Component(loaded);
    std::set<const IKRObject*> loadedObjects(nodes.begin(), nodes.end());
    for (CKRGraphNode* node : nodes)
      for (CKRGraphEdge* edge : Edges(node)) {
        loadedObjects.insert(edge);
        EXPECT_TRUE(edge->IsConnected());
      }
    ASSERT_EQ(loadedObjects.size(), 9u);
    // A loaded edge swaps like a connected one.
    CKRGraphEdge* first = loaded->GetEdge(0);
    ASSERT_EQ(first->SwapNodes(), 1);
    ASSERT_EQ(first->SwapNodes(), 1);

    if (byVisitor) {
      auto* visitor = NewObject<CKRReleaseVisitor>(CKRReleaseVisitor::GetCKRReleaseVisitorType());
      EXPECT_EQ(visitor->Start(loaded), 1);
      EXPECT_EQ(visitor->GetDFSNodeCollection()->GetCount(), 0);
      visitor->Release();
    } else {
      std::shuffle(nodes.begin(), nodes.end(), random);
      for (std::size_t i = 0; i < nodes.size(); ++i) {
        EXPECT_EQ(nodes[i]->Release(), 1);
        for (std::size_t j = i + 1; j < nodes.size(); ++j)
          for (CKRGraphEdge* edge : Edges(nodes[j])) {
            ASSERT_TRUE(IsAlive(edge)) << "a node lists a released edge";
            EXPECT_TRUE(IsAlive(edge->GetPrimary()) && IsAlive(edge->GetSecondary()));
          }
      }
    }
    for (const IKRObject* object : loadedObjects)
      EXPECT_FALSE(IsAlive(object));
  }
  ReleaseComponent(map[0]);
}

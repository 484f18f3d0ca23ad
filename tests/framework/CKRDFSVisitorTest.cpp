// Walks: pre-order collection along the directions of edges, compared with
// the recursive walk on random graphs deeper than the native nesting; the
// filtered and the release walks; one walk at a time; session IDs that skip
// 0; and walks over a chain of 100,000 nodes on a default stack.
#include <krCoreLib/framework/CKRGraphNodeVisitor.h>

#include "KRFrameworkStore.h"
#include "KRGraphTestObjects.h"
#include "KRTestSeed.h"

#include <gtest/gtest.h>

#include <map>
#include <random>
#include <set>
#include <stdexcept>
#include <thread>

namespace {

using Names = std::vector<std::string>;

CKRTestTracingVisitor* NewTracer() {
  return NewObject<CKRTestTracingVisitor>(CKRTestTracingVisitor::GetCKRTestTracingVisitorType());
}

void ReleaseAll(const std::vector<CKRTestPlace*>& nodes) {
  for (CKRTestPlace* node : nodes)
    node->Release();
}

// The walk exactly as a recursive depth-first search does it, with visit
// sets of its own: the reference for the visitor's order.
void ReferenceWalk(CKRGraphNode* node, std::set<CKRGraphNode*>& nodes, std::set<CKRGraphEdge*>& edges,
                   std::vector<CKRGraphNode*>& order, long& calls) {
  ++calls;
  if (!nodes.insert(node).second)
    return;
  order.push_back(node);
  auto it = node->GetEdgeIterator();
  for (CKRGraphEdge* edge = it.Next(1); edge != nullptr; edge = it.Next(0))
    if (edges.insert(edge).second)
      if (CKRGraphNode* neighbor = edge->GetNeighbor(node))
        ReferenceWalk(neighbor, nodes, edges, order, calls);
}

}  // namespace

// Nodes A, B, C joined A-B both ways and B-C from B only; a one-way edge
// walked from either end; a cycle; the override runs around each node's
// step, nested as the walk nests.
TEST(CKRDFSVisitor, CollectsInPreOrderAlongTheAllowedDirections) {
  CKRFrameworkStore types;
  CKRTestTracingVisitor* visitor = NewTracer();
  CKRTestPlace* a = NewPlace(L"A");
  CKRTestPlace* b = NewPlace(L"B");
  CKRTestPlace* c = NewPlace(L"C");
  NewRoad(a, b);
  NewRoad(b, c, CKRTestOneWay::TypeID);
  EXPECT_EQ(visitor->Start(a), 1);
  EXPECT_EQ(Collected(visitor), (Names{"A", "B", "C"}));
  EXPECT_EQ(visitor->m_Log, (Names{"+A", "+B", "+C", "-C", "-B", "-A"}));
  visitor->ClearDFSNodeList();
  EXPECT_EQ(visitor->Start(c), 1);
  EXPECT_EQ(Collected(visitor), (Names{"C"}));

  // Second walk without clearing: only new nodes are appended.
  EXPECT_EQ(visitor->Start(a), 1);
  EXPECT_EQ(Collected(visitor), (Names{"C", "A", "B"}));
  std::vector<std::string> reversed;
  auto back = visitor->GetDFSNodeReverseIterator();
  for (CKRGraphNode* node = back.Next(1); node != nullptr; node = back.Next(0))
    reversed.push_back(PlaceName(node));
  EXPECT_EQ(reversed, (Names{"B", "A", "C"}));
  ReleaseAll({a, b, c});

  // Only from the secondary to the primary node.
  a = NewPlace(L"A");
  b = NewPlace(L"B");
  NewRoad(a, b, CKRTestBackWay::TypeID);
  visitor->ClearDFSNodeList();
  EXPECT_EQ(visitor->Start(a), 1);
  EXPECT_EQ(Collected(visitor), (Names{"A"}));
  visitor->ClearDFSNodeList();
  EXPECT_EQ(visitor->Start(b), 1);
  EXPECT_EQ(Collected(visitor), (Names{"B", "A"}));
  ReleaseAll({a, b});

  // A cycle A-B-C-A, each node once; B-C is crossed once, from C, where
  // VisitNode finds B visited.
  a = NewPlace(L"A");
  b = NewPlace(L"B");
  c = NewPlace(L"C");
  NewRoad(a, b);
  NewRoad(b, c);
  NewRoad(c, a);
  visitor->ClearDFSNodeList();
  visitor->m_Log.clear();
  EXPECT_EQ(visitor->Start(b), 1);
  EXPECT_EQ(Collected(visitor), (Names{"B", "A", "C"}));
  EXPECT_EQ(visitor->m_Log, (Names{"+B", "+A", "+C", "+B", "-B", "-C", "-A", "-B"}));
  EXPECT_EQ(visitor->GetDFSNodeCollection()->GetCount(), 3);
  EXPECT_EQ(visitor->Start(nullptr), 0);
  EXPECT_EQ(visitor->VisitNode(nullptr), 0);
  ReleaseAll({a, b, c});
  visitor->Release();
}

// Random graphs (parallel edges, edges a node cannot leave by, self-loops
// that never connect, long paths far deeper than the walk nests natively):
// the visitor's order is the recursive walk's, and an override is called
// once for every node the recursive walk would call it for.
TEST(CKRDFSVisitor, MatchesTheRecursiveWalkOnRandomGraphs) {
  CKRFrameworkStore types;
  std::mt19937 random(KRTestSeed());
  const CKRGuid kinds[] = {CKRTestRoad::TypeID, CKRTestOneWay::TypeID, CKRTestBackWay::TypeID};
  for (int round = 0; round < 40; ++round) {
    const int size = round < 30 ? 1 + int(random() % 40) : 2500 + int(random() % 2000);
    const bool pathLike = round >= 30;
    SCOPED_TRACE(testing::Message() << "round " << round << ", " << size << " nodes");
    std::vector<CKRTestPlace*> nodes;
    for (int i = 0; i < size; ++i)
      nodes.push_back(NewPlace(std::to_wstring(i).c_str()));
    const int edges = pathLike ? 2 * size : int(random() % (3 * size + 1));
    for (int i = 0; i < edges; ++i) {
      const int from = pathLike ? 1 + int(random() % (size - 1)) : int(random() % size);
      const int to = pathLike ? from - 1 - int(random() % std::min(from, 3)) : int(random() % size);
      NewRoad(nodes[from], nodes[to], kinds[pathLike ? random() % 2 : random() % 3]);
    }
    CKRGraphNode* start = nodes[pathLike ? size - 1 : random() % size];
    std::set<CKRGraphNode*> seenNodes;
    std::set<CKRGraphEdge*> seenEdges;
    std::vector<CKRGraphNode*> expected;
    long calls = 0;
    ReferenceWalk(start, seenNodes, seenEdges, expected, calls);

    CKRTestTracingVisitor* visitor = NewTracer();
    visitor->m_Quiet = true;
    ASSERT_EQ(visitor->Start(start), 1);
    std::vector<CKRGraphNode*> order;
    auto it = visitor->GetDFSNodeIterator();
    for (CKRGraphNode* node = it.Next(1); node != nullptr; node = it.Next(0))
      order.push_back(node);
    ASSERT_EQ(order, expected);
    EXPECT_EQ(visitor->m_Calls, calls);
    visitor->Release();
    ReleaseAll(nodes);
  }
}

TEST(CKRFilteredDFSVisitor, CollectsOnlySoughtTypesAndWalksThroughOthers) {
  CKRFrameworkStore types;
  auto* visitor = NewObject<CKRFilteredDFSVisitor>(CKRFilteredDFSVisitor::GetCKRFilteredDFSVisitorType());
  CKRTestPlace* a = NewPlace(L"A");
  CKRTestPlace* b = NewTown(L"B");
  CKRTestPlace* c = NewPlace(L"C");
  CKRTestPlace* d = NewTown(L"D");
  NewRoad(a, b);
  NewRoad(b, c);
  NewRoad(c, d);
  EXPECT_EQ(visitor->Start(a), 0);
  EXPECT_EQ(Collected(visitor), Names{});

  visitor->AddSeekType(CKRTestTown::TypeID);
  EXPECT_EQ(visitor->Start(a), 1);
  EXPECT_EQ(Collected(visitor), (Names{"B", "D"}));
  // A base type collects its descendants too; a duplicate changes nothing.
  visitor->ClearDFSNodeList();
  visitor->AddSeekType(CKRTestPlace::TypeID);
  visitor->AddSeekType(CKRTestPlace::TypeID);
  EXPECT_EQ(visitor->Start(d), 1);
  EXPECT_EQ(Collected(visitor), (Names{"D", "C", "B", "A"}));

  visitor->ClearSeekTypes();
  EXPECT_EQ(visitor->Start(a), 0);
  visitor->Release();
  ReleaseAll({a, b, c, d});
}

// Everything reachable is released with its edges; what the directions
// keep out of reach stays, and lists no released edge.
TEST(CKRReleaseVisitor, ReleasesEveryReachableNodeWithItsEdges) {
  CKRFrameworkStore types;
  auto* visitor = NewObject<CKRReleaseVisitor>(CKRReleaseVisitor::GetCKRReleaseVisitorType());
  CKRTestPlace* a = NewPlace(L"A");
  CKRTestPlace* b = NewPlace(L"B");
  CKRTestPlace* c = NewPlace(L"C");
  CKRTestPlace* outside = NewPlace(L"outside");
  CKRTestRoad* ab = NewRoad(a, b);
  CKRTestRoad* bc = NewRoad(b, c);
  CKRTestRoad* in = NewRoad(outside, c, CKRTestOneWay::TypeID);
  EXPECT_EQ(visitor->Start(nullptr), 0);
  EXPECT_EQ(visitor->Start(a), 1);
  for (const IKRObject* gone : std::initializer_list<const IKRObject*>{a, b, c, ab, bc, in})
    EXPECT_EQ(KRLiveGraphObjects().count(gone), 0u);
  EXPECT_EQ(visitor->GetDFSNodeCollection()->GetCount(), 0);
  EXPECT_EQ(outside->GetEdgeCollection()->GetCount(), 0);
  EXPECT_EQ(KRLiveGraphObjects().count(outside), 1u);
  outside->Release();
  visitor->Release();
}

// No walk starts while another runs, also from an override; the lock goes
// with the walk, also when an override throws.
TEST(CKRGraphNodeVisitorImpl, OnlyOneWalkRunsAtATime) {
  CKRFrameworkStore types;
  CKRTestTracingVisitor* outer = NewTracer();
  CKRTestTracingVisitor* other = NewTracer();
  CKRTestPlace* a = NewPlace(L"A");
  CKRTestPlace* b = NewPlace(L"B");
  NewRoad(a, b);
  std::vector<int> nested;
  outer->m_Hook = [&](CKRGraphNode* node) {
    nested.push_back(other->Start(node));
    nested.push_back(outer->Start(node));
    return true;
  };
  EXPECT_EQ(outer->Start(a), 1);
  EXPECT_EQ(nested, (std::vector<int>{0, 0, 0, 0}));
  EXPECT_EQ(Collected(outer), (Names{"A", "B"}));
  EXPECT_EQ(Collected(other), Names{});
  EXPECT_EQ(other->Start(b), 1);
  EXPECT_EQ(Collected(other), (Names{"B", "A"}));

  outer->m_Hook = [&](CKRGraphNode* node) -> bool {
    if (node == b)
      throw std::runtime_error("stop");
    return true;
  };
  outer->ClearDFSNodeList();
  EXPECT_THROW(outer->Start(a), std::runtime_error);
  outer->m_Hook = nullptr;
  outer->ClearDFSNodeList();
  EXPECT_EQ(outer->Start(a), 1);
  EXPECT_EQ(Collected(outer), (Names{"A", "B"}));
  outer->Release();
  other->Release();
  ReleaseAll({a, b});
}

// Session IDs run up to 65534 and go on with 1: a walk after the wrap still
// reaches nodes and edges that were never visited (mark 0).
TEST(CKRGraphNodeVisitorImpl, SessionIDsSkipZeroWhenTheyWrap) {
  CKRFrameworkStore types;
  for (int i = 0; i < 70000; ++i) {
    const std::uint16_t id = CKRGraphNodeVisitorImpl::GetNextSessionID();
    ASSERT_NE(id, 0);
    if (id == 65533)
      break;
  }
  CKRTestTracingVisitor* visitor = NewTracer();
  CKRTestPlace* a = NewPlace(L"A");
  CKRTestPlace* b = NewPlace(L"B");
  NewRoad(a, b);
  EXPECT_EQ(visitor->Start(a), 1);
  EXPECT_EQ(visitor->GetSessionID(), 65534);
  CKRTestPlace* c = NewPlace(L"C");
  CKRTestPlace* d = NewPlace(L"D");
  NewRoad(c, d);
  EXPECT_EQ(visitor->Start(c), 1);
  EXPECT_EQ(visitor->GetSessionID(), 1);
  EXPECT_EQ(Collected(visitor), (Names{"A", "B", "C", "D"}));
  visitor->Release();
  ReleaseAll({a, b, c, d});
}

// A chain of 100,000 nodes, walked from its head on a thread with the
// default stack: collected in order with one override call per node,
// filtered, and released.
TEST(CKRDFSVisitor, WalksAHundredThousandNodeChainOnADefaultStack) {
  CKRFrameworkStore types;
  constexpr int kLength = 100000;
  std::vector<CKRTestPlace*> chain;
  for (int i = 0; i < kLength; ++i) {
    chain.push_back(i % 10 == 9 ? NewTown(L"") : NewPlace(L""));
    if (i > 0)
      NewRoad(chain[i - 1], chain[i], i % 2 != 0 ? CKRTestRoad::TypeID : CKRTestOneWay::TypeID);
  }
  CKRTestTracingVisitor* tracer = NewTracer();
  tracer->m_Quiet = true;
  auto* filtered = NewObject<CKRFilteredDFSVisitor>(CKRFilteredDFSVisitor::GetCKRFilteredDFSVisitorType());
  filtered->AddSeekType(CKRTestTown::TypeID);
  auto* releaser = NewObject<CKRReleaseVisitor>(CKRReleaseVisitor::GetCKRReleaseVisitorType());
  const std::size_t aliveBefore = KRLiveGraphObjects().size();
  int walked = 0;
  std::thread([&] {
    walked += tracer->Start(chain[0]);
    walked += filtered->Start(chain[0]);
    walked += releaser->Start(chain[0]);
  }).join();
  EXPECT_EQ(walked, 3);
  EXPECT_EQ(tracer->m_Calls, long(kLength));
  ASSERT_EQ(tracer->GetDFSNodeCollection()->GetCount(), kLength);
  auto it = tracer->GetDFSNodeIterator();
  int at = 0;
  for (CKRGraphNode* node = it.Next(1); node != nullptr; node = it.Next(0), ++at)
    ASSERT_EQ(node, chain[at]) << "position " << at;
  EXPECT_EQ(filtered->GetDFSNodeCollection()->GetCount(), kLength / 10);
  EXPECT_EQ(aliveBefore - KRLiveGraphObjects().size(), std::size_t(2 * kLength - 1));
  tracer->ClearDFSNodeList();
  filtered->ClearDFSNodeList();
  for (IKRObject* visitor : std::initializer_list<IKRObject*>{tracer, filtered, releaser})
    visitor->Release();
}

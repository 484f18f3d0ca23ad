// Walks: pre-order along the directions of edges, with overrides nested as
// the walk nests; the recursive walk's order on random graphs deeper than
// the native nesting; one walk at a time; session IDs
// that skip 0; a chain of 100,000 nodes on a default stack.
#include <krCoreLib/framework/CKRGraphNodeVisitor.h>

#include "KRFrameworkStore.h"
#include "KRGraphTestObjects.h"
#include "KRTestSeed.h"

#include <gtest/gtest.h>

#include <random>
#include <stdexcept>
#include <thread>

namespace {

using Names = std::vector<std::string>;

CKRTestTracingVisitor* NewTracer() {
  return NewObject<CKRTestTracingVisitor>(CKRTestTracingVisitor::GetCKRTestTracingVisitorType());
}

template <class... T>
void ReleaseAll(T*... objects) {
  (objects->Release(), ...);
}

// The recursive depth-first walk with visit sets of its own: the
// reference order, and the number of VisitNode calls it makes.
void ReferenceWalk(CKRGraphNode* node, std::set<CKRGraphNode*>& nodes, std::set<CKRGraphEdge*>& edges,
                   std::vector<CKRGraphNode*>& order, long& calls) {
  ++calls;
  if (!nodes.insert(node).second)
    return;
  order.push_back(node);
  for (CKRGraphEdge* edge : Edges(node))
    if (edges.insert(edge).second)
      if (CKRGraphNode* neighbor = edge->GetNeighbor(node))
        ReferenceWalk(neighbor, nodes, edges, order, calls);
}

}  // namespace

TEST(CKRDFSVisitor, CollectsInPreOrderAlongTheAllowedDirections) {
  CKRTestTracingVisitor* visitor = NewTracer();
  CKRTestPlace* a = NewPlace(L"A");
  CKRTestPlace* b = NewPlace(L"B");
  CKRTestPlace* c = NewPlace(L"C");
  NewRoad(a, b);
  NewRoad(b, c, CKRTestOneWay::TypeID);
  EXPECT_EQ(visitor->Start(c), 1);
  EXPECT_EQ(Collected(visitor), (Names{"C"}));
  // A second walk appends only what is not listed yet.
  EXPECT_EQ(visitor->Start(a), 1);
  EXPECT_EQ(Collected(visitor), (Names{"C", "A", "B"}));
  EXPECT_EQ(visitor->m_Log, (Names{"+C", "-C", "+A", "+B", "+C", "-C", "-B", "-A"}));
  EXPECT_EQ(visitor->Start(nullptr), 0);
  ReleaseAll(a, b, c, visitor);
}

// Random graphs (parallel edges, edges that cannot be left one way, loops
// that never connect, paths thousands of nodes deep): the visitor collects
// in the recursive walk's order and makes as many VisitNode calls.
TEST(CKRDFSVisitor, MatchesTheRecursiveWalkOnRandomGraphs) {
  std::mt19937 random(KRTestSeed());
  const CKRGuid kinds[] = {CKRTestRoad::TypeID, CKRTestOneWay::TypeID, CKRTestBackWay::TypeID};
  for (int round = 0; round < 40; ++round) {
    const bool deep = round >= 30;
    const int size = deep ? 2500 + int(random() % 2000) : 1 + int(random() % 40);
    SCOPED_TRACE(testing::Message() << "round " << round << ", " << size << " nodes");
    std::vector<CKRTestPlace*> nodes;
    for (int i = 0; i < size; ++i)
      nodes.push_back(NewPlace(std::to_wstring(i).c_str()));
    const int edges = deep ? 2 * size : int(random() % (3 * size + 1));
    for (int i = 0; i < edges; ++i) {
      const int from = deep ? 1 + int(random() % (size - 1)) : int(random() % size);
      const int to = deep ? from - 1 - int(random() % std::min(from, 3)) : int(random() % size);
      CKRTestRoad* road = NewRoad(nodes[from], nodes[to], kinds[random() % (deep ? 2 : 3)]);
      if (!road->IsConnected())
        road->Release();  // a loop: joins nothing
    }
    CKRGraphNode* start = nodes[deep ? size - 1 : random() % size];
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
    for (CKRTestPlace* node : nodes)
      node->Release();
  }
}

// No walk starts while another runs, also from an override; the lock goes
// with the walk, also when an override throws.
TEST(CKRGraphNodeVisitorImpl, OnlyOneWalkRunsAtATime) {
  CKRTestTracingVisitor* outer = NewTracer();
  CKRTestTracingVisitor* other = NewTracer();
  CKRTestPlace* a = NewPlace(L"A");
  CKRTestPlace* b = NewPlace(L"B");
  NewRoad(a, b);
  std::vector<int> nested;
  outer->m_Hook = [&](CKRGraphNode* node) {
    nested.push_back(other->Start(node) + outer->Start(node));
    if (node == b && nested.size() > 2)
      throw std::runtime_error("stop");
    return true;
  };
  EXPECT_EQ(outer->Start(a), 1);
  EXPECT_EQ(nested, (std::vector<int>{0, 0}));
  EXPECT_EQ(Collected(other), Names{});
  EXPECT_THROW(outer->Start(a), std::runtime_error);
  outer->m_Hook = nullptr;
  outer->ClearDFSNodeList();
  EXPECT_EQ(outer->Start(b), 1);
  EXPECT_EQ(Collected(outer), (Names{"B", "A"}));
  ReleaseAll(a, b, outer, other);
}

// Session IDs run up to 65534 and go on with 1, never 0: a walk after the
// wrap still reaches nodes that were never visited (mark 0).
TEST(CKRGraphNodeVisitorImpl, SessionIDsSkipZeroWhenTheyWrap) {
  for (int i = 0; i < 65535 && CKRGraphNodeVisitorImpl::GetNextSessionID() != 65533; ++i) {
  }
  CKRTestTracingVisitor* visitor = NewTracer();
  CKRTestPlace* a = NewPlace(L"A");
  EXPECT_EQ(visitor->Start(a), 1);
  EXPECT_EQ(visitor->GetSessionID(), 65534);
  CKRTestPlace* b = NewPlace(L"B");
  NewRoad(b, NewPlace(L"C"));
  EXPECT_EQ(visitor->Start(b), 1);
  EXPECT_EQ(visitor->GetSessionID(), 1);
  EXPECT_EQ(Collected(visitor), (Names{"A", "B", "C"}));
  b->GetNeighbor(0)->Release();
  ReleaseAll(a, b, visitor);
}

// A chain of 100,000 nodes walked from its head on a thread with the
// default stack: collected in order with one override call per node,
// filtered (the towns only, walking through the other places), then
// released with its edges; the same chain stored and loaded
// is released by a walk as well.
TEST(CKRDFSVisitor, WalksAHundredThousandNodeChainOnADefaultStack) {
  constexpr int kLength = 100000;
  std::vector<CKRTestPlace*> chain;
  for (int i = 0; i < kLength; ++i) {
    chain.push_back(NewPlace(L"", i % 10 == 9));
    if (i > 0)
      NewRoad(chain[i - 1], chain[i], i % 2 != 0 ? CKRTestRoad::TypeID : CKRTestOneWay::TypeID);
  }
  CKRTestTracingVisitor* tracer = NewTracer();
  tracer->m_Quiet = true;
  auto* filtered = NewObject<CKRFilteredDFSVisitor>(CKRFilteredDFSVisitor::GetCKRFilteredDFSVisitorType());
  filtered->AddSeekType(CKRTestTown::TypeID);
  auto* releaser = NewObject<CKRReleaseVisitor>(CKRReleaseVisitor::GetCKRReleaseVisitorType());
  const std::size_t aliveBefore = KRLiveGraphObjects().size();
  CKRFrameworkStore store;
  int walked = 0;
  std::thread([&] {
    CKRGraphNode* loaded = nullptr;
    if (store.Save({chain[0]}) != 0)
      loaded = store.Load<CKRGraphNode>(chain[0]->GetInstanceID(), CKRTestPlace::TypeID);
    walked = releaser->Start(loaded);
  }).join();
  EXPECT_EQ(walked, 1);
  EXPECT_EQ(KRLiveGraphObjects().size(), aliveBefore);
  std::thread([&] { walked = tracer->Start(chain[0]) + filtered->Start(chain[0]) + releaser->Start(chain[0]); }).join();
  EXPECT_EQ(walked, 3);
  EXPECT_EQ(tracer->m_Calls, long(kLength));
  auto it = tracer->GetDFSNodeIterator();
  int at = 0;
  for (CKRGraphNode* node = it.Next(1); node != nullptr; node = it.Next(0), ++at)
    ASSERT_EQ(node, chain[at]) << "position " << at;
  EXPECT_EQ(at, kLength);
  EXPECT_EQ(filtered->GetDFSNodeCollection()->GetCount(), kLength / 10);
  EXPECT_EQ(aliveBefore - KRLiveGraphObjects().size(), std::size_t(2 * kLength - 1));
  tracer->ClearDFSNodeList();
  filtered->ClearDFSNodeList();
  ReleaseAll(tracer, filtered, releaser);
}

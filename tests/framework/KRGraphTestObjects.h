// Nodes, edges and a visitor for the graph tests: derived node classes,
// roads that go one way (the direction comes with the class, so loaded
// roads have it too), a register of live nodes and edges to find dead
// ones, and a visitor that logs its calls.
#pragma once

#include <krCoreLib/framework/CKRGraphNodeVisitor.h>

#include "KRFrameworkTestObjects.h"

#include <functional>
#include <set>
#include <string>
#include <vector>

inline std::set<const IKRObject*>& KRLiveGraphObjects() {
  static std::set<const IKRObject*> s_Live;
  return s_Live;
}
inline bool IsAlive(const IKRObject* object) {
  return KRLiveGraphObjects().count(object) != 0;
}

class CKRTestPlace : public CKRGraphNode {
  KR_DECLARE_SERIAL_TYPE(CKRTestPlace, CKRSerialObjectTypeImpl, "{6C000000-0000-4000-8000-000000000001}")
public:
  CKRString m_Name;

protected:
  CKRTestPlace() { KRLiveGraphObjects().insert(this); }
  ~CKRTestPlace() override { KRLiveGraphObjects().erase(this); }
};

class CKRTestTown : public CKRTestPlace {
  KR_DECLARE_SERIAL_TYPE(CKRTestTown, CKRSerialObjectTypeImpl, "{6C000000-0000-4000-8000-000000000002}")
};

// Followed both ways; can be told to refuse its release.
class CKRTestRoad : public CKRGraphEdge {
  KR_DECLARE_SERIAL_TYPE(CKRTestRoad, CKRSerialObjectTypeImpl, "{6C000000-0000-4000-8000-000000000003}")
public:
  bool m_RefuseRelease = false;
  int OnBeforeRelease() override { return m_RefuseRelease ? 0 : CKRGraphEdge::OnBeforeRelease(); }

protected:
  CKRTestRoad() { KRLiveGraphObjects().insert(this); }
  ~CKRTestRoad() override { KRLiveGraphObjects().erase(this); }
  int Directed(std::uint16_t direction) { return CKRGraphEdge::OnInitialize() != 0 && SetDirection(direction) ? 1 : 0; }
};

// Only from the primary to the secondary node.
class CKRTestOneWay : public CKRTestRoad {
  KR_DECLARE_SERIAL_TYPE(CKRTestOneWay, CKRSerialObjectTypeImpl, "{6C000000-0000-4000-8000-000000000004}")
public:
  int OnInitialize() override { return Directed(KR_EDGE_PRIMARY_TO_SECONDARY); }
};

// Only from the secondary to the primary node.
class CKRTestBackWay : public CKRTestRoad {
  KR_DECLARE_SERIAL_TYPE(CKRTestBackWay, CKRSerialObjectTypeImpl, "{6C000000-0000-4000-8000-000000000005}")
public:
  int OnInitialize() override { return Directed(KR_EDGE_SECONDARY_TO_PRIMARY); }
};

// Logs "+name" before and "-name" after the base's step (unless quiet),
// counts its calls, and runs a hook first; a hook answering false skips
// the node.
class CKRTestTracingVisitor : public CKRDFSVisitor {
  KR_DECLARE_OBJECT_TYPE(CKRTestTracingVisitor, CKRObjectTypeImpl, "{6C000000-0000-4000-8000-000000000006}")
public:
  std::vector<std::string> m_Log;
  bool m_Quiet = false;
  long m_Calls = 0;
  std::function<bool(CKRGraphNode*)> m_Hook;

  int VisitNode(CKRGraphNode* node) override;
};

CKRTestPlace* NewPlace(const wchar_t* name, bool town = false);
// A road of the class `typeID`, joined and connected when it can be.
CKRTestRoad* NewRoad(CKRGraphNode* primary, CKRGraphNode* secondary, CKRGuid typeID = CKRTestRoad::TypeID);
// The name of a test place; "?" for null and other nodes.
std::string PlaceName(CKRGraphNode* node);
std::vector<CKRGraphEdge*> Edges(CKRGraphNode* node);
// The names of the collected nodes, in order.
std::vector<std::string> Collected(CKRDFSVisitor* visitor);

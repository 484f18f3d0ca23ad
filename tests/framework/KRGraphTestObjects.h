// Nodes, edges and visitors for the graph tests: derived node classes,
// edges that go one way only, a live-object register to find dead edges,
// and a visitor that records its calls.
#pragma once

#include <krCoreLib/framework/CKRGraphNodeVisitor.h>

#include <functional>
#include <set>
#include <string>
#include <vector>

namespace KRGraphTestFields {
inline constexpr CKRGuid kPlaceName = CKRGuid::Literal("{6B000000-0000-4000-8000-000000000001}");
}  // namespace KRGraphTestFields

// Every node and edge of the test classes alive now.
inline std::set<const IKRObject*>& KRLiveGraphObjects() {
  static std::set<const IKRObject*> s_Live;
  return s_Live;
}

// A node with a stored name, and a class derived from it.
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

// An edge that can be told to refuse its release.
class CKRTestRoad : public CKRGraphEdge {
  KR_DECLARE_SERIAL_TYPE(CKRTestRoad, CKRSerialObjectTypeImpl, "{6C000000-0000-4000-8000-000000000003}")
public:
  bool m_RefuseRelease = false;
  int OnBeforeRelease() override { return m_RefuseRelease ? 0 : CKRGraphEdge::OnBeforeRelease(); }

protected:
  CKRTestRoad() { KRLiveGraphObjects().insert(this); }
  ~CKRTestRoad() override { KRLiveGraphObjects().erase(this); }
};

// Roads followed only from the primary to the secondary node, and only
// from the secondary to the primary node: the direction comes with the
// class, so loaded edges have it too.
class CKRTestOneWay : public CKRTestRoad {
  KR_DECLARE_SERIAL_TYPE(CKRTestOneWay, CKRSerialObjectTypeImpl, "{6C000000-0000-4000-8000-000000000004}")
public:
  int OnInitialize() override {
    return CKRTestRoad::OnInitialize() != 0 && SetDirection(KR_EDGE_PRIMARY_TO_SECONDARY) ? 1 : 0;
  }
};

class CKRTestBackWay : public CKRTestRoad {
  KR_DECLARE_SERIAL_TYPE(CKRTestBackWay, CKRSerialObjectTypeImpl, "{6C000000-0000-4000-8000-000000000005}")
public:
  int OnInitialize() override {
    return CKRTestRoad::OnInitialize() != 0 && SetDirection(KR_EDGE_SECONDARY_TO_PRIMARY) ? 1 : 0;
  }
};

// A depth-first visitor whose VisitNode override logs "+name" before and
// "-name" after the base's step, unless told to be quiet, and runs a hook
// first; a hook that returns false skips the node.
class CKRTestTracingVisitor : public CKRDFSVisitor {
  KR_DECLARE_OBJECT_TYPE(CKRTestTracingVisitor, CKRObjectTypeImpl, "{6C000000-0000-4000-8000-000000000006}")
public:
  std::vector<std::string> m_Log;
  bool m_Quiet = false;
  long m_Calls = 0;
  std::function<bool(CKRGraphNode*)> m_Hook;

  int VisitNode(CKRGraphNode* node) override;
};

// Made through their types.
CKRTestPlace* NewPlace(const wchar_t* name);
CKRTestTown* NewTown(const wchar_t* name);
CKRTestRoad* NewRoad(CKRGraphNode* primary, CKRGraphNode* secondary, CKRGuid typeID = CKRTestRoad::TypeID);
// A new object of `type` as a T (a visitor, say).
template <class T>
T* NewObject(IKRObjectType* type) {
  return dynamic_cast<T*>(type->CreateInstance(CKRGuid()));
}
// The name of a test place, "?" for other nodes.
std::string PlaceName(CKRGraphNode* node);
// The names of the visitor's collected nodes, in order.
std::vector<std::string> Collected(CKRDFSVisitor* visitor);

#include "KRGraphTestObjects.h"

#include <krCoreLib/objectmodel/CKRTypeSystem.h>
#include <krCoreLib/serialization/CKRFieldT.h>

KR_IMPLEMENT_SERIAL_TYPE(CKRTestPlace, CKRGraphNode)
KR_IMPLEMENT_SERIAL_TYPE(CKRTestTown, CKRTestPlace)
KR_IMPLEMENT_SERIAL_TYPE(CKRTestRoad, CKRGraphEdge)
KR_IMPLEMENT_SERIAL_TYPE(CKRTestOneWay, CKRTestRoad)
KR_IMPLEMENT_SERIAL_TYPE(CKRTestBackWay, CKRTestRoad)
KR_IMPLEMENT_OBJECT_TYPE(CKRTestTracingVisitor, CKRDFSVisitor)

void CKRTestPlace::CKRTestPlaceType::CreateFields(CKRSerialObjectTypeImpl* target, IKRObject* object) {
  AppendParentFields(target, object);
  BindField<CKRFieldT<CKRString>>(target, object, &CKRTestPlace::m_Name, L"Name", L"The place's name",
                                  CKRGuid::Literal("{6B000000-0000-4000-8000-000000000001}"), KRDT_STRING,
                                  KRF_READ | KRF_WRITE | KRF_VISIBLE);
}

#define KR_TEST_NO_OWN_FIELDS(Class)                                                                   \
  void Class::Class##Type::CreateFields(CKRSerialObjectTypeImpl* target, IKRObject* object) {         \
    AppendParentFields(target, object);                                                                \
  }
KR_TEST_NO_OWN_FIELDS(CKRTestTown)
KR_TEST_NO_OWN_FIELDS(CKRTestRoad)
KR_TEST_NO_OWN_FIELDS(CKRTestOneWay)
KR_TEST_NO_OWN_FIELDS(CKRTestBackWay)

int CKRTestTracingVisitor::VisitNode(CKRGraphNode* node) {
  ++m_Calls;
  if (m_Hook && !m_Hook(node))
    return 0;
  if (!m_Quiet)
    m_Log.push_back("+" + PlaceName(node));
  const int result = CKRDFSVisitor::VisitNode(node);
  if (!m_Quiet)
    m_Log.push_back("-" + PlaceName(node));
  return result;
}

CKRTestPlace* NewPlace(const wchar_t* name, bool town) {
  // Storable types get their fields when the type system claims them.
  static const bool s_Claimed =
      (CKRTypeSystem::Initialize(CKRGuid::Literal("{6D000000-0000-4000-8000-000000000002}")), true);
  (void)s_Claimed;
  auto* place = town ? NewObject<CKRTestPlace>(CKRTestTown::GetCKRTestTownType())
                     : NewObject<CKRTestPlace>(CKRTestPlace::GetCKRTestPlaceType());
  place->m_Name = name;
  return place;
}

CKRTestRoad* NewRoad(CKRGraphNode* primary, CKRGraphNode* secondary, CKRGuid typeID) {
  IKRObjectType* type = CKRTestRoad::GetCKRTestRoadType();
  if (typeID == CKRTestOneWay::TypeID)
    type = CKRTestOneWay::GetCKRTestOneWayType();
  else if (typeID == CKRTestBackWay::TypeID)
    type = CKRTestBackWay::GetCKRTestBackWayType();
  auto* road = NewObject<CKRTestRoad>(type);
  if (road->SetNodes(primary, secondary) != 0)
    road->Connect();
  return road;
}

std::string PlaceName(CKRGraphNode* node) {
  auto* place = dynamic_cast<CKRTestPlace*>(node);
  return place != nullptr ? place->m_Name.ToUtf8() : "?";
}

std::vector<CKRGraphEdge*> Edges(CKRGraphNode* node) {
  std::vector<CKRGraphEdge*> edges;
  auto it = node->GetEdgeIterator();
  for (CKRGraphEdge* edge = it.Next(1); edge != nullptr; edge = it.Next(0))
    edges.push_back(edge);
  return edges;
}

std::vector<std::string> Collected(CKRDFSVisitor* visitor) {
  std::vector<std::string> names;
  auto nodes = visitor->GetDFSNodeIterator();
  for (CKRGraphNode* node = nodes.Next(1); node != nullptr; node = nodes.Next(0))
    names.push_back(PlaceName(node));
  return names;
}

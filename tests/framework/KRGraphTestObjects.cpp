#include "KRGraphTestObjects.h"

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
                                  KRGraphTestFields::kPlaceName, KRDT_STRING, KRF_READ | KRF_WRITE | KRF_VISIBLE);
}

void CKRTestTown::CKRTestTownType::CreateFields(CKRSerialObjectTypeImpl* target, IKRObject* object) {
  AppendParentFields(target, object);
}

void CKRTestRoad::CKRTestRoadType::CreateFields(CKRSerialObjectTypeImpl* target, IKRObject* object) {
  AppendParentFields(target, object);
}

void CKRTestOneWay::CKRTestOneWayType::CreateFields(CKRSerialObjectTypeImpl* target, IKRObject* object) {
  AppendParentFields(target, object);
}

void CKRTestBackWay::CKRTestBackWayType::CreateFields(CKRSerialObjectTypeImpl* target, IKRObject* object) {
  AppendParentFields(target, object);
}

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

CKRTestPlace* NewPlace(const wchar_t* name) {
  auto* place = NewObject<CKRTestPlace>(CKRTestPlace::GetCKRTestPlaceType());
  if (place != nullptr)
    place->m_Name = name;
  return place;
}

CKRTestTown* NewTown(const wchar_t* name) {
  auto* town = NewObject<CKRTestTown>(CKRTestTown::GetCKRTestTownType());
  if (town != nullptr)
    town->m_Name = name;
  return town;
}

CKRTestRoad* NewRoad(CKRGraphNode* primary, CKRGraphNode* secondary, CKRGuid typeID) {
  IKRObjectType* type = typeID == CKRTestOneWay::TypeID    ? static_cast<IKRObjectType*>(CKRTestOneWay::GetCKRTestOneWayType())
                        : typeID == CKRTestBackWay::TypeID ? static_cast<IKRObjectType*>(CKRTestBackWay::GetCKRTestBackWayType())
                                                           : static_cast<IKRObjectType*>(CKRTestRoad::GetCKRTestRoadType());
  auto* road = NewObject<CKRTestRoad>(type);
  if (road != nullptr && road->SetNodes(primary, secondary) != 0)
    road->Connect();
  return road;
}

std::string PlaceName(CKRGraphNode* node) {
  auto* place = dynamic_cast<CKRTestPlace*>(node);
  if (place == nullptr)
    return "?";
  std::string name;
  for (const wchar_t* c = place->m_Name.c_str(); *c != 0; ++c)
    name += char(*c);
  return name;
}

std::vector<std::string> Collected(CKRDFSVisitor* visitor) {
  std::vector<std::string> names;
  auto nodes = visitor->GetDFSNodeIterator();
  for (CKRGraphNode* node = nodes.Next(1); node != nullptr; node = nodes.Next(0))
    names.push_back(PlaceName(node));
  return names;
}

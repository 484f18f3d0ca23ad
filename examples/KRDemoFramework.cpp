// Application framework: a small road map as a graph with a one-way street,
// walked depth-first, filtered by node class and torn down by a release
// walk; and a preferences object with two sections, one of the host's own
// class.
#include "KRDemo.h"

namespace {
constexpr CKRGuid kRepository = CKRGuid::Literal("{7E0F1A2B-3C4D-4E5F-8A9B-0C1D2E3F4B00}");
}  // namespace

// A junction with a name, and a kind of junction that is a roundabout.
class CKRDemoJunction : public CKRGraphNode {
  KR_DECLARE_SERIAL_TYPE(CKRDemoJunction, CKRSerialObjectTypeImpl, "{7E0F1A2B-3C4D-4E5F-8A9B-0C1D2E3F4B01}")
public:
  CKRString m_Name;
};
KR_IMPLEMENT_SERIAL_TYPE(CKRDemoJunction, CKRGraphNode)

class CKRDemoRoundabout : public CKRDemoJunction {
  KR_DECLARE_SERIAL_TYPE(CKRDemoRoundabout, CKRSerialObjectTypeImpl, "{7E0F1A2B-3C4D-4E5F-8A9B-0C1D2E3F4B02}")
};
KR_IMPLEMENT_SERIAL_TYPE(CKRDemoRoundabout, CKRDemoJunction)

// A street followed only from its primary to its secondary junction.
class CKRDemoOneWayStreet : public CKRGraphEdge {
  KR_DECLARE_SERIAL_TYPE(CKRDemoOneWayStreet, CKRSerialObjectTypeImpl, "{7E0F1A2B-3C4D-4E5F-8A9B-0C1D2E3F4B03}")
public:
  int OnInitialize() override {
    return CKRGraphEdge::OnInitialize() != 0 && SetDirection(KR_EDGE_PRIMARY_TO_SECONDARY) ? 1 : 0;
  }
};
KR_IMPLEMENT_SERIAL_TYPE(CKRDemoOneWayStreet, CKRGraphEdge)

// The host's display settings: a section with a field of its own.
class CKRDemoDisplaySection : public CKRPreferenceSection {
  KR_DECLARE_SERIAL_TYPE(CKRDemoDisplaySection, CKRSerialObjectTypeImpl, "{7E0F1A2B-3C4D-4E5F-8A9B-0C1D2E3F4B04}")
public:
  int m_Digits = 3;
};
KR_IMPLEMENT_SERIAL_TYPE(CKRDemoDisplaySection, CKRPreferenceSection)

void CKRDemoJunction::CKRDemoJunctionType::CreateFields(CKRSerialObjectTypeImpl* target, IKRObject* object) {
  AppendParentFields(target, object);
  BindField<CKRFieldT<CKRString>>(target, object, &CKRDemoJunction::m_Name, L"Name", L"The junction's name",
                                  CKRGuid::Literal("{7E0F1A2B-3C4D-4E5F-8A9B-0C1D2E3F4B11}"), KRDT_STRING,
                                  KRF_READ | KRF_WRITE | KRF_VISIBLE);
}

void CKRDemoRoundabout::CKRDemoRoundaboutType::CreateFields(CKRSerialObjectTypeImpl* target, IKRObject* object) {
  AppendParentFields(target, object);
}

void CKRDemoOneWayStreet::CKRDemoOneWayStreetType::CreateFields(CKRSerialObjectTypeImpl* target, IKRObject* object) {
  AppendParentFields(target, object);
}

void CKRDemoDisplaySection::CKRDemoDisplaySectionType::CreateFields(CKRSerialObjectTypeImpl* target,
                                                                   IKRObject* object) {
  AppendParentFields(target, object);
  BindField<CKRFieldT<int>>(target, object, &CKRDemoDisplaySection::m_Digits, L"Digits", L"Digits shown",
                            CKRGuid::Literal("{7E0F1A2B-3C4D-4E5F-8A9B-0C1D2E3F4B12}"), KRDT_INTEGER,
                            KRF_READ | KRF_WRITE | KRF_VISIBLE);
}

namespace {

CKRDemoJunction* NewJunction(IKRObjectType* type, const wchar_t* name) {
  auto* junction = dynamic_cast<CKRDemoJunction*>(type->CreateInstance(CKRGuid()));
  junction->m_Name = name;
  return junction;
}

void Join(IKRObjectType* type, CKRGraphNode* from, CKRGraphNode* to) {
  auto* street = static_cast<CKRGraphEdge*>(type->CreateInstance(CKRGuid()));
  street->SetNodes(from, to);
  street->Connect();
}

void PrintCollected(const wchar_t* title, CKRDFSVisitor* visitor) {
  Print(title);
  auto nodes = visitor->GetDFSNodeIterator();
  for (CKRGraphNode* node = nodes.Next(1); node != nullptr; node = nodes.Next(0))
    Print(L" " + static_cast<CKRDemoJunction*>(node)->m_Name);
  Print(L"\n");
}

template <class T>
T* NewVisitor(IKRObjectType* type) {
  return static_cast<T*>(type->CreateInstance(CKRGuid()));
}

}  // namespace

void KRDemoFramework() {
  CKRTypeSystem::Initialize(kRepository);

  // Market - Bridge - Station both ways, a roundabout at the bridge, and a
  // one-way street from the station back to the market.
  IKRObjectType* junction = CKRDemoJunction::GetCKRDemoJunctionType();
  CKRDemoJunction* market = NewJunction(junction, L"Market");
  CKRDemoJunction* bridge = NewJunction(CKRDemoRoundabout::GetCKRDemoRoundaboutType(), L"Bridge");
  CKRDemoJunction* station = NewJunction(junction, L"Station");
  CKRDemoJunction* harbour = NewJunction(CKRDemoRoundabout::GetCKRDemoRoundaboutType(), L"Harbour");
  IKRObjectType* street = CKRGraphEdge::GetCKRGraphEdgeType();
  Join(street, market, bridge);
  Join(street, bridge, station);
  Join(CKRDemoOneWayStreet::GetCKRDemoOneWayStreetType(), station, harbour);
  Join(CKRDemoOneWayStreet::GetCKRDemoOneWayStreetType(), harbour, market);
  Print(CKRString::Formatted(L"1. Four junctions; the market has %d streets, its first neighbour is %s\n",
                             market->GetEdgeCollection()->GetCount(),
                             static_cast<CKRDemoJunction*>(market->GetNeighbor(0))->m_Name.c_str()));

  auto* walk = NewVisitor<CKRDFSVisitor>(CKRDFSVisitor::GetCKRDFSVisitorType());
  walk->Start(market);
  PrintCollected(L"2. Depth-first from the market:", walk);
  walk->ClearDFSNodeList();
  walk->Start(harbour);
  PrintCollected(L"   From the harbour, whose one-way streets lead only to the market:", walk);
  walk->Release();

  auto* roundabouts = NewVisitor<CKRFilteredDFSVisitor>(CKRFilteredDFSVisitor::GetCKRFilteredDFSVisitorType());
  Print(CKRString::Formatted(L"3. A filtered walk without seek types starts: %d\n", roundabouts->Start(market)));
  roundabouts->AddSeekType(CKRDemoRoundabout::TypeID);
  roundabouts->Start(market);
  PrintCollected(L"   Roundabouts reachable from the market:", roundabouts);
  roundabouts->Release();

  auto* release = NewVisitor<CKRReleaseVisitor>(CKRReleaseVisitor::GetCKRReleaseVisitorType());
  Print(CKRString::Formatted(L"4. A release walk from the market releases the map and its streets: %d\n",
                             release->Start(market)));
  release->Release();

  auto* preferences = static_cast<CKRPreferences*>(CKRPreferences::GetCKRPreferencesType()->CreateInstance(CKRGuid()));
  auto* general = static_cast<CKRPreferenceSection*>(
      CKRPreferenceSection::GetCKRPreferenceSectionType()->CreateInstance(CKRGuid()));
  auto* display = static_cast<CKRDemoDisplaySection*>(
      CKRDemoDisplaySection::GetCKRDemoDisplaySectionType()->CreateInstance(CKRGuid()));
  Print(L"5. A new section is called \"" + general->GetName() + L"\"\n");
  general->SetName(L"General");
  general->SetDescription(L"Settings of every document");
  display->SetName(L"Display");
  display->m_Digits = 4;
  preferences->GetPreferenceSectionMap().Add(general);
  preferences->GetPreferenceSectionMap().Add(display);
  Print(L"   Preferences with two sections, in instance-ID order:\n");
  for (auto [id, section] : preferences->GetPreferenceSectionMap())
    Print(CKRString::Formatted(L"   %s  %s: %s\n", id.GetCString().c_str(), section->GetName().c_str(),
                               section->GetDescription().c_str()));
  preferences->GetPreferenceSectionMap().RemoveAll(true);
  preferences->Release();
}

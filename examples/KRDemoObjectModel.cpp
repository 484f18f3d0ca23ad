// The object model: a host's own classes, their types, objects made, found
// and released through them, and identifiers in every text form.
#include "KRDemo.h"

#include <vector>

// Two classes of the host: a shape and a circle derived from it.
class CKRDemoShape : public CKRObjectImpl {
  KR_DECLARE_OBJECT_TYPE(CKRDemoShape, CKRObjectTypeImpl, "{6A1E0C57-1B0D-4C55-A1B3-5D7E9F0A2C41}")
public:
  CKRString m_Label;

protected:
  CKRDemoShape() = default;
};
KR_IMPLEMENT_OBJECT_TYPE(CKRDemoShape, CKRObjectImpl)

class CKRDemoCircle : public CKRDemoShape {
  KR_DECLARE_OBJECT_TYPE(CKRDemoCircle, CKRObjectTypeImpl, "{C0F3B2A4-8E61-4D2F-9B7A-3E5C1D9F4B86}")
public:
  double m_Radius = 1.0;

protected:
  CKRDemoCircle() = default;
};
KR_IMPLEMENT_OBJECT_TYPE(CKRDemoCircle, CKRDemoShape)

void KRDemoObjectModel() {
  // The host's repository collects the types this program brings.
  const CKRGuid hostRepository = CKRGuid::Literal("{0D6C5B4A-3F2E-4D1C-8B0A-9F8E7D6C5B4A}");

  Print(L"1. Types register themselves while the program loads:\n");
  CKRTypeIterator types = CKRTypeSystem::GetGlobalIterator();
  for (IKRObjectType* type = types.Next(1); type != nullptr; type = types.Next(0))
    Print(CKRString::Formatted(L"   %-14s %s\n", type->GetName().GetString(), type->GetID().GetCString().GetString()));

  CKRTypeSystem::Initialize(hostRepository);
  IKRObjectType* circleType = CKRDemoCircle::GetCKRDemoCircleType();
  Print(CKRString::Formatted(L"\n2. After Initialize the hierarchy is linked: a circle is a shape: %d, an object: %d\n",
                             circleType->IsTypeOf(CKRDemoShape::TypeID), circleType->IsTypeOf(CKRObjectImpl::TypeID)));

  Print(L"\n3. Objects are created through their types:\n");
  std::vector<CKRGuid> ids;
  for (int i = 0; i < 3; ++i) {
    auto* circle = static_cast<CKRDemoCircle*>(circleType->CreateInstance(CKRGuid()));
    circle->m_Radius = 1.5 * (i + 1);
    ids.push_back(circle->GetInstanceID());
    Print(CKRString::Formatted(L"   circle %d  radius %.1f  id %s\n", i, circle->m_Radius,
                               circle->GetInstanceID().GetCString().GetString()));
  }
  const CKRGuid named = CKRGuid::Literal("{2B7E1516-28AE-42D2-A6AB-F7158809CF4F}");
  auto* shape = static_cast<CKRDemoShape*>(CKRDemoShape::GetCKRDemoShapeType()->CreateInstance(named));
  shape->m_Label = L"a shape with a chosen ID";

  Print(L"\n4. ... and found again by instance ID:\n");
  auto* found = static_cast<CKRDemoCircle*>(circleType->GetInstance(ids[1]));
  Print(CKRString::Formatted(L"   GetInstance(%s) -> radius %.1f\n", ids[1].GetCString().GetString(), found->m_Radius));
  auto* foundShape = static_cast<CKRDemoShape*>(CKRDemoShape::GetCKRDemoShapeType()->GetInstance(named));
  Print(CKRString::Formatted(L"   GetInstance(%s) -> \"%s\"\n", named.GetCString().GetString(),
                             foundShape->m_Label.GetString()));

  Print(L"\n5. One identifier in every text form:\n");
  Print(CKRString::Formatted(L"   braced       %s\n", named.GetCString().GetString()));
  Print(CKRString::Formatted(L"   upper case   %s\n", named.GetCStringUpperCase().GetString()));
  Print(CKRString::Formatted(L"   SQL          %ls\n", named.GetSTLStringSQL().c_str()));
  Print(CKRString::Formatted(L"   hex          %s\n", named.GetCStringHex().GetString()));
  Print(CKRString::Formatted(L"   ADO hex      %ls\n", named.GetSTLStringADOHex().c_str()));
  Print(CKRString::Formatted(L"   XML          %s\n", named.GetCStringXML().GetString()));
  Print(CKRString::Formatted(L"   XML64        %s\n", named.GetCStringXML64().GetString()));
  Print(CKRString::Formatted(L"   XML element  %s\n", named.GetCStringXMLElement().GetString()));
  CKRGuid parsed;
  parsed.SetCStringXMLElement(named.GetCStringXMLElement());
  Print(CKRString::Formatted(L"   read back from the XML element form: %s\n",
                             parsed == named ? L"same value" : L"DIFFERENT"));

  Print(L"\n6. Releasing: one circle by hand, the rest by the type system.\n");
  found->Release();
  Print(L"   Expected next: two warnings. The demo leaves three objects to their types on\n"
        L"   purpose; releasing the repository releases them and reports them on the\n"
        L"   developers' debug output, which the demo switches on here.\n");
  // Instances a type still holds at shutdown are released by the type and
  // reported on the developers' debug output, shown here.
  CKRDebugOutput::SetHandler(&CKRDebugOutput::StandardError);
  CKRTypeSystem::ReleaseRepository(hostRepository);
  CKRDebugOutput::SetHandler(nullptr);
  Print(CKRString::Formatted(L"   circles still tracked: %d\n",
                             CKRDemoCircle::GetCKRDemoCircleType()->GetInstanceCount()));
}

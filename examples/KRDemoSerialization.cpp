// Serialization: a storable class of the host with a few fields, its fields
// shown by name and text, edited as text one object or several at once, and
// stored through a small printing store of the demo's own.
#include "KRDemo.h"

#include <vector>

namespace {
constexpr CKRGuid kRepository = CKRGuid::Literal("{7E0F1A2B-3C4D-4E5F-8A9B-0C1D2E3F4A5B}");
constexpr int kShown = KRF_READ | KRF_WRITE | KRF_VISIBLE;
}  // namespace

// A part of an assembly: a name, a quantity, a part number and a link to the
// assembly it belongs to.
class CKRDemoPart : public CKRSerialObject {
  KR_DECLARE_SERIAL_TYPE(CKRDemoPart, CKRSerialObjectTypeImpl, "{7E0F1A2B-3C4D-4E5F-8A9B-0C1D2E3F4A60}")
public:
  CKRString m_Name;
  int m_Quantity = 1;
  CKRGuid m_PartNumber;
  CKRDemoPart* m_pAssembly = nullptr;

protected:
  CKRDemoPart() = default;
};
KR_IMPLEMENT_SERIAL_TYPE(CKRDemoPart, CKRSerialObject)

void CKRDemoPart::CKRDemoPartType::CreateFields(CKRSerialObjectTypeImpl* target, IKRObject* object) {
  AppendParentFields(target, object);
  BindField<CKRFieldT<CKRString>>(target, object, &CKRDemoPart::m_Name, L"Name", L"The part's name",
                                  CKRGuid::Literal("{7E0F1A2B-3C4D-4E5F-8A9B-0C1D2E3F4A61}"), KRDT_STRING, kShown);
  BindField<CKRFieldT<int>>(target, object, &CKRDemoPart::m_Quantity, L"Quantity", L"How many are used",
                            CKRGuid::Literal("{7E0F1A2B-3C4D-4E5F-8A9B-0C1D2E3F4A62}"), KRDT_INTEGER, kShown);
  BindField<CKRFieldT<CKRGuid>>(target, object, &CKRDemoPart::m_PartNumber, L"Part number", L"The catalogue number",
                                CKRGuid::Literal("{7E0F1A2B-3C4D-4E5F-8A9B-0C1D2E3F4A63}"), KRDT_GUID, kShown | KRF_READONLY);
  BindField<CKRObjFieldT<CKRDemoPart>>(target, object, &CKRDemoPart::m_pAssembly, L"Assembly", L"Where it is used",
                                       CKRGuid::Literal("{7E0F1A2B-3C4D-4E5F-8A9B-0C1D2E3F4A64}"), KRDT_OBJECT_LINK, kShown);
}

// A store that prints what the framework writes: one document, manifest
// and stream kind, each with its own type.
class CKRDemoStream : public CKRFieldStream {
  KR_DECLARE_OBJECT_TYPE(CKRDemoStream, CKRObjectTypeImpl, "{7E0F1A2B-3C4D-4E5F-8A9B-0C1D2E3F4A70}")
public:
  int WriteObjectHeader(IKRObject* object) override {
    Print(CKRString::Formatted(L"   object %s of type %s\n", object->GetInstanceID().GetCString().GetString(),
                               object->GetType()->GetName().GetString()));
    return 1;
  }
  int Write(IKRFieldData* data) override {
    Print(CKRString::Formatted(L"     %-12s = %s\n", data->GetField()->GetName().GetString(), data->GetStringValue().GetString()));
    return 1;
  }
  int WriteLink(IKRFieldData* data, IKRObject* object) override {
    Print(CKRString::Formatted(L"     %-12s -> %s\n", data->GetField()->GetName().GetString(),
                               object != nullptr ? object->GetInstanceID().GetCString().GetString() : L"(none)"));
    return 1;
  }
  int WriteLinks(IKRFieldData*, IKRIterator*) override { return 1; }
  IKRObject* ReadLink(IKRFieldData*) override { return nullptr; }
  int ReadLinks(IKRFieldData*, IKRCollection*) override { return 0; }
};
KR_IMPLEMENT_OBJECT_TYPE(CKRDemoStream, CKRFieldStream)

class CKRDemoManifest : public CKRTypeManifest {
  KR_DECLARE_OBJECT_TYPE(CKRDemoManifest, CKRObjectTypeImpl, "{7E0F1A2B-3C4D-4E5F-8A9B-0C1D2E3F4A71}")
public:
  CKRFieldStream* CreateFieldStream(CKRGuid instanceID, IKRObjectType* type) override {
    return CKRTypeManifest::CreateFieldStream(instanceID, type != nullptr ? type : CKRDemoStream::GetCKRDemoStreamType());
  }
};
KR_IMPLEMENT_OBJECT_TYPE(CKRDemoManifest, CKRTypeManifest)

class CKRDemoDocument : public CKRDocument {
  KR_DECLARE_OBJECT_TYPE(CKRDemoDocument, CKRObjectTypeImpl, "{7E0F1A2B-3C4D-4E5F-8A9B-0C1D2E3F4A72}")
public:
  CKRTypeManifest* CreateTypeManifest(CKRGuid typeID, IKRObjectType* type) override {
    return CKRDocument::CreateTypeManifest(typeID, type != nullptr ? type : CKRDemoManifest::GetCKRDemoManifestType());
  }
};
KR_IMPLEMENT_OBJECT_TYPE(CKRDemoDocument, CKRDocument)

namespace {

CKRDemoPart* NewPart(const wchar_t* name, int quantity) {
  auto* part = static_cast<CKRDemoPart*>(CKRDemoPart::GetCKRDemoPartType()->CreateInstance(CKRGuid()));
  part->m_Name = name;
  part->m_Quantity = quantity;
  part->m_PartNumber = CKRGuid::CreateNewGUID();
  return part;
}

void ShowFields(CKRDemoPart* part) {
  for (IKRFieldData* data : part->GetFieldDataList())
    Print(CKRString::Formatted(L"   %-12s %-24s %s%s\n", data->GetField()->GetName().GetString(),
                               data->GetField()->GetDescription().GetString(), data->GetStringValue().GetString(),
                               data->ReadOnly() ? L"  (read-only)" : L""));
}

}  // namespace

void KRDemoSerialization() {
  CKRTypeSystem::Initialize(kRepository);
  CKRDemoPart* frame = NewPart(L"Frame", 1);
  CKRDemoPart* bolt = NewPart(L"Bolt M8", 24);
  bolt->m_pAssembly = frame;

  Print(L"1. A storable class's fields, by name and text (links have no text):\n");
  ShowFields(bolt);

  Print(L"\n2. Edited as text; an int field reads the leading number:\n");
  bolt->GetFieldData(CKRGuid::Literal("{7E0F1A2B-3C4D-4E5F-8A9B-0C1D2E3F4A62}"))->SetValueFromString(L" 32 pieces");
  Print(CKRString::Formatted(L"   Quantity <- \" 32 pieces\" gives %d\n", bolt->m_Quantity));

  Print(L"\n3. The same field of two objects at once:\n");
  IKRField* quantity = CKRDemoPart::GetCKRDemoPartType()->GetField(CKRGuid::Literal("{7E0F1A2B-3C4D-4E5F-8A9B-0C1D2E3F4A62}"));
  auto* group = new CKRGroupFieldData(quantity);
  group->AddFieldData(frame->GetFieldData(quantity->GetFieldID()));
  group->AddFieldData(bolt->GetFieldData(quantity->GetFieldID()));
  Print(CKRString::Formatted(L"   shown as \"%s\"", group->GetStringValue().GetString()));
  group->SetValueFromString(L"  2 ");
  Print(CKRString::Formatted(L"; after setting \"  2 \": \"%s\" (frame %d, bolt %d)\n", group->GetStringValue().GetString(),
                             frame->m_Quantity, bolt->m_Quantity));
  group->Release(false);

  Print(L"\n4. Stored through the demo's printing store: the bolt, then the frame it links to, once:\n");
  CKRDocument* document = static_cast<CKRDocument*>(CKRDemoDocument::GetCKRDemoDocumentType()->CreateInstance(CKRGuid()));
  bolt->SerializeTo(document);
  frame->SerializeTo(document);  // stored already in this session: nothing printed
  document->Release();

  bolt->Release();
  frame->Release();
}

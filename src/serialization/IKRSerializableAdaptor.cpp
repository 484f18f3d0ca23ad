#include <krCoreLib/serialization/IKRSerializableAdaptor.h>

#include <krCoreLib/serialization/CKRDocument.h>
#include <krCoreLib/serialization/IKRField.h>
#include <krCoreLib/serialization/IKRFieldData.h>

#include <algorithm>

IKRSerializableAdaptor::~IKRSerializableAdaptor() {
  ReleaseFieldData();
}

void IKRSerializableAdaptor::AddFieldData(IKRFieldData* fieldData) {
  if (fieldData != nullptr && std::find(m_FieldDataList.begin(), m_FieldDataList.end(), fieldData) == m_FieldDataList.end())
    m_FieldDataList.push_back(fieldData);
}

IKRFieldData* IKRSerializableAdaptor::GetFieldData(CKRGuid fieldID) {
  for (IKRFieldData* data : m_FieldDataList)
    if (IKRField* field = data->GetField(); field != nullptr && field->GetFieldID() == fieldID)
      return data;
  return nullptr;
}

void IKRSerializableAdaptor::ReleaseFieldData() {
  // Taken out first: a field data's release must not find itself listed.
  std::vector<IKRFieldData*> list;
  list.swap(m_FieldDataList);
  for (IKRFieldData* data : list)
    data->Release(false);
}

int IKRSerializableAdaptor::SerializeTo(CKRDocument* document) {
  if (document == nullptr)
    return 0;
  // Deep in a chain of links: stored after the outermost call returns to
  // the document instead of nesting further on the native stack.
  if (document->m_SaveNesting >= CKRDocument::kMaxNesting) {
    document->m_PendingSaves.push_back(this);
    return 1;
  }
  ++document->m_SaveNesting;
  int result = SaveToDocument(document);
  --document->m_SaveNesting;
  if (document->m_SaveNesting == 0 && !document->m_PendingSaves.empty() && !document->SavePending())
    result = 0;
  return result;
}

int IKRSerializableAdaptor::SaveToDocument(CKRDocument* document) {
  IKRObject* object = GetThisObject();
  IKRObjectType* type = object != nullptr ? object->GetType() : nullptr;
  if (type == nullptr)
    return 0;
  const CKRGuid typeID = type->GetID();
  CKRTypeManifest* manifest = document->FindTypeManifest(typeID);
  if (manifest == nullptr && (manifest = document->CreateTypeManifest(typeID, nullptr)) == nullptr)
    return 0;
  if (manifest->TypeHeaderIsWritten() == 0)
    manifest->WriteTypeHeader(type);
  const CKRGuid instanceID = object->GetInstanceID();
  CKRFieldStream* stream = manifest->FindFieldStream(instanceID);
  if (stream == nullptr && (stream = manifest->CreateFieldStream(instanceID, nullptr)) == nullptr)
    return 0;
  IKRFieldStream* view = stream;
  const CKRGuid session = document->GetSerialSessionID();
  // Stored already in this session: duplicates and cycles end here.
  if (view->ObjectHasBeenSerialized(session) != 0)
    return 1;
  OnBeforeSave(document, manifest, view);
  if (view->WriteObjectHeader(object) == 0)
    return 0;
  // Marked before the fields, so that a link back to this object while its
  // fields are written finds it stored; a failure clears the mark, and a
  // later attempt in the session writes the object again.
  view->SetObjectSerialized(session);
  if (SerializeFieldDataTo(view) == 0) {
    view->SetObjectSerialized(CKRGuid());
    return 0;
  }
  OnAfterSave(document);
  return 1;
}

int IKRSerializableAdaptor::SerializeFrom(CKRDocument* document, CKRTypeManifest* manifest, IKRFieldStream* stream) {
  IKRObject* object = GetThisObject();
  if (document == nullptr || object == nullptr)
    return 0;
  if (manifest == nullptr) {
    IKRObjectType* type = object->GetType();
    if (type == nullptr || (manifest = document->FindTypeManifest(type->GetID())) == nullptr)
      return 0;
  }
  if (stream == nullptr && (stream = manifest->FindFieldStream(object->GetInstanceID())) == nullptr)
    return 0;
  const CKRGuid session = document->GetSerialSessionID();
  if (stream->ObjectHasBeenSerialized(session) != 0)
    return 1;
  OnBeforeLoad(document, manifest, stream);
  if (stream->ReadObjectHeader(object) == 0)
    return 0;
  // While the fields are read, a link back to this object resolves to it.
  IKRObject* previous = stream->GetResult();
  stream->SetResult(object);
  stream->SetObjectSerialized(session);
  if (SerializeFieldDataFrom(stream) == 0) {
    stream->SetResult(previous);
    stream->SetObjectSerialized(CKRGuid());
    return 0;
  }
  OnAfterLoad(document);
  return 1;
}

void IKRSerializableAdaptor::SetParentField(IKRFieldData* parent) {
  for (IKRFieldData* data : m_FieldDataList)
    data->SetParentField(parent);
}

void IKRSerializableAdaptor::InitFieldData() {}

CKRString IKRSerializableAdaptor::GetInstanceName() {
  return m_InstanceName;
}

void IKRSerializableAdaptor::SetInstanceName(CKRString name) {
  m_InstanceName = std::move(name);
}

int IKRSerializableAdaptor::OnBeforeLoad(CKRDocument*, CKRTypeManifest*, IKRFieldStream*) {
  return 1;
}

int IKRSerializableAdaptor::OnBeforeSave(CKRDocument*, CKRTypeManifest*, IKRFieldStream*) {
  return 1;
}

void IKRSerializableAdaptor::OnAfterLoad(CKRDocument*) {
  PatchData();
}

void IKRSerializableAdaptor::OnAfterSave(CKRDocument*) {}

int IKRSerializableAdaptor::SerializeFieldDataFrom(IKRFieldStream* stream) {
  // A field that cannot be read keeps its value; the load goes on.
  for (IKRFieldData* data : m_FieldDataList)
    if (IKRField* field = data != nullptr ? data->GetField() : nullptr; field != nullptr && (field->GetFlags() & KRF_READ))
      data->SerializeFrom(stream);
  return 1;
}

int IKRSerializableAdaptor::SerializeFieldDataTo(IKRFieldStream* stream) {
  for (IKRFieldData* data : m_FieldDataList)
    if (IKRField* field = data != nullptr ? data->GetField() : nullptr; field != nullptr && (field->GetFlags() & KRF_WRITE))
      if (data->SerializeTo(stream) == 0)
        return 0;
  return 1;
}

int IKRSerializableAdaptor::OnBeforeFieldChanged(IKRFieldData*, CKRString&) {
  return 1;
}

void IKRSerializableAdaptor::OnAfterFieldChanged(IKRFieldData*, KRF_NOTIFICATION_TYPE, CKRGuid) {}

int IKRSerializableAdaptor::IsFieldReadOnly(IKRFieldData*) {
  return 0;
}

int IKRSerializableAdaptor::IsFieldVisible(IKRFieldData*) {
  return 1;
}

int IKRSerializableAdaptor::IsFieldExpanded(IKRFieldData*) {
  return 1;
}

void IKRSerializableAdaptor::CloneFieldData(IKRSerializableAdaptor* source) {
  if (source == nullptr)
    return;
  for (IKRFieldData* data : m_FieldDataList)
    if (IKRField* field = data->GetField())
      if (IKRFieldData* from = source->GetFieldData(field->GetFieldID()))
        data->SetTo(from);
  for (IKRFieldData* data : m_FieldDataList)
    OnAfterFieldChanged(data, KRF_VALUE_CHANGED, CKRGuid());
}

void IKRSerializableAdaptor::PatchData() {}

int IKRSerializableAdaptor::IsFieldChecked(IKRFieldData*) {
  return 0;
}

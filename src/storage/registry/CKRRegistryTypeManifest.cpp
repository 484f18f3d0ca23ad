#include <krCoreLib/storage/registry/CKRRegistryTypeManifest.h>

#include <krCoreLib/storage/registry/CKRRegistryFieldStream.h>
#include <krCoreLib/storage/registry/CKRRegistrySerializer.h>

KR_IMPLEMENT_OBJECT_TYPE(CKRRegistryTypeManifest, CKRTypeManifest)

int CKRRegistryTypeManifest::WriteTypeHeader(IKRObjectType* type) {
  if (type == nullptr || m_pSerializer == nullptr)
    return 0;
  if (m_pSerializer->OpenStored(GetStoredTypeID().GetCString(), true) == 0 ||
      m_pSerializer->Write(CKRRegistrySerializer::kTypeManifestName, type->GetName()) == 0)
    return 0;
  return CKRTypeManifest::WriteTypeHeader(type);
}

CKRFieldStream* CKRRegistryTypeManifest::CreateFieldStream(CKRGuid instanceID, IKRObjectType* streamType) {
  if (streamType != nullptr)
    return CKRTypeManifest::CreateFieldStream(instanceID, streamType);
  CKRFieldStream* stream =
      CKRTypeManifest::CreateFieldStream(instanceID, CKRRegistryFieldStream::GetCKRRegistryFieldStreamType());
  // Made by the stream type of this store: its class.
  if (stream != nullptr) {
    auto* registryStream = static_cast<CKRRegistryFieldStream*>(stream);
    registryStream->SetSerializer(m_pSerializer);
    registryStream->SetStoredTypeID(GetStoredTypeID());
  }
  return stream;
}

int CKRRegistryTypeManifest::LoadFieldStreams() {
  if (m_pSerializer == nullptr || m_pSerializer->OpenStored(GetStoredTypeID().GetCString(), false) == 0)
    return 1;
  CKRRegistryStringList names;
  m_pSerializer->EnumerateSubKeys(names);
  for (const CKRString& name : names) {
    CKRGuid instanceID;
    if (instanceID.ReadCString(name) && instanceID.IsValid())
      CreateFieldStream(instanceID, nullptr);
  }
  return 1;
}

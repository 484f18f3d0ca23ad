// CKRRegistryTypeManifest: one stored type of a registry serializer, the
// key root \ location \ {type ID}. Its streams are CKRRegistryFieldStreams.
// Holds the serializer without owning it.
#pragma once

#include <krCoreLib/serialization/CKRTypeManifest.h>

class CKRRegistrySerializer;

class KRCORELIB_API CKRRegistryTypeManifest : public CKRTypeManifest {
  KR_DECLARE_OBJECT_TYPE(CKRRegistryTypeManifest, CKRObjectTypeImpl, "{9A07311E-341F-4022-AAFC-F1BBF96EA76A}")

public:
  void SetSerializer(CKRRegistrySerializer* serializer) { m_pSerializer = serializer; }
  CKRRegistrySerializer* GetSerializer() const { return m_pSerializer; }

  // Creates (volatile) or opens the type's key, writes "Type Manifest
  // Name" = the type's name, then marks the header written: 1. 0 for a
  // null type, without a serializer or location, or when the key or value
  // cannot be written.
  int WriteTypeHeader(IKRObjectType* type) override;
  // Without a type, a CKRRegistryFieldStream bound to the serializer and
  // this manifest's type ID; with one, the base's result.
  CKRFieldStream* CreateFieldStream(CKRGuid instanceID, IKRObjectType* streamType) override;
  // Builds a stream for every subkey of the type's key named by a valid
  // GUID: 1; nothing when the key cannot be opened.
  virtual int LoadFieldStreams();

protected:
  CKRRegistryTypeManifest() = default;
  ~CKRRegistryTypeManifest() override = default;

private:
  CKRRegistrySerializer* m_pSerializer = nullptr;
};

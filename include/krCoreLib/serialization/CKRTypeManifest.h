// CKRTypeManifest: one stored type in a document, holding one field stream
// per stored instance of it, keyed by stored instance ID. The manifest owns
// its streams; releasing it (or Close) releases them. Its instance ID is
// the ID of the type it stores (GetStoredTypeID); SetStoredTypeID re-keys
// it. A store derives its own manifest and substitutes its stream type.
#pragma once

#include <krCoreLib/objectmodel/CKRObjGuidPtrMap.h>
#include <krCoreLib/serialization/CKRFieldStream.h>

class IKRObjectType;

class KRCORELIB_API CKRTypeManifest : public CKRObjectImpl {
  KR_DECLARE_OBJECT_TYPE(CKRTypeManifest, CKRObjectTypeImpl, "{D13AE1B6-424A-436C-91C7-982A72F0B631}")

public:
  // Clears the header-written flag.
  int OnInitialize() override;
  // Closes the manifest (its streams are released) and allows the release.
  int OnBeforeRelease() override;

  virtual int Open();
  virtual int Close();
  // 1; a store checks the stored type here.
  virtual int ReadTypeHeader(IKRObjectType* type);
  virtual int TypeHeaderIsWritten();
  // Records that the header is written: 1.
  virtual int WriteTypeHeader(IKRObjectType* type);
  virtual IKRReadOnlyCollection* GetInstanceFieldStreamCollection();
  virtual CKRObjGuidPtrMap<CKRFieldStream>::Iterator GetInstanceFieldStreamIterator();
  // A new stream for `instanceID`, made by `streamType`; null when the type
  // is null, not a field stream type, abstract, or when the instance has a
  // stream already.
  virtual CKRFieldStream* CreateFieldStream(CKRGuid instanceID, IKRObjectType* streamType);
  // 1 when absent; otherwise the stream's Release result.
  virtual int DeleteFieldStream(CKRGuid instanceID);
  virtual int DeleteAllFieldStreams();
  virtual CKRDocument* GetDocument();
  virtual void SetDocument(CKRDocument* document);
  virtual CKRGuid GetStoredTypeID();
  virtual void SetStoredTypeID(CKRGuid typeID);

  // The stream stored for `instanceID`, or null.
  CKRFieldStream* FindFieldStream(CKRGuid instanceID) { return m_FieldStreams.Find(instanceID); }

protected:
  CKRTypeManifest() = default;
  ~CKRTypeManifest() override = default;

private:
  int m_HeaderWritten = 0;
  CKRDocument* m_pDocument = nullptr;
  CKRObjGuidPtrMap<CKRFieldStream> m_FieldStreams;
};

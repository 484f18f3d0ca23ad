// A store for tests and benchmarks: archives, documents, manifests and field
// streams that keep what the framework writes in plain maps (SKRStoredMedium)
// and hand it back on load, with counters and injected failures. Not part of
// the library.
#pragma once

#include <krCoreLib/serialization/CKRArchive.h>

#include <map>
#include <unordered_map>
#include <vector>

struct SKRStoredLink {
  CKRGuid m_TypeID;  // null: an empty link
  CKRGuid m_InstanceID;
};

struct SKRStoredObject {
  CKRGuid m_TypeID;
  int m_HeaderWrites = 0;
  int m_HeaderReads = 0;
  std::map<CKRGuid, CKRString> m_Values;                  // by field ID
  std::map<CKRGuid, std::vector<SKRStoredLink>> m_Links;  // by field ID
  std::vector<CKRGuid> m_WriteOrder;                      // field IDs as written
};

struct SKRStoredDocument {
  std::map<CKRGuid, int> m_TypeHeaders;                    // type ID -> header writes
  std::unordered_map<CKRGuid, SKRStoredObject> m_Objects;  // by instance ID
  std::vector<CKRGuid> m_HeaderOrder;                      // instance IDs as their headers were written
};

struct SKRStoredMedium {
  std::map<CKRGuid, SKRStoredDocument> m_Documents;
  // Keep nothing (a store that only accepts): for benchmarks of the
  // framework alone.
  bool m_KeepNothing = false;
  // Injected failures: refuse to write this field; refuse a second header
  // for an object (a store that cannot hold an object twice).
  CKRGuid m_FailWriteOfField;
  bool m_RefuseSecondHeader = false;
};

class CKRMemoryArchive : public CKRArchive {
  KR_DECLARE_OBJECT_TYPE(CKRMemoryArchive, CKRObjectTypeImpl, "{6D3C0E2A-1111-4B7A-9C1D-00000000A001}")

public:
  void SetMedium(SKRStoredMedium* medium) { m_pMedium = medium; }
  SKRStoredMedium* GetMedium() const { return m_pMedium; }
  // Reading builds a document, manifest and stream for everything stored.
  CKRBOOL Open(AccessMode mode) override;
  CKRDocument* CreateNewDocument(CKRGuid documentID, IKRObjectType* documentType) override;

protected:
  CKRMemoryArchive() = default;

private:
  SKRStoredMedium* m_pMedium = nullptr;
};

class CKRMemoryDocument : public CKRDocument {
  KR_DECLARE_OBJECT_TYPE(CKRMemoryDocument, CKRObjectTypeImpl, "{6D3C0E2A-1111-4B7A-9C1D-00000000A002}")

public:
  CKRTypeManifest* CreateTypeManifest(CKRGuid typeID, IKRObjectType* manifestType) override;
  // The stored form of this document (null without a medium).
  SKRStoredDocument* Stored();
  SKRStoredMedium* m_pMedium = nullptr;

protected:
  CKRMemoryDocument() = default;
};

class CKRMemoryTypeManifest : public CKRTypeManifest {
  KR_DECLARE_OBJECT_TYPE(CKRMemoryTypeManifest, CKRObjectTypeImpl, "{6D3C0E2A-1111-4B7A-9C1D-00000000A003}")

public:
  CKRFieldStream* CreateFieldStream(CKRGuid instanceID, IKRObjectType* streamType) override;
  int WriteTypeHeader(IKRObjectType* type) override;

protected:
  CKRMemoryTypeManifest() = default;
};

class CKRMemoryFieldStream : public CKRFieldStream {
  KR_DECLARE_OBJECT_TYPE(CKRMemoryFieldStream, CKRObjectTypeImpl, "{6D3C0E2A-1111-4B7A-9C1D-00000000A004}")

public:
  void SetDocument(CKRDocument* document) override;
  int WriteObjectHeader(IKRObject* object) override;
  int Write(IKRFieldData* fieldData) override;
  int ReadObjectHeader(IKRObject* object) override;
  int Read(IKRFieldData* fieldData) override;
  IKRObject* ReadLink(IKRFieldData* fieldData) override;
  int ReadLinks(IKRFieldData* fieldData, IKRCollection* collection) override;
  int WriteLink(IKRFieldData* fieldData, IKRObject* object) override;
  int WriteLinks(IKRFieldData* fieldData, IKRIterator* iterator) override;
  // The stored object this stream reads and writes (elements of the medium
  // do not move); found by instance ID on first use when not given.
  void SetStoredObject(SKRStoredObject* stored) { m_pStored = stored; }

protected:
  CKRMemoryFieldStream() = default;

private:
  // The stored object of this stream; null when the store keeps nothing or
  // (reading) when nothing is stored for it.
  SKRStoredObject* Stored(bool create);
  std::vector<SKRStoredLink>* StoredLinks(IKRFieldData* fieldData);

  SKRStoredObject* m_pStored = nullptr;  // found once (elements of the medium do not move)
  CKRMemoryDocument* m_pMemoryDocument = nullptr;
};

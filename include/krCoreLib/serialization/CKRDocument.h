// CKRDocument: a stored document, holding one type manifest per stored type
// (keyed by stored type ID) and running the serial session that keeps each
// object from being written twice. The document owns its manifests;
// releasing it (or Close) releases them. Its instance ID is its document
// ID. A store derives its own document and substitutes its manifest type.
//
// GetObject turns a stored object into exactly one live object: created by
// its own type with its stored instance ID, its fields read, and kept as the
// stream's result, so that every later link to it (also a link back while
// it is being read) resolves to the same object. The loaded objects belong
// to the caller.
#pragma once

#include <krCoreLib/serialization/CKRTypeManifest.h>

#include <cstddef>
#include <vector>

class IKRSerializable;
class IKRSerializableAdaptor;

class KRCORELIB_API CKRDocument : public CKRObjectImpl {
  KR_DECLARE_OBJECT_TYPE(CKRDocument, CKRObjectTypeImpl, "{4F87AD20-AE52-43A7-882C-599156B30828}")

public:
  // Starts the document's first serial session.
  int OnInitialize() override;
  // Closes the document (its manifests are released) and allows the
  // release.
  int OnBeforeRelease() override;

  virtual int Open();
  virtual int Close();
  virtual IKRReadOnlyCollection* GetTypeManifestCollection();
  virtual CKRObjGuidPtrMap<CKRTypeManifest>::Iterator GetTypeManifestIterator();
  // The object stored under `instanceID` with type `typeID`, loaded on the
  // first request; null when the type is unknown to the type system or not
  // storable, when its manifest or stream cannot be made, when the object
  // refuses OnInitialize, or when its header or fields cannot be read (the
  // half-built object is released).
  // Also null, creating nothing, when a link type is required (see
  // RequireLinkType) and the stored type is neither it nor derived from it.
  virtual IKRObject* GetObject(CKRGuid instanceID, CKRGuid typeID);
  // Sets the class that GetObject must yield (the stored type that type or
  // derived from it) and returns the requirement it replaces, for the
  // caller to restore. A link field names its member's class around its
  // ReadLink or ReadLinks, so that a stored object of another class is not
  // created only to be refused. It holds for the caller's GetObject calls
  // until it is restored, not for the objects those link to (it is lifted
  // while an object loads); the null ID requires nothing.
  CKRGuid RequireLinkType(CKRGuid typeID);
  // A new manifest for `typeID`, made by `manifestType` (a fresh instance
  // ID, then re-keyed to `typeID`); null when the type is null, not a
  // manifest type, abstract, or when the type has a manifest already.
  virtual CKRTypeManifest* CreateTypeManifest(CKRGuid typeID, IKRObjectType* manifestType);
  // 1 when absent; otherwise the manifest's Release result.
  virtual int DeleteTypeManifest(CKRGuid typeID);
  // A new session: every object may be written (and read) once more.
  virtual void AdvanceSerialSessionID();
  virtual CKRGuid GetSerialSessionID();
  // Releases every manifest in ascending type-ID order: 1, or 0 when one
  // refused (it stays).
  virtual int DeleteAllTypeManifests();

protected:
  CKRDocument() = default;
  ~CKRDocument() override = default;

  // The manifest for `typeID`, or null.
  CKRTypeManifest* FindTypeManifest(CKRGuid typeID) { return m_TypeManifests.Find(typeID); }

private:
  friend class IKRSerializableAdaptor;

  // Objects linked deeper than this nest no further on the native stack:
  // their saving, and the reading of their fields, waits until the
  // outermost call of the document returns to it. 2,000 levels take a few
  // hundred kilobytes of stack in an optimised build and about 2 MiB with
  // the address sanitizer, well within a default 8 MiB thread stack.
  static constexpr int kMaxNesting = 2000;

  struct SKRPendingLoad {
    IKRSerializable* m_pObject;
    IKRFieldStream* m_pStream;
  };

  // Stores the objects whose saving waited; false when one failed.
  bool SavePending();
  // Reads the fields of the objects that waited.
  void LoadPending();

  CKRGuid m_SerialSessionID;
  CKRGuid m_RequiredLinkType;
  CKRObjGuidPtrMap<CKRTypeManifest> m_TypeManifests;
  int m_SaveNesting = 0;
  int m_LoadNesting = 0;
  std::vector<IKRSerializableAdaptor*> m_PendingSaves;
  std::vector<SKRPendingLoad> m_PendingLoads;
};

// CKRArchive: a storage container that is opened, saved and closed and holds
// documents (keyed by document ID). The archive owns its documents; closing
// or releasing it releases them, and with them their manifests and streams.
// A store derives its own archive: it reads its medium in Open, writes it in
// Save or Close, and substitutes its document type in CreateNewDocument.
//
// The base keeps only the access mode: Save fails with "Archive Not Open in
// Write Mode" unless the archive was opened for writing. The ...WithUI
// operations are where a store asks the user (a file dialog); here they are
// the plain operations.
#pragma once

#include <krCoreLib/serialization/CKRBOOL.h>
#include <krCoreLib/serialization/CKRDocument.h>

class KRCORELIB_API CKRArchive : public CKRObjectImpl {
  KR_DECLARE_OBJECT_TYPE(CKRArchive, CKRObjectTypeImpl, "{5493CC7D-6A62-4A33-B7D1-1DDBD2FB7EA4}")

public:
  // The access mode, tested as bits.
  enum AccessMode { AccessRead = 1, AccessWrite = 2 };

  // Closes the archive (its documents are released) and allows the release.
  int OnBeforeRelease() override;

  virtual CKRBOOL OpenWithUI(AccessMode mode);
  // Stores the mode: true.
  virtual CKRBOOL Open(AccessMode mode);
  virtual CKRBOOL SaveWithUI();
  virtual CKRBOOL Save();
  virtual CKRBOOL CloseWithUI();
  // Releases every document.
  virtual CKRBOOL Close();
  virtual IKRReadOnlyCollection* GetDocumentCollection();
  virtual CKRObjGuidPtrMap<CKRDocument>::Iterator GetDocumentIterator();
  // A new document with ID `documentID`, made by `documentType`; null when
  // the type is null, not a document type, abstract, or when the ID is taken.
  virtual CKRDocument* CreateNewDocument(CKRGuid documentID, IKRObjectType* documentType);
  // True when absent; otherwise the document's Release result.
  virtual CKRBOOL DeleteDocument(CKRGuid documentID);
  // Releases every document in ascending ID order: true, or false when one
  // refused its release (it stays; the others are still released).
  virtual CKRBOOL DeleteAllDocuments();

  int GetAccessMode() const { return m_AccessMode; }

protected:
  CKRArchive() = default;
  ~CKRArchive() override = default;

private:
  int m_AccessMode = 0;
  CKRObjGuidPtrMap<CKRDocument> m_Documents;
};

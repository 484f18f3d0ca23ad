// CKRXMLFileArchive: an archive stored in one XML file (root element
// "KRXML"; below it one element per document, stored type, stored object
// and field, each named by the element form of its GUID, with field values
// in attribute "V" and links in "T" and "I"; see CKRXMLFileFieldStream).
//
// The whole archive is one XML tree in memory while the archive is open:
// Open(AccessRead) reads the file completely and builds a document, type
// manifest and field stream for every element that is named by a valid GUID
// (other elements and text are skipped); objects are made only when the
// caller asks a document for them (GetObject). Open(AccessWrite) starts an
// empty tree that documents, manifests and streams fill as objects are
// stored; Close writes it to the file. Save only confirms write access.
//
// Writing replaces the file whole or not at all: the tree goes to a
// temporary file in the same folder, which is synced and renamed over the
// file, so a failed or interrupted save leaves an existing archive as it
// was; Close then reports false with a message.
//
// Reading is written for hostile files: the file is read only when it is a
// regular file of at most kMaxFileSize bytes; external entities and DTDs
// are never fetched or read; entity expansion is bounded; malformed,
// truncated or empty files make Open report false (documents found in the
// part that was read stay in the archive).
//
// Open and Close pair up (each Open starts the XML library, its Close ends
// it); an archive that is open refuses a second Open, also after an Open
// that reported false, until it is closed. The XML library is
// an implementation detail: nothing of it appears in this header. Used by
// one thread at a time.
#pragma once

#include <krCoreLib/serialization/CKRArchive.h>

#include <cstdint>

class CKRXMLFileDocument;
class CKRXMLFileTypeManifest;
class CKRXMLFileFieldStream;
// The archive's XML tree (private to the store).
struct SKRXMLFileTree;

class KRCORELIB_API CKRXMLFileArchive : public CKRArchive {
  KR_DECLARE_OBJECT_TYPE(CKRXMLFileArchive, CKRObjectTypeImpl, "{EC130930-944F-4394-B58A-D252EB277FFD}")

public:
  // Files larger than this (1 GiB) are refused by Open(AccessRead): their
  // tree would not fit the memory of the machines the library runs on.
  static constexpr std::uint64_t kMaxFileSize = std::uint64_t(1) << 30;

  // Forgets the tree.
  int OnInitialize() override;

  // Sets the file name ("/" separated; UTF-8 on the file system): 1.
  virtual int SetFile(const CKRString& name);
  const CKRString& GetFile() const { return m_FileName; }

  // Mode AccessRead reads the file, AccessWrite starts an empty tree; any
  // other mode, an archive that is already open, or a failure to start the
  // XML library gives false.
  CKRBOOL Open(AccessMode mode) override;
  // With a file name set, Open; otherwise asks the file chooser (an open
  // dialog "Open Archive") and opens the chosen file; false, with nothing
  // opened, when the chooser cancels.
  CKRBOOL OpenWithUI(AccessMode mode) override;
  // In write mode writes the tree to the file; then releases the documents
  // and the tree and ends the use of the XML library. False, with the
  // message "Archive File Not Written", when the file could not be written
  // (the old file, if any, is unchanged); the archive is closed either way.
  // Closing a closed archive does nothing and gives true.
  CKRBOOL Close() override;
  // With a file name set, Close; otherwise asks the file chooser (a save
  // dialog "Save Archive") and closes into the chosen file; false, with the
  // archive still open, when the chooser cancels.
  CKRBOOL CloseWithUI() override;
  // A CKRXMLFileDocument (the given type is ignored) with ID `documentID`;
  // null while no tree is held or when the ID is taken.
  CKRDocument* CreateNewDocument(CKRGuid documentID, IKRObjectType* documentType) override;

protected:
  CKRXMLFileArchive() = default;
  ~CKRXMLFileArchive() override;

  // The steps of Open and Close: 1 on success, 0 on failure.
  virtual int LoadDOMFromFile();
  virtual int WriteDOMToFile();
  virtual int CreateDOM();

private:
  friend class CKRXMLFileDocument;
  friend class CKRXMLFileTypeManifest;
  friend class CKRXMLFileFieldStream;

  // Releases the tree, if any.
  void ReleaseTree();
  // Ends this archive's use of the XML library, if it started it.
  void EndLibraryUse();
  // Asks the file chooser for a file name when none is set; false when
  // the user cancels (the name stays empty).
  bool ChooseFileName(bool forSaving, const wchar_t* title);

  CKRString m_FileName;
  SKRXMLFileTree* m_pTree = nullptr;  // owned; null while closed
  bool m_LibraryStarted = false;
};

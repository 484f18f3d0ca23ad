#include <krCoreLib/storage/xml/CKRXMLFileArchive.h>

#include <krCoreLib/platform/KRFileChooser.h>
#include <krCoreLib/storage/xml/CKRXMLFileDocument.h>

#include "KRXMLFileTree.h"
#include "SKRFiles.h"

#include <xercesc/dom/DOMError.hpp>
#include <xercesc/dom/DOMErrorHandler.hpp>
#include <xercesc/dom/DOMImplementation.hpp>
#include <xercesc/dom/DOMImplementationLS.hpp>
#include <xercesc/dom/DOMImplementationRegistry.hpp>
#include <xercesc/dom/DOMLSOutput.hpp>
#include <xercesc/dom/DOMLSSerializer.hpp>
#include <xercesc/sax/InputSource.hpp>
#include <xercesc/util/BinInputStream.hpp>
#include <xercesc/parsers/XercesDOMParser.hpp>
#include <xercesc/framework/XMLFormatter.hpp>
#include <xercesc/sax/ErrorHandler.hpp>
#include <xercesc/sax/SAXParseException.hpp>
#include <xercesc/util/OutOfMemoryException.hpp>
#include <xercesc/util/PlatformUtils.hpp>
#include <xercesc/util/SecurityManager.hpp>
#include <xercesc/util/XMLEntityResolver.hpp>
#include <xercesc/util/XMLException.hpp>
#include <xercesc/util/XMLUni.hpp>

#include <algorithm>
#include <cstdio>
#include <cstring>
#include <memory>
#include <new>
#include <string>
#include <vector>

XERCES_CPP_NAMESPACE_USE

KR_IMPLEMENT_OBJECT_TYPE(CKRXMLFileArchive, CKRArchive)

namespace {

// The file dialog texts.
constexpr const wchar_t* kFilter = L"All Files (*.*)|*.*||";
constexpr const wchar_t* kNotWritten = L"Archive File Not Written";

const XMLCh kLS[] = {u'L', u'S', 0};
const XMLCh kRootName[] = {u'K', u'R', u'X', u'M', u'L', 0};

// A parser that refuses documents with a document type declaration (the
// store's files never have one, and a declaration is what brings entity
// expansion, external subsets and content models into a hostile file) and
// counts fatal errors. The refusal is noted and the file then fails as a
// whole: aborting the scanner from inside the declaration would leak what
// it holds at that moment.
class CKRArchiveParser : public XercesDOMParser, private ErrorHandler, private XMLEntityResolver {
public:
  CKRArchiveParser() {
    setValidationScheme(Val_Auto);
    setDoNamespaces(false);
    setDoSchema(false);
    setValidationSchemaFullChecking(false);
    // Defence in depth should a declaration ever get through: external
    // entities are never fetched or read, the expansion of
    // entities is bounded (the XML library's own default limit), and the
    // expansion appears as plain text.
    setLoadExternalDTD(false);
    setDisableDefaultEntityResolution(true);
    setXMLEntityResolver(this);
    setSecurityManager(&m_Security);
    setCreateEntityReferenceNodes(false);
    setCreateCommentNodes(false);
    setErrorHandler(this);
  }
  bool Failed() const { return m_FatalErrors > 0 || m_HasDoctype; }

  // Text, processing instructions and comments carry nothing of the
  // store (its values are attributes) and are skipped while reading, so
  // the tree holds elements and attributes only. The pretty printer's
  // line breaks and indentation would otherwise be a text node beside
  // every element: about a third of the tree's memory and of the time
  // to build it.
  void docCharacters(const XMLCh* const, const XMLSize_t, const bool) override {}
  void ignorableWhitespace(const XMLCh* const, const XMLSize_t, const bool) override {}
  void docPI(const XMLCh* const, const XMLCh* const) override {}
  bool HasDoctype() const { return m_HasDoctype; }

  // Every element name passes through the tree's name table; it grows
  // with the tree (see KRNoteNewName).
  void startElement(const XMLElementDecl& declaration, const unsigned int urlId, const XMLCh* const prefix,
                    const RefVectorOf<XMLAttr>& attributes, const XMLSize_t count, const bool isEmpty,
                    const bool isRoot) override {
    KRNoteNewName(getDocument(), m_Names);
    XercesDOMParser::startElement(declaration, urlId, prefix, attributes, count, isEmpty, isRoot);
  }

  void doctypeDecl(const DTDElementDecl& root, const XMLCh* const publicID, const XMLCh* const systemID,
                   const bool internalSubset, const bool externalSubset) override {
    m_HasDoctype = true;
    XercesDOMParser::doctypeDecl(root, publicID, systemID, internalSubset, externalSubset);
  }

private:
  void warning(const SAXParseException&) override {}
  // Validity errors (only with a grammar, which is refused) do not make
  // the file unreadable.
  void error(const SAXParseException&) override {}
  void fatalError(const SAXParseException&) override { ++m_FatalErrors; }
  void resetErrors() override { m_FatalErrors = 0; }
  // No source for any external entity or subset: with default resolution
  // disabled the library then reads nothing. (An empty source instead
  // makes the library lose its record of the declaration when it
  // validates against an external subset.)
  InputSource* resolveEntity(XMLResourceIdentifier*) override { return nullptr; }

  SecurityManager m_Security;
  int m_FatalErrors = 0;
  bool m_HasDoctype = false;
  std::size_t m_Names = 0;
};

// The writer's error handler: the writer always continues, and an error
// makes the save fail (the file would not read back as written).
class CKRWriteErrors : public DOMErrorHandler {
public:
  bool handleError(const DOMError& error) override {
    if (error.getSeverity() != DOMError::DOM_SEVERITY_WARNING)
      m_Failed = true;
    return true;
  }
  bool m_Failed = false;
};

// The writer's output: the replacement file, through a buffer of 64 KiB
// (a few large writes instead of many small ones).
class CKRReplacementTarget : public XMLFormatTarget {
public:
  explicit CKRReplacementTarget(SKRReplacementFile& file) : m_File(file) { m_Buffer.reserve(kBufferSize); }
  void writeChars(const XMLByte* const bytes, const XMLSize_t count, XMLFormatter* const) override {
    if (m_Buffer.size() + count > kBufferSize)
      flush();
    if (count >= kBufferSize)
      m_File.Write(bytes, count);
    else
      m_Buffer.insert(m_Buffer.end(), bytes, bytes + count);
  }
  void flush() override {
    if (!m_Buffer.empty())
      m_File.Write(m_Buffer.data(), m_Buffer.size());
    m_Buffer.clear();
  }

private:
  static constexpr std::size_t kBufferSize = 64 * 1024;
  SKRReplacementFile& m_File;
  std::vector<XMLByte> m_Buffer;
};

// The archive file as the parser's input, read in the parser's own chunks
// rather than whole: the file's bytes never sit in memory beside the tree
// being built from them. A read error, or more than `limit` bytes, ends
// the input early and is remembered: the file then fails as a whole.
class CKRArchiveFileStream : public BinInputStream {
public:
  CKRArchiveFileStream(std::FILE* file, std::uint64_t limit, bool& failed)
      : m_pFile(file), m_Limit(limit), m_Failed(failed) {}
  ~CKRArchiveFileStream() override {
    // A close that fails after the bytes were read changes nothing read.
    std::fclose(m_pFile);
  }
  XMLFilePos curPos() const override { return m_Position; }
  XMLSize_t readBytes(XMLByte* const bytes, const XMLSize_t maxToRead) override {
    if (m_Failed || m_Position >= m_Limit)
      return Stop(m_Position >= m_Limit && std::fgetc(m_pFile) != EOF);
    const XMLSize_t wanted = XMLSize_t(std::min<std::uint64_t>(maxToRead, m_Limit - m_Position));
    const std::size_t read = std::fread(bytes, 1, wanted, m_pFile);
    m_Position += read;
    if (read < wanted && std::ferror(m_pFile))
      return Stop(true);
    return read;
  }
  const XMLCh* getContentType() const override { return nullptr; }

private:
  XMLSize_t Stop(bool failure) {
    m_Failed = m_Failed || failure;
    return 0;
  }

  std::FILE* m_pFile;
  std::uint64_t m_Limit;
  std::uint64_t m_Position = 0;
  bool& m_Failed;
};

class CKRArchiveFileSource : public InputSource {
public:
  CKRArchiveFileSource(std::FILE* file, std::uint64_t limit, bool& failed)
      : InputSource("archive"), m_pFile(file), m_Limit(limit), m_Failed(failed) {}
  ~CKRArchiveFileSource() override {
    if (m_pFile != nullptr)
      std::fclose(m_pFile);
  }
  // The parser asks once; the stream then owns the file.
  BinInputStream* makeStream() const override {
    std::FILE* file = m_pFile;
    m_pFile = nullptr;
    if (file == nullptr)
      return nullptr;
    return new CKRArchiveFileStream(file, m_Limit, m_Failed);
  }

private:
  mutable std::FILE* m_pFile;
  std::uint64_t m_Limit;
  bool& m_Failed;
};

// The file name as the file system's path: UTF-8, not empty, free of NULs.
bool NativePath(const CKRString& name, std::string& path) {
  if (name.IsEmpty() || name.str().find(L'\0') != std::wstring::npos)
    return false;
  path = name.ToUtf8();
  return true;
}

DOMImplementation* LSImplementation() {
  return DOMImplementationRegistry::getDOMImplementation(kLS);
}

}  // namespace

SKRXMLFileTree::~SKRXMLFileTree() {
  if (m_pDocument != nullptr)
    m_pDocument->release();
}

CKRXMLFileArchive::~CKRXMLFileArchive() {
  ReleaseTree();
  EndLibraryUse();
}

int CKRXMLFileArchive::OnInitialize() {
  if (CKRArchive::OnInitialize() == 0)
    return 0;
  m_pTree = nullptr;
  m_LibraryStarted = false;
  return 1;
}

int CKRXMLFileArchive::SetFile(const CKRString& name) {
  m_FileName = name;
  return 1;
}

CKRBOOL CKRXMLFileArchive::Open(AccessMode mode) {
  if (m_LibraryStarted || m_pTree != nullptr)
    return false;
  CKRArchive::Open(mode);
  try {
    XMLPlatformUtils::Initialize();
    m_LibraryStarted = true;
  } catch (...) {
    return false;
  }
  switch (mode) {
    case AccessRead:
      return LoadDOMFromFile() != 0;
    case AccessWrite:
      return CreateDOM() != 0;
    default:
      return false;
  }
}

bool CKRXMLFileArchive::ChooseFileName(bool forSaving, const wchar_t* title) {
  if (!m_FileName.IsEmpty())
    return true;
  SKRFileChooserRequest request;
  request.m_ForSaving = forSaving;
  request.m_Title = title;
  request.m_Filter = kFilter;
  std::wstring path;
  if (!SKRFileChooser::Choose(request, path))
    return false;
  m_FileName = CKRString(std::move(path));
  return true;
}

CKRBOOL CKRXMLFileArchive::OpenWithUI(AccessMode mode) {
  if (!ChooseFileName(false, L"Open Archive"))
    return false;
  return Open(mode);
}

CKRBOOL CKRXMLFileArchive::Close() {
  bool written = true;
  if (m_pTree != nullptr && GetAccessMode() == AccessWrite)
    written = WriteDOMToFile() != 0;
  const CKRBOOL closed = CKRArchive::Close();
  ReleaseTree();
  EndLibraryUse();
  if (!written)
    return CKRBOOL(false, kNotWritten);
  return closed;
}

CKRBOOL CKRXMLFileArchive::CloseWithUI() {
  if (!ChooseFileName(true, L"Save Archive"))
    return false;
  return Close();
}

CKRDocument* CKRXMLFileArchive::CreateNewDocument(CKRGuid documentID, IKRObjectType*) {
  if (m_pTree == nullptr || m_pTree->m_pDocument == nullptr)
    return nullptr;
  CKRDocument* document = CKRArchive::CreateNewDocument(documentID, CKRXMLFileDocument::GetCKRXMLFileDocumentType());
  if (auto* xml = dynamic_cast<CKRXMLFileDocument*>(document))
    xml->SetArchive(this);
  return document;
}

void CKRXMLFileArchive::ReleaseTree() {
  delete m_pTree;
  m_pTree = nullptr;
}

void CKRXMLFileArchive::EndLibraryUse() {
  if (!m_LibraryStarted)
    return;
  m_LibraryStarted = false;
  XMLPlatformUtils::Terminate();
}

int CKRXMLFileArchive::CreateDOM() {
  DOMImplementation* implementation = LSImplementation();
  if (implementation == nullptr)
    return 0;
  try {
    auto tree = std::make_unique<SKRXMLFileTree>();
    tree->m_pDocument = implementation->createDocument(nullptr, kRootName, nullptr);
    if (tree->m_pDocument == nullptr)
      return 0;
    ReleaseTree();
    m_pTree = tree.release();
    return 1;
  } catch (...) {
    return 0;
  }
}

int CKRXMLFileArchive::WriteDOMToFile() {
  if (m_pTree == nullptr || m_pTree->m_pDocument == nullptr)
    return 0;
  std::string path;
  if (!NativePath(m_FileName, path))
    return 0;
  DOMImplementation* implementation = LSImplementation();
  if (implementation == nullptr)
    return 0;
  SKRReplacementFile file;
  if (!file.Begin(path.c_str()))
    return 0;
  bool written = false;
  try {
    CKRWriteErrors errors;
    CKRReplacementTarget target(file);
    // Released also when the writer throws (a character the encoding
    // cannot hold ends the write with an exception).
    auto release = [](auto* object) {
      if (object != nullptr)
        object->release();
    };
    std::unique_ptr<DOMLSSerializer, decltype(release)> serializer(
        static_cast<DOMImplementationLS*>(implementation)->createLSSerializer(), release);
    std::unique_ptr<DOMLSOutput, decltype(release)> output(
        static_cast<DOMImplementationLS*>(implementation)->createLSOutput(), release);
    DOMConfiguration* configuration = serializer->getDomConfig();
    configuration->setParameter(XMLUni::fgDOMErrorHandler, static_cast<DOMErrorHandler*>(&errors));
    if (configuration->canSetParameter(XMLUni::fgDOMWRTFormatPrettyPrint, true))
      configuration->setParameter(XMLUni::fgDOMWRTFormatPrettyPrint, true);
    output->setByteStream(&target);
    // The writer's own result is consulted too: a failure it reports is a
    // file that does not hold the tree.
    written = serializer->write(m_pTree->m_pDocument, output.get()) && !errors.m_Failed;
    target.flush();
  } catch (...) {
    written = false;
  }
  return written && file.Commit() ? 1 : 0;
}

int CKRXMLFileArchive::LoadDOMFromFile() {
  ReleaseTree();
  std::string path;
  // Only a regular file is read (a directory, a pipe or a device is not),
  // and only up to kMaxFileSize, checked on what was opened.
  if (!NativePath(m_FileName, path))
    return 0;
  std::FILE* file = SKRFiles::OpenRegularFileForReading(path.c_str(), kMaxFileSize);
  if (file == nullptr)
    return 0;
  bool failed = false;
  bool inputFailed = false;
  auto tree = std::make_unique<SKRXMLFileTree>();
  try {
    CKRArchiveFileSource source(file, kMaxFileSize, inputFailed);
    auto parser = std::make_unique<CKRArchiveParser>();
    try {
      parser->parse(source);
    } catch (...) {
      failed = true;
    }
    failed = failed || inputFailed || parser->Failed();
    // A refused declaration: nothing of the file is used.
    if (parser->HasDoctype())
      return 0;
    // The tree is the archive's from here on; the parser goes now, before
    // objects are loaded from the tree (the scanner keeps a record of
    // every element name it met: a sixth of the tree's size for a store
    // that names each object by its GUID).
    tree->m_pDocument = parser->adoptDocument();
  } catch (...) {
    return 0;
  }
  // Nothing usable was read: no root element.
  DOMElement* root = tree->m_pDocument != nullptr ? tree->m_pDocument->getDocumentElement() : nullptr;
  if (root == nullptr)
    return 0;
  m_pTree = tree.release();
  try {
    KRForEachGuidChild(root, [&](const CKRGuid& id, DOMElement* element) {
      if (auto* document = dynamic_cast<CKRXMLFileDocument*>(CreateNewDocument(id, nullptr)))
        document->LoadTypeManifests(KRFromDOM(element));
    });
  } catch (...) {
    failed = true;
  }
  return failed ? 0 : 1;
}

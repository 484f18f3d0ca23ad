// Helpers of the XML store's tests: saving and loading
// test records through an XML file archive, and an independent reader of
// the written files (plain string scanning, no XML library) for checks of
// the format byte by byte.
#pragma once

#include <krCoreLib/objectmodel/CKRTypeSystem.h>
#include <krCoreLib/storage/xml/CKRXMLFileArchive.h>
#include <krCoreLib/storage/xml/CKRXMLFileDocument.h>

#include "KRScratchFolder.h"
#include "KRSerialTestObjects.h"

#include <gtest/gtest.h>

#include <cstdlib>
#include <filesystem>
#include <fstream>
#include <iterator>
#include <set>
#include <sstream>
#include <string>
#include <utility>
#include <vector>

inline constexpr CKRGuid kXMLTestRepository = CKRGuid::Literal("{5D000000-0000-4000-8000-0000000000E1}");
inline constexpr CKRGuid kXMLTestDocument = CKRGuid::Literal("{5D000000-0000-4000-8000-0000000000E2}");

inline std::string KRReadBytes(const std::string& path) {
  std::ifstream in(path, std::ios::binary);
  return std::string(std::istreambuf_iterator<char>(in), {});
}
inline void KRWriteBytes(const std::string& path, const std::string& bytes) {
  std::ofstream(path, std::ios::binary) << bytes;
}
// The names of the folder's entries.
inline std::vector<std::string> KRFolderEntries(const std::string& folder) {
  std::vector<std::string> names;
  for (const auto& entry : std::filesystem::directory_iterator(folder))
    names.push_back(entry.path().filename().string());
  return names;
}

inline CKRXMLFileArchive* KRNewXMLArchive(const std::string& path) {
  auto* archive =
      static_cast<CKRXMLFileArchive*>(CKRXMLFileArchive::GetCKRXMLFileArchiveType()->CreateInstance(CKRGuid()));
  archive->SetFile(CKRString::FromUtf8(path));
  return archive;
}

// Saves the roots into one document of a new file; Close's result (false
// also when a root does not save).
inline bool KRSaveXML(const std::string& path, const std::vector<CKRSerialObject*>& roots,
                      CKRGuid documentID = kXMLTestDocument) {
  CKRXMLFileArchive* archive = KRNewXMLArchive(path);
  bool ok = archive->Open(CKRArchive::AccessWrite);
  CKRDocument* document = ok ? archive->CreateNewDocument(documentID, nullptr) : nullptr;
  ok = ok && document != nullptr;
  for (CKRSerialObject* root : roots)
    ok = ok && root->SerializeTo(document) != 0;
  ok = bool(archive->Close()) && ok;
  archive->Release();
  return ok;
}

// An archive opened for reading (the caller closes and releases it) and
// its result.
struct SKRXMLLoad {
  CKRXMLFileArchive* m_pArchive = nullptr;
  bool m_Opened = false;
  CKRDocument* Document(CKRGuid id = kXMLTestDocument) const {
    return static_cast<CKRDocument*>(m_pArchive->GetDocumentCollection()->Find(id));
  }
  void Release() {
    if (m_pArchive != nullptr)
      m_pArchive->Release();
    m_pArchive = nullptr;
  }
};
inline SKRXMLLoad KRLoadXML(const std::string& path) {
  SKRXMLLoad load;
  load.m_pArchive = KRNewXMLArchive(path);
  load.m_Opened = load.m_pArchive->Open(CKRArchive::AccessRead);
  return load;
}

// Asks the documents for every stored object, then releases the archive
// and everything that loaded (also through links): what a host does with a
// file it knows nothing about.
inline void KRLoadEverything(SKRXMLLoad& load) {
  std::set<IKRObject*> loaded;
  for (const bool collect : {false, true}) {
    auto documents = load.m_pArchive->GetDocumentIterator();
    for (CKRDocument* each = documents.Next(1); each != nullptr; each = documents.Next(0)) {
      auto manifests = each->GetTypeManifestIterator();
      for (CKRTypeManifest* manifest = manifests.Next(1); manifest != nullptr; manifest = manifests.Next(0)) {
        auto streams = manifest->GetInstanceFieldStreamIterator();
        for (CKRFieldStream* stream = streams.Next(1); stream != nullptr; stream = streams.Next(0)) {
          if (!collect)
            each->GetObject(stream->GetStoredInstanceID(), manifest->GetStoredTypeID());
          else if (stream->GetResult() != nullptr)
            loaded.insert(stream->GetResult());
        }
      }
    }
  }
  load.Release();
  for (IKRObject* object : loaded)
    object->Release();
}

// The independent reading: an element with its attributes (in file order)
// and element children; text between elements must be whitespace.
struct SKRTestElement {
  std::string m_Name;
  std::vector<std::pair<std::string, std::string>> m_Attributes;
  std::vector<SKRTestElement> m_Children;
  const std::string* Attribute(const std::string& name) const {
    for (const auto& [key, value] : m_Attributes)
      if (key == name)
        return &value;
    return nullptr;
  }
};

class CKRTestXMLReader {
public:
  // The root element of the text after its XML declaration; fails the test
  // on anything this simple grammar does not expect.
  static SKRTestElement Read(const std::string& text) {
    CKRTestXMLReader reader(text);
    reader.SkipSpace();
    if (text.compare(reader.m_At, 5, "<?xml") == 0)
      reader.m_At = text.find("?>", reader.m_At) + 2;
    reader.SkipSpace();
    SKRTestElement root = reader.Element();
    reader.SkipSpace();
    EXPECT_EQ(reader.m_At, text.size()) << "text after the root element";
    return root;
  }

private:
  explicit CKRTestXMLReader(const std::string& text) : m_Text(text) {}

  void SkipSpace() {
    while (m_At < m_Text.size() && std::isspace(static_cast<unsigned char>(m_Text[m_At])))
      ++m_At;
  }
  std::string Name() {
    const std::size_t start = m_At;
    while (m_At < m_Text.size() && (std::isalnum(static_cast<unsigned char>(m_Text[m_At])) || m_Text[m_At] == '_' ||
                                    m_Text[m_At] == '-'))
      ++m_At;
    return m_Text.substr(start, m_At - start);
  }
  std::string Value(std::string raw) {
    std::string out;
    for (std::size_t i = 0; i < raw.size(); ++i) {
      if (raw[i] != '&') {
        out += raw[i];
        continue;
      }
      const std::size_t end = raw.find(';', i);
      const std::string entity = raw.substr(i + 1, end - i - 1);
      i = end;
      if (entity == "lt") out += '<';
      else if (entity == "gt") out += '>';
      else if (entity == "amp") out += '&';
      else if (entity == "quot") out += '"';
      else if (entity == "apos") out += '\'';
      else if (entity.size() > 1 && entity[0] == '#') {
        const unsigned long code = entity[1] == 'x' ? std::strtoul(entity.c_str() + 2, nullptr, 16)
                                                    : std::strtoul(entity.c_str() + 1, nullptr, 10);
        EXPECT_LT(code, 0x80u) << "only ASCII is written as a reference here";
        out += char(code);
      } else
        ADD_FAILURE() << "unknown entity " << entity;
    }
    return out;
  }
  SKRTestElement Element() {
    SKRTestElement element;
    EXPECT_EQ(m_Text[m_At], '<');
    ++m_At;
    element.m_Name = Name();
    for (;;) {
      SkipSpace();
      if (m_Text.compare(m_At, 2, "/>") == 0) {
        m_At += 2;
        return element;
      }
      if (m_Text[m_At] == '>') {
        ++m_At;
        break;
      }
      std::string key = Name();
      EXPECT_EQ(m_Text[m_At], '=');
      const char quote = m_Text[m_At + 1];
      EXPECT_TRUE(quote == '"' || quote == '\'');
      const std::size_t end = m_Text.find(quote, m_At + 2);
      element.m_Attributes.emplace_back(key, Value(m_Text.substr(m_At + 2, end - m_At - 2)));
      m_At = end + 1;
      if (key.empty() || end == std::string::npos) {
        ADD_FAILURE() << "attribute syntax";
        m_At = m_Text.size();
        return element;
      }
    }
    for (;;) {
      SkipSpace();
      if (m_At >= m_Text.size()) {
        ADD_FAILURE() << "unterminated element " << element.m_Name;
        return element;
      }
      if (m_Text.compare(m_At, 2, "</") == 0) {
        m_At += 2;
        EXPECT_EQ(Name(), element.m_Name);
        EXPECT_EQ(m_Text[m_At], '>');
        ++m_At;
        return element;
      }
      if (m_Text[m_At] != '<') {
        ADD_FAILURE() << "text inside " << element.m_Name;
        m_At = m_Text.size();
        return element;
      }
      element.m_Children.push_back(Element());
    }
  }

  const std::string& m_Text;
  std::size_t m_At = 0;
};

// The element form of a GUID as the file holds it (ASCII).
inline std::string KRElementForm(const CKRGuid& id) {
  return id.GetCStringXMLElement().ToUtf8();
}
inline std::string KRXML64(const CKRGuid& id) {
  return id.GetCStringXML64().ToUtf8();
}

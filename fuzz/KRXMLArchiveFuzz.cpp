// Fuzz target: arbitrary bytes as an XML archive file, opened for reading,
// and every stored object asked for (and every link followed) through the
// documents' GetObject. Everything loaded is released again, so the leak
// checker sees what the store leaves behind.
//
// With KR_FUZZ_WRITE_SEEDS=<folder> in the environment, the target first
// writes a few valid archives into the folder (a start for the corpus).
#include <krCoreLib/objectmodel/CKRTypeSystem.h>
#include <krCoreLib/storage/xml/CKRXMLFileArchive.h>

#include "KRSerialTestObjects.h"

#include <xercesc/util/PlatformUtils.hpp>

#include <cstdint>
#include <cstdio>
#include <cstdlib>
#include <set>
#include <string>
#include <unistd.h>

namespace {

constexpr CKRGuid kRepository = CKRGuid::Literal("{5D000000-0000-4000-8000-0000000000F1}");

CKRXMLFileArchive* NewArchive(const std::string& path) {
  auto* archive =
      static_cast<CKRXMLFileArchive*>(CKRXMLFileArchive::GetCKRXMLFileArchiveType()->CreateInstance(CKRGuid()));
  archive->SetFile(CKRString::FromUtf8(path));
  return archive;
}

void WriteSeeds(const char* folder) {
  CKRTestRecord* a = NewRecord(L"a <&> \"b\"");
  CKRTestRecord* b = NewRecord(L"b");
  CKRTestRecord* c = NewRecord(L"c\U0001F600");
  a->m_Count = 42;
  a->m_Ref = CKRGuid::CreateNewGUID();
  a->m_pNext = b;
  b->m_pNext = a;
  a->m_Children.Add(b);
  a->m_Children.Add(c);
  auto* leaf = static_cast<CKRTestLeaf*>(CKRTestLeaf::GetCKRTestLeafType()->CreateInstance(CKRGuid()));
  leaf->m_Base = L"base";
  leaf->m_Leaf = L"leaf";
  int n = 0;
  for (CKRSerialObject* root : std::initializer_list<CKRSerialObject*>{a, c, leaf}) {
    CKRXMLFileArchive* archive = NewArchive(std::string(folder) + "/seed" + std::to_string(n++) + ".xml");
    archive->Open(CKRArchive::AccessWrite);
    root->SerializeTo(archive->CreateNewDocument(CKRGuid::CreateNewGUID(), nullptr));
    archive->Close();
    archive->Release();
  }
  for (IKRObject* object : std::initializer_list<IKRObject*>{a, b, c, leaf})
    object->Release();
}

std::string& ScratchFile() {
  static std::string s_Path = [] {
    char pattern[] = "/tmp/krxmlfuzz-XXXXXX";
    const int fd = ::mkstemp(pattern);
    if (fd >= 0)
      ::close(fd);
    return std::string(pattern);
  }();
  return s_Path;
}

}  // namespace

extern "C" int LLVMFuzzerInitialize(int*, char***) {
  CKRTypeSystem::Initialize(kRepository);
  // Keeps the XML library started for the whole run: each archive's Open
  // and Close then only count, instead of setting the library up and
  // tearing it down for every input (a tenfold speed-up of the run).
  xercesc::XMLPlatformUtils::Initialize();
  if (const char* folder = std::getenv("KR_FUZZ_WRITE_SEEDS"))
    WriteSeeds(folder);
  std::atexit([] { ::unlink(ScratchFile().c_str()); });
  return 0;
}

extern "C" int LLVMFuzzerTestOneInput(const std::uint8_t* data, std::size_t size) {
  const std::string& path = ScratchFile();
  if (std::FILE* file = std::fopen(path.c_str(), "wb")) {
    std::fwrite(data, 1, size, file);
    std::fclose(file);
  }
  CKRXMLFileArchive* archive = NewArchive(path);
  archive->Open(CKRArchive::AccessRead);
  // Ask for every stored object; then collect everything that was loaded,
  // also through links to objects of other manifests.
  std::set<IKRObject*> loaded;
  auto documents = archive->GetDocumentIterator();
  for (CKRDocument* document = documents.Next(1); document != nullptr; document = documents.Next(0)) {
    auto manifests = document->GetTypeManifestIterator();
    for (CKRTypeManifest* manifest = manifests.Next(1); manifest != nullptr; manifest = manifests.Next(0)) {
      auto streams = manifest->GetInstanceFieldStreamIterator();
      for (CKRFieldStream* stream = streams.Next(1); stream != nullptr; stream = streams.Next(0))
        document->GetObject(stream->GetStoredInstanceID(), manifest->GetStoredTypeID());
    }
    manifests = document->GetTypeManifestIterator();
    for (CKRTypeManifest* manifest = manifests.Next(1); manifest != nullptr; manifest = manifests.Next(0)) {
      auto streams = manifest->GetInstanceFieldStreamIterator();
      for (CKRFieldStream* stream = streams.Next(1); stream != nullptr; stream = streams.Next(0))
        if (IKRObject* object = stream->GetResult())
          loaded.insert(object);
    }
  }
  archive->Close();
  archive->Release();
  for (IKRObject* object : loaded)
    object->Release();
  return 0;
}

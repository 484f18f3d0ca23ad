// Registry storage: a preferences object stored as registry keys and values
// with the registry serializer, read back through a second document, and
// the stored subtree exported as REGEDIT4 text and printed.
//
// The demo keeps out of the user's own registry store: when KR_REGISTRY_DIR
// is not set it points it at a scratch folder of its own for the section's
// duration, and it removes everything it made.
#include "KRDemo.h"

#include <krCoreLib/framework/CKRPreferences.h>
#include <krCoreLib/system/CKRRegistry.h>

#include <cstdlib>
#include <filesystem>
#include <fstream>
#include <iterator>
#include <string>

namespace {

constexpr const wchar_t* kDemoKey = L"Software\\krCoreLib Demo";
constexpr const wchar_t* kLocation = L"Software\\krCoreLib Demo\\Preferences";

template <typename T>
T* New(IKRObjectType* type) {
  return static_cast<T*>(type->CreateInstance(CKRGuid()));
}

CKRRegistrySerializer* NewSerializer() {
  auto* serializer = New<CKRRegistrySerializer>(CKRRegistrySerializer::GetCKRRegistrySerializerType());
  serializer->SetLocation(HKEY_CURRENT_USER, kLocation);
  return serializer;
}

// A scratch folder for the store while KR_REGISTRY_DIR is not set, removed
// (and the variable unset) at the end of the section.
class CKRDemoRegistryFolder {
public:
  CKRDemoRegistryFolder() {
    const char* set = std::getenv("KR_REGISTRY_DIR");
    if (set != nullptr && *set != '\0') {
      m_Folder = set;
      return;
    }
    std::string pattern = (std::filesystem::temp_directory_path() / "krdemo-registry-XXXXXX").string();
    if (::mkdtemp(pattern.data()) != nullptr) {
      m_Folder = pattern;
      m_Owned = true;
      ::setenv("KR_REGISTRY_DIR", m_Folder.c_str(), 1);
    }
  }
  ~CKRDemoRegistryFolder() {
    if (!m_Owned)
      return;
    ::unsetenv("KR_REGISTRY_DIR");
    std::error_code error;
    std::filesystem::remove_all(m_Folder, error);
  }
  CKRDemoRegistryFolder(const CKRDemoRegistryFolder&) = delete;
  CKRDemoRegistryFolder& operator=(const CKRDemoRegistryFolder&) = delete;

  bool IsUsable() const { return !m_Folder.empty(); }
  std::string File(const char* name) const { return m_Folder + "/" + name; }

private:
  std::string m_Folder;
  bool m_Owned = false;
};

}  // namespace

void KRDemoRegistry() {
  CKRDemoRegistryFolder folder;
  if (!folder.IsUsable()) {
    Print(L"no scratch folder for the registry store\n");
    return;
  }

  auto* preferences = New<CKRPreferences>(CKRPreferences::GetCKRPreferencesType());
  for (const wchar_t* name : {L"Display", L"Units"}) {
    auto* section = New<CKRPreferenceSection>(CKRPreferenceSection::GetCKRPreferenceSectionType());
    section->SetName(name);
    section->SetDescription(CKRString::Formatted(L"Settings of the %s", name));
    preferences->GetPreferenceSectionMap().Add(section);
  }
  const CKRGuid preferencesID = preferences->GetInstanceID();

  // Stored the moment it is serialized: there is no save step.
  CKRRegistrySerializer* serializer = NewSerializer();
  const int stored = preferences->SerializeTo(serializer);
  serializer->Release();
  Print(CKRString::Formatted(L"stored below HKEY_CURRENT_USER\\%s: %s\n", kLocation, stored ? L"yes" : L"no"));
  preferences->GetPreferenceSectionMap().RemoveAll(true);
  preferences->Release();

  // A second document at the same location finds what was stored.
  serializer = NewSerializer();
  serializer->Open();
  auto* loaded = dynamic_cast<CKRPreferences*>(serializer->GetObject(preferencesID, CKRPreferences::TypeID));
  serializer->Release();
  if (loaded != nullptr) {
    Print(L"read back, sections:\n");
    auto sections = loaded->GetPreferenceSectionMap().GetIterator();
    for (CKRPreferenceSection* section = sections.Next(1); section != nullptr; section = sections.Next(0))
      Print(L"  " + section->GetName() + L": " + section->GetDescription() + L"\n");
    loaded->GetPreferenceSectionMap().RemoveAll(true);
    loaded->Release();
  } else {
    Print(L"the preferences did not read back\n");
  }

  // The subtree as REGEDIT4 text (one byte per character).
  const std::string file = folder.File("krdemo-preferences.reg");
  if (CKRRegistry::WriteRegistryTreeToFile(HKEY_CURRENT_USER, kLocation, CKRString::FromUtf8(file).GetString())) {
    std::ifstream in(file, std::ios::binary);
    const std::string text((std::istreambuf_iterator<char>(in)), std::istreambuf_iterator<char>());
    std::wstring wide;
    for (const char c : text)
      if (c != '\r')
        wide += static_cast<wchar_t>(static_cast<unsigned char>(c));
    Print(L"exported:\n" + CKRString(std::move(wide)));
  } else {
    Print(L"the export failed\n");
  }
  std::filesystem::remove(file);
  KRRegDeleteKey(HKEY_CURRENT_USER, kDemoKey);
}

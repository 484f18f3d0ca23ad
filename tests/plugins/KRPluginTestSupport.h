// What the plug-in tests share: the module folders, a fixture that starts
// and ends every test with a fresh manager and type system, and a socket
// that counts its updates.
#pragma once

#include <krCoreLib/krCoreLib.h>

#include "KRExamplePlugins.h"
#include "KRScratchFolder.h"

#include <gtest/gtest.h>

#include <dlfcn.h>

#include <string>
#include <vector>

// A socket that counts Update calls and keeps every plug-in offered.
class CKRCountingSocket : public CKRPluginSocket {
  KR_DECLARE_OBJECT_TYPE(CKRCountingSocket, CKRObjectTypeImpl, "{AAAAAAAA-0000-4000-8000-0000000000F2}")

public:
  CKRGuid GetID() override { return CKRGuid(); }
  void Update() override { ++m_Updates; }
  int m_Updates = 0;

protected:
  CKRCountingSocket() = default;
};

namespace KRPluginTest {

inline constexpr CKRGuid kHostRepository = CKRGuid::Literal("{AAAAAAAA-0000-4000-8000-0000000000F1}");

inline std::string ExampleModule(const char* name) {
  return std::string(KR_EXAMPLE_PLUGIN_DIR) + "/" + name + ".plg";
}
inline std::string BrokenModule(int kind) {
  return std::string(KR_BROKEN_PLUGIN_DIR) + "/kr_broken_" + std::to_string(kind) + ".plg";
}
inline CKRString Wide(const std::string& text) {
  return CKRString::FromUtf8(text);
}

// True while the system's loader has the module at `path` mapped.
inline bool IsMapped(const std::string& path) {
  void* module = dlopen(path.c_str(), RTLD_NOW | RTLD_NOLOAD);
  if (module == nullptr)
    return false;
  dlclose(module);
  return true;
}

// The plug-ins in the manager's order.
inline std::vector<CKRPlugin*> Plugins() {
  std::vector<CKRPlugin*> plugins;
  auto it = CKRPluginManager::GetPluginIterator();
  for (CKRPlugin* plugin = it.Next(1); plugin != nullptr; plugin = it.Next(0))
    plugins.push_back(plugin);
  return plugins;
}

// The plug-in whose configuration has that name, or null.
inline CKRPlugin* PluginNamed(const wchar_t* name) {
  for (CKRPlugin* plugin : Plugins())
    if (plugin->GetConfiguration() != nullptr && plugin->GetConfiguration()->m_Name == name)
      return plugin;
  return nullptr;
}

template <class TSocket>
TSocket* NewSocket(IKRObjectType* type) {
  return dynamic_cast<TSocket*>(type->CreateInstance(CKRGuid()));
}

// Every test starts with the host's types claimed and ends with the
// manager and the type system released.
class CKRPluginTest : public testing::Test {
protected:
  void SetUp() override {
    CKRPluginManager::Release();
    CKRTypeSystem::Release();
    CKRTypeSystem::Initialize(kHostRepository);
  }
  void TearDown() override {
    CKRPluginManager::Release();
    CKRTypeSystem::Release();
  }
};

}  // namespace KRPluginTest

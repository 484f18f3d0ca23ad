// A host built against the installed package only that loads the
// third-party plug-in: plugin_host FOLDER. Exit status 0 when every check
// holds; the failed checks on standard error otherwise.
#include <krCoreLib/krCoreLib.h>

#include <dlfcn.h>

#include <cstdio>
#include <string>

namespace {

int g_Failures = 0;

void Check(bool holds, const char* what) {
  if (!holds) {
    std::fprintf(stderr, "plugin_host: %s\n", what);
    ++g_Failures;
  }
}

}  // namespace

int main(int argc, char** argv) {
  if (argc != 2)
    return 2;
  const std::string folder = argv[1];
  CKRTypeSystem::Initialize(CKRGuid::Literal("{3D7F0A12-6C4B-4E59-8A13-2B9C7D4E6F10}"));
  auto* commands =
      dynamic_cast<CKRPluginSocketCmd*>(CKRPluginSocketCmd::GetCKRPluginSocketCmdType()->CreateInstance(CKRGuid()));
  auto* menu =
      dynamic_cast<CKRPluginSocketMnu*>(CKRPluginSocketMnu::GetCKRPluginSocketMnuType()->CreateInstance(CKRGuid()));
  commands->RegisterWithManager();
  menu->RegisterWithManager();
  HMENU bar = CreatePopupMenu();
  menu->Attach(bar, L"Plugins", CKRGuid::CreateNewGUID());

  CKRPluginManager::LoadPlugins(CKRString::FromUtf8(folder));
  CKRPlugin* plugin = CKRPluginManager::GetPluginIterator().Next(1);
  Check(plugin != nullptr, "no plug-in loaded");
  if (plugin == nullptr)
    return 1;
  CKRPluginCfg* config = plugin->GetConfiguration();
  Check(config != nullptr && config->m_Name == L"Third Party", "the plug-in is not the third-party one (an error?)");
  if (config == nullptr || config->m_Name != L"Third Party") {
    if (config != nullptr)
      std::fprintf(stderr, "plugin_host: %s\n", config->m_Description.ToUtf8().c_str());
    return 1;
  }
  // Type checks and casts across the module boundary.
  Check(plugin->IsTypeOf(CKRPlugin::TypeID) == 1, "the plug-in's type is not linked below CKRPlugin");
  Check(dynamic_cast<CKRSerialObject*>(plugin) != nullptr, "dynamic_cast to CKRSerialObject fails");
  Check(static_cast<IKRPlugin*>(plugin->GetInterface(IID_IKRPlugin)) == static_cast<IKRPlugin*>(plugin),
        "GetInterface(IID_IKRPlugin) is not the plug-in");
  Check(dynamic_cast<CKRPluginCfg*>(static_cast<IKRObject*>(config)) == config, "dynamic_cast of the configuration");
  Check(config->IsTypeOf(CKRPluginCfg::TypeID) == 1, "the configuration's type is not linked below CKRPluginCfg");
  auto* configType = dynamic_cast<CKRSerialObjectTypeImpl*>(config->GetType());
  Check(configType != nullptr && configType->GetFieldMap().size() == 5, "the configuration has not 4 + 1 fields");
  Check(menu->GetRegisteredPlugins().Contains(plugin) && commands->GetRegisteredPlugins().Contains(plugin),
        "the plug-in did not join both sockets");
  // Its command, through the menu and the command socket.
  HMENU popup = menu->GetPopupMenu();
  Check(GetMenuItemCount(popup) == 1 && GetMenuStringW(popup, 0, MF_BYPOSITION) == L"&Greet", "the menu is wrong");
  Check(commands->OnCommand(CKRGuid::Literal("{3D7F0A12-6C4B-4E59-8A13-2B9C7D4E6F02}"), L"host", nullptr) == 1,
        "the command was not handled");
  Check(config->m_Description == L"Hello, host", "the command did not reach the plug-in");

  CKRPluginManager::Release();
  commands->Release();
  menu->Release();
  DestroyMenu(bar);
  // The module is gone with its plug-in and its types.
  const std::string module = folder + "/thirdparty.plg";
  void* still = dlopen(module.c_str(), RTLD_NOW | RTLD_NOLOAD);
  Check(still == nullptr, "the plug-in module stays mapped after release");
  if (still != nullptr)
    dlclose(still);
  Check(CKRTypeSystem::FindType(CKRGuid::Literal("{3D7F0A12-6C4B-4E59-8A13-2B9C7D4E6F05}")) == nullptr,
        "the plug-in's type is still registered");
  CKRTypeSystem::Release();
  CKRSingleton::ReleaseAll();
  if (g_Failures == 0)
    std::puts("plugin_host: the third-party plug-in loaded, worked and unloaded");
  return g_Failures == 0 ? 0 : 1;
}

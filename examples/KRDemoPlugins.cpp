// Plug-ins: the plug-in folder is loaded, the plug-ins are listed by their
// configuration's name, a menu socket builds the plug-in menu and a command
// socket carries a menu command to its plug-in.
#include "KRDemo.h"

#include "plugins/KRExamplePlugins.h"

namespace {

constexpr CKRGuid kDemoRepository = CKRGuid::Literal("{7E1D5C3B-9A08-4F6E-8D2C-4B0A1F3E5D70}");
constexpr CKRGuid kDemoMenuSocket = CKRGuid::Literal("{7E1D5C3B-9A08-4F6E-8D2C-4B0A1F3E5D71}");

void PrintMenu(HMENU menu, const wchar_t* indent) {
  for (int i = 0; i < GetMenuItemCount(menu); ++i) {
    const unsigned state = GetMenuState(menu, static_cast<unsigned>(i), MF_BYPOSITION);
    if (state == MF_SEPARATOR) {
      Print(CKRString::Formatted(L"%s-----\n", indent));
    } else if ((state & MF_POPUP) != 0) {
      Print(CKRString::Formatted(L"%s%s >\n", indent, GetMenuStringW(menu, i, MF_BYPOSITION).GetString()));
      PrintMenu(GetSubMenu(menu, i), (CKRString(indent) + L"    ").GetString());
    } else {
      Print(CKRString::Formatted(L"%s%-16s (command %u)\n", indent, GetMenuStringW(menu, i, MF_BYPOSITION).GetString(),
                                 GetMenuItemID(menu, i)));
    }
  }
}

}  // namespace

void KRDemoPlugins() {
  // The host claims its own types before it loads plug-ins.
  CKRTypeSystem::Initialize(kDemoRepository);
  auto* commands = dynamic_cast<CKRPluginSocketCmd*>(
      CKRPluginSocketCmd::GetCKRPluginSocketCmdType()->CreateInstance(CKRGuid()));
  auto* menu = dynamic_cast<CKRPluginSocketMnu*>(
      CKRPluginSocketMnu::GetCKRPluginSocketMnuType()->CreateInstance(CKRGuid()));
  commands->RegisterWithManager();
  menu->RegisterWithManager();
  HMENU menuBar = CreatePopupMenu();
  menu->Attach(menuBar, L"&Plugins", kDemoMenuSocket);

  const CKRString folder = CKRString::FromUtf8(KR_DEMO_PLUGIN_DIR);
  Print(CKRString::Formatted(L"1. LoadPlugins(\"%s\") finds these plug-ins:\n", folder.GetString()));
  CKRPluginManager::LoadPlugins(folder);
  CKRPluginManager::LoadPlugin(folder + L"/missing.plg");  // a failed load is listed too
  auto plugins = CKRPluginManager::GetPluginIterator();
  for (CKRPlugin* plugin = plugins.Next(1); plugin != nullptr; plugin = plugins.Next(0)) {
    CKRPluginCfg* config = plugin->GetConfiguration();
    Print(CKRString::Formatted(L"   %-12s %s\n", config->m_Name.GetString(), config->m_Description.GetString()));
  }

  Print(L"\n2. The plug-in menu built by the menu socket (error plug-ins never show):\n");
  PrintMenu(menuBar, L"   ");

  Print(L"\n3. The user picks the first command: the command socket routes it.\n");
  HMENU popup = menu->GetPopupMenu();
  const unsigned picked = GetMenuItemID(popup, 0);
  const int handled = commands->OnCmdMsg(picked, KR_CN_COMMAND, nullptr, nullptr);
  for (CKRPlugin* plugin = plugins.Next(1); plugin != nullptr; plugin = plugins.Next(0))
    if (plugin->GetConfiguration()->m_PluginID == KRExamplePlugins::kShapesPluginID)
      Print(CKRString::Formatted(L"   command %u handled: %d; the Shapes plug-in says \"%s\"\n", picked, handled,
                                 plugin->GetConfiguration()->m_Description.GetString()));
  CKRCmdUI state(GetMenuItemID(popup, GetMenuItemCount(popup) - 1));
  commands->OnCmdMsg(state.m_nID, KR_CN_UPDATE_COMMAND_UI, &state, nullptr);
  Print(CKRString::Formatted(L"   \"%s\" is %s\n", GetMenuStringW(popup, state.m_nID, MF_BYCOMMAND).GetString(),
                             state.IsEnabled() ? L"enabled" : L"disabled (nothing to clear)"));

  // Shutdown: sockets and plug-ins go, the modules are unloaded with their
  // types.
  CKRPluginManager::Release();
  commands->Release();
  menu->Release();
  DestroyMenu(menuBar);
  CKRTypeSystem::ReleaseRepository(kDemoRepository);
  Print(L"\n4. Released: plug-ins, their modules and the types they brought are gone.\n");
}

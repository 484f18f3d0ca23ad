#include <krCoreLib/plugins/CKRPluginManager.h>

#include <krCoreLib/objectmodel/CKRTypeSystem.h>
#include <krCoreLib/system/CKRPathHelper.h>

#include "SKRModuleLoader.h"
#include "system/KRNativePath.h"

#include <algorithm>
#include <string>

CKRPluginManager* CKRPluginManager::m_pInstance = nullptr;

namespace {

// The loader's texts are UTF-8 (they quote the path).
CKRString LoaderText(const std::string& text) {
  return CKRString::FromUtf8(text);
}

// The module's code called while a plug-in is made: an exception it lets
// out counts as no result (nothing may be thrown through the manager).
template <class TCall>
auto CallGuarded(TCall call) -> decltype(call()) {
  try {
    return call();
  } catch (...) {
    return nullptr;
  }
}

}  // namespace

CKRPluginManager::~CKRPluginManager() = default;

CKRPluginManager* CKRPluginManager::GetInstance() {
  if (m_pInstance == nullptr)
    m_pInstance = new CKRPluginManager();
  return m_pInstance;
}

void CKRPluginManager::LoadPlugins(CKRString folder) { GetInstance()->_LoadPlugins(std::move(folder)); }
void CKRPluginManager::LoadPlugin(CKRString path) { GetInstance()->_LoadPlugin(std::move(path)); }
void CKRPluginManager::ReleasePlugin(CKRPlugin* plugin) { GetInstance()->_ReleasePlugin(plugin); }
void CKRPluginManager::ReleaseAllPlugins() { GetInstance()->_ReleaseAllPlugins(); }
void CKRPluginManager::RegisterSocket(CKRPluginSocket* socket) { GetInstance()->_RegisterSocket(socket); }
void CKRPluginManager::UnregisterSocket(CKRPluginSocket* socket) { GetInstance()->_UnregisterSocket(socket); }
void CKRPluginManager::UnregisterAllSockets() { GetInstance()->_UnregisterAllSockets(); }
void CKRPluginManager::UpdateAllSockets() { GetInstance()->_UpdateAllSockets(); }
CKRObjPtrList<CKRPlugin>::Iterator CKRPluginManager::GetPluginIterator() { return GetInstance()->_GetPluginIterator(); }
CKRObjPtrList<CKRPluginSocket>::Iterator CKRPluginManager::GetSocketIterator() {
  return GetInstance()->_GetSocketIterator();
}
void CKRPluginManager::RegisterCmd(CKRPluginCmd* cmd) { GetInstance()->_RegisterCmd(cmd); }
void CKRPluginManager::SetNextCmdID(unsigned id) { GetInstance()->m_NextCmdID = id; }
IKRPluginResource* CKRPluginManager::GetResourceInterface() { return GetInstance()->_GetResourceInterface(); }
void CKRPluginManager::SetResourceInterface(IKRPluginResource* resource) {
  GetInstance()->_SetResourceInterface(resource);
}

void CKRPluginManager::Release() {
  if (m_pInstance == nullptr)
    return;
  m_pInstance->_Release();
  delete m_pInstance;
  m_pInstance = nullptr;
}

void CKRPluginManager::ForgetSocket(CKRPluginSocket* socket) {
  if (m_pInstance == nullptr)
    return;
  m_pInstance->m_Sockets.Remove(socket);
  std::erase(m_pInstance->m_FormerSockets, socket);
}

CKRObjPtrList<CKRPlugin>::Iterator CKRPluginManager::_GetPluginIterator() {
  return m_Plugins.GetIterator();
}

CKRObjPtrList<CKRPluginSocket>::Iterator CKRPluginManager::_GetSocketIterator() {
  return m_Sockets.GetIterator();
}

void CKRPluginManager::_UpdateAllSockets() {
  for (CKRPluginSocket* socket : m_Sockets)
    socket->Update();
}

void CKRPluginManager::_LoadPlugins(CKRString folder) {
  if (!CKRPathHelper::DirectoryExists(folder.GetString()))
    return;
  std::vector<CKRString> names;
  CKRPathHelper::GetChildPaths(names, folder.GetString(), L"*.plg");
  const CKRString prefix = CKRPathHelper::AddSlash(folder.GetString());
  // The folder's new modules are tried all at once, before any is loaded.
  std::vector<std::string> natives;
  for (const CKRString& name : names) {
    std::string native;
    if (SKRNativePath::ToNative((prefix + name).GetString(), native))
      natives.push_back(std::move(native));
  }
  SKRModuleLoader::TryAll(natives);
  for (const CKRString& name : names)
    _LoadPlugin(prefix + name);
  _UpdateAllSockets();
}

void CKRPluginManager::_LoadPlugin(CKRString path) {
  if (_ContainsPluginRecord(path))
    return;
  std::string native;
  if (!SKRNativePath::ToNative(path.GetString(), native)) {
    if (CKRPlugin* error = MakeErrorPlugin(L"Not a valid file name: \"" + path + L"\""))
      AddRecord(nullptr, error, path, CKRGuid());
    return;
  }
  std::string loaderText;
  void* module = SKRModuleLoader::Load(native.c_str(), loaderText);
  if (module == nullptr) {
    if (CKRPlugin* error = MakeErrorPlugin(LoaderText(loaderText)))
      AddRecord(nullptr, error, path, CKRGuid());
    return;
  }
  // The module's types are claimed into a repository of their own, so that
  // they can be released as a whole before the module goes.
  const CKRGuid repositoryID = CKRGuid::CreateNewGUID();
  CKRTypeSystem::Initialize(repositoryID);

  CKRString failure;
  auto entry = reinterpret_cast<KRGetPluginTypeFn>(SKRModuleLoader::FindExport(module, KR_PLUGIN_ENTRY_POINT, loaderText));
  IKRObjectType* type = nullptr;
  IKRObject* object = nullptr;
  CKRPlugin* plugin = nullptr;
  if (entry == nullptr) {
    failure = LoaderText(loaderText);
  } else if ((type = CallGuarded([entry] { return entry(); })) == nullptr) {
    failure = L"Internal Plugin Error";
  } else if ((object = CallGuarded([type] { return type->CreateInstance(CKRGuid()); })) == nullptr) {
    failure = L"Couldn't Load Plugin";
  } else if ((plugin = dynamic_cast<CKRPlugin*>(object)) == nullptr) {
    // Not a plug-in: it goes back to its type before its module goes.
    object->Release();
    failure = L"Couldn't Load Plugin";
  }
  if (plugin == nullptr) {
    UnloadModule(module, repositoryID);
    if (CKRPlugin* error = MakeErrorPlugin(failure))
      AddRecord(nullptr, error, path, CKRGuid());
    return;
  }
  if (_ContainsPluginRecord(plugin)) {
    // Another module brought this plug-in already.
    if (plugin->Release() != 0)
      UnloadModule(module, repositoryID);
    return;
  }
  AddRecord(module, plugin, path, repositoryID);
}

CKRPlugin* CKRPluginManager::MakeErrorPlugin(const CKRString& text) {
  auto* error = dynamic_cast<CKRPlugin*>(CKRPluginError::GetCKRPluginErrorType()->CreateInstance(CKRGuid()));
  if (error != nullptr && error->GetConfiguration() != nullptr)
    error->GetConfiguration()->m_Description = text;
  return error;
}

void CKRPluginManager::AddRecord(void* module, CKRPlugin* plugin, const CKRString& path, CKRGuid repositoryID) {
  m_PluginRecords.push_back(PluginRecord{module, plugin, path, repositoryID});
  m_Plugins.Add(plugin);
  for (CKRPluginSocket* socket : m_Sockets)
    if (plugin->ShouldRegister(socket) != 0)
      socket->RegisterPlugin(plugin);
}

void CKRPluginManager::DetachFromSockets(CKRPlugin* plugin) {
  for (CKRPluginSocket* socket : m_Sockets)
    socket->UnregisterPlugin(plugin);
  for (CKRPluginSocket* socket : m_FormerSockets)
    socket->UnregisterPlugin(plugin);
}

void CKRPluginManager::RememberFormerSocket(CKRPluginSocket* socket) {
  if (socket != nullptr && std::find(m_FormerSockets.begin(), m_FormerSockets.end(), socket) == m_FormerSockets.end())
    m_FormerSockets.push_back(socket);
}

void CKRPluginManager::UnloadModule(void* module, CKRGuid repositoryID) {
  if (module == nullptr)
    return;
  CKRTypeSystem::ReleaseRepository(repositoryID);
  SKRModuleLoader::Unload(module);
}

bool CKRPluginManager::_ContainsPluginRecord(CKRString path) {
  path.MakeLower();
  for (const PluginRecord& record : m_PluginRecords) {
    CKRString known = record.m_Path;
    if (known.MakeLower() == path)
      return true;
  }
  return false;
}

bool CKRPluginManager::_ContainsPluginRecord(CKRPlugin* plugin) {
  CKRPluginCfg* config = plugin != nullptr ? plugin->GetConfiguration() : nullptr;
  if (config == nullptr)
    return false;
  for (const PluginRecord& record : m_PluginRecords) {
    CKRPluginCfg* known = record.m_pPlugin->GetConfiguration();
    if (known != nullptr && known->m_PluginID == config->m_PluginID)
      return true;
  }
  return false;
}

void CKRPluginManager::_ReleasePlugin(CKRPlugin* plugin) {
  if (plugin == nullptr)
    return;
  auto record = m_PluginRecords.begin();
  while (record != m_PluginRecords.end() && record->m_pPlugin != plugin)
    ++record;
  if (record == m_PluginRecords.end())
    return;
  const PluginRecord taken = *record;
  m_PluginRecords.erase(record);
  m_Plugins.Remove(plugin);
  DetachFromSockets(plugin);
  // A plug-in that refuses to end keeps its module (and its types) loaded:
  // its code must stay where its object can reach it.
  if (plugin->Release() != 0)
    UnloadModule(taken.m_hModule, taken.m_RepositoryID);
}

void CKRPluginManager::_ReleaseAllPlugins() {
  // Every plug-in leaves the sockets and ends before any module goes; a
  // module whose plug-in refused to end stays loaded.
  std::vector<PluginRecord> records;
  records.swap(m_PluginRecords);
  std::vector<bool> ended(records.size(), true);
  for (std::size_t i = 0; i < records.size(); ++i) {
    DetachFromSockets(records[i].m_pPlugin);
    m_Plugins.Remove(records[i].m_pPlugin);
    ended[i] = records[i].m_pPlugin->Release() != 0;
  }
  // Plug-ins listed without a record (none, unless a derived manager adds
  // them) are released as the list's owner would.
  m_Plugins.RemoveAll(true);
  for (std::size_t i = 0; i < records.size(); ++i)
    if (ended[i])
      UnloadModule(records[i].m_hModule, records[i].m_RepositoryID);
}

void CKRPluginManager::_RegisterSocket(CKRPluginSocket* socket) {
  if (socket == nullptr || m_Sockets.Add(socket) == 0)
    return;
  std::erase(m_FormerSockets, socket);
  for (CKRPlugin* plugin : m_Plugins)
    if (plugin->ShouldRegister(socket) != 0)
      socket->RegisterPlugin(plugin);
  socket->Update();
}

void CKRPluginManager::_UnregisterSocket(CKRPluginSocket* socket) {
  if (m_Sockets.Remove(socket) != nullptr)
    RememberFormerSocket(socket);
}

void CKRPluginManager::_UnregisterAllSockets() {
  for (CKRPluginSocket* socket : m_Sockets)
    RememberFormerSocket(socket);
  m_Sockets.RemoveAll(false);
}

void CKRPluginManager::_Release() {
  _UnregisterAllSockets();
  // Former sockets included: no socket keeps a released plug-in.
  _ReleaseAllPlugins();
  m_FormerSockets.clear();
}

void CKRPluginManager::_RegisterCmd(CKRPluginCmd* cmd) {
  if (cmd == nullptr)
    return;
  cmd->m_CmdID = m_NextCmdID++;
}

IKRPluginResource* CKRPluginManager::_GetResourceInterface() {
  return m_pResourceInterface;
}

void CKRPluginManager::_SetResourceInterface(IKRPluginResource* resource) {
  m_pResourceInterface = resource;
}

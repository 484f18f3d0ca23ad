#include <krCoreLib/plugins/CKRPluginSocket.h>

#include <krCoreLib/plugins/CKRPluginManager.h>

#include <algorithm>

KR_IMPLEMENT_ABSTRACT_OBJECT_TYPE(CKRPluginSocket, CKRObjectImpl)
KR_IMPLEMENT_OBJECT_TYPE(CKRPluginSocketCmd, CKRPluginSocket)
KR_IMPLEMENT_OBJECT_TYPE(CKRPluginSocketMnu, CKRPluginSocket)

void CKRPluginSocket::RegisterPlugin(CKRPlugin* plugin) {
  if (plugin == nullptr)
    return;
  m_RegisteredPlugins.Add(plugin);
  m_VisiblePlugins.Add(plugin);
}

void CKRPluginSocket::UnregisterPlugin(CKRPlugin* plugin) {
  if (plugin == nullptr)
    return;
  m_RegisteredPlugins.Remove(plugin);
  m_VisiblePlugins.Remove(plugin);
}

void CKRPluginSocket::ApplyFilter(CKRGuid filterID) {
  m_VisiblePlugins.RemoveAll(false);
  for (CKRPlugin* plugin : m_RegisteredPlugins)
    if (plugin->ShouldFilter(filterID) == 0)
      m_VisiblePlugins.Add(plugin);
}

void CKRPluginSocket::RegisterWithManager() {
  CKRPluginManager::RegisterSocket(this);
}

int CKRPluginSocket::OnBeforeRelease() {
  if (CKRObjectImpl::OnBeforeRelease() == 0)
    return 0;
  // A released socket must not stay in the manager's list.
  CKRPluginManager::ForgetSocket(this);
  return 1;
}

CKRGuid CKRPluginSocketCmd::GetID() {
  return CKRGuid();
}

void CKRPluginSocketCmd::RegisterPlugin(CKRPlugin* plugin) {
  if (plugin == nullptr)
    return;
  CKRPluginSocket::RegisterPlugin(plugin);
  const bool known = std::any_of(m_Targets.begin(), m_Targets.end(),
                                 [plugin](const auto& pair) { return pair.first == plugin; });
  if (known)
    return;
  IKRPluginSocketCmdListener* listener = nullptr;
  if (void* view = plugin->GetInterface(IID_IKRPluginSocketCmdRegistrant))
    listener = static_cast<IKRPluginSocketCmdRegistrant*>(view);
  else if (void* other = plugin->GetInterface(IID_IKRPluginSocketCmdListener))
    listener = static_cast<IKRPluginSocketCmdListener*>(other);
  if (listener == nullptr)
    return;
  if (CKRPluginCmdTarget* target = listener->GetCmdTarget())
    m_Targets.emplace_back(plugin, target);
}

void CKRPluginSocketCmd::UnregisterPlugin(CKRPlugin* plugin) {
  CKRPluginSocket::UnregisterPlugin(plugin);
  std::erase_if(m_Targets, [plugin](const auto& pair) { return pair.first == plugin; });
}

void CKRPluginSocketCmd::Update() {}

int CKRPluginSocketCmd::OnCmdMsg(unsigned nID, unsigned nCode, void* extra, SKRCmdHandlerInfo* handlerInfo) {
  // By index: a handler may change the socket.
  for (std::size_t i = 0; i < m_Targets.size(); ++i)
    if (const int handled = m_Targets[i].second->OnCmdMsg(nID, nCode, extra, handlerInfo))
      return handled;
  return 0;
}

int CKRPluginSocketCmd::OnCommand(CKRGuid id, CKRString argument, void* data) {
  for (std::size_t i = 0; i < m_Targets.size(); ++i)
    if (const int handled = m_Targets[i].second->OnCommand(id, argument, data))
      return handled;
  return 0;
}

CKRGuid CKRPluginSocketMnu::GetID() {
  return m_SocketID;
}

int CKRPluginSocketMnu::OnInitialize() {
  m_hParentMenu = nullptr;
  m_hPopupMenu = nullptr;
  return CKRPluginSocket::OnInitialize();
}

void CKRPluginSocketMnu::Attach(HMENU parent, CKRString title, CKRGuid socketID) {
  m_SocketID = socketID;
  if (parent == m_hParentMenu)
    return;
  m_hParentMenu = parent;
  if (!IsMenu(parent))
    return;
  HMENU popup = CreatePopupMenu();
  if (popup == nullptr)
    return;
  if (!AppendMenuW(parent, MF_POPUP, reinterpret_cast<UINT_PTR>(popup), title.GetString())) {
    DestroyMenu(popup);
    return;
  }
  m_hPopupMenu = popup;
  Update();
}

void CKRPluginSocketMnu::Update() {
  if (m_hPopupMenu == nullptr || !IsMenu(m_hPopupMenu))
    return;
  while (GetMenuItemCount(m_hPopupMenu) > 0)
    DeleteMenu(m_hPopupMenu, 0, MF_BYPOSITION);
  bool first = true;
  for (CKRPlugin* plugin : m_VisiblePlugins) {
    if (!first)
      AppendMenuW(m_hPopupMenu, MF_SEPARATOR, 0, nullptr);
    first = false;
    auto* source = static_cast<IKRPluginSocketCmdSource*>(plugin->GetInterface(IID_IKRPluginSocketCmdSource));
    if (source == nullptr)
      continue;
    const int count = source->GetCmdCount();
    for (int i = 0; i < count; ++i) {
      CKRPluginCmd* cmd = source->GetCmd(i);
      if (cmd == nullptr || (cmd->m_Flags & KR_PLUGINCMD_MENU) == 0)
        continue;
      if (cmd->m_CmdID == KR_PLUGINCMD_NO_ID)
        CKRPluginManager::RegisterCmd(cmd);
      AppendMenuW(m_hPopupMenu, MF_STRING, cmd->m_CmdID, cmd->m_Text.GetString());
    }
  }
}

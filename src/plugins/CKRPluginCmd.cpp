#include <krCoreLib/plugins/CKRPluginCmd.h>

#include <utility>

CKRPluginCmd::CKRPluginCmd(CKRGuid id, CKRString text, CKRString secondText, IKRPluginCmdHandler* handler,
                           unsigned flags)
    : m_Flags(flags), m_ID(id), m_Text(std::move(text)), m_SecondText(std::move(secondText)), m_pHandler(handler) {}

int CKRPluginCmd::OnCmdMsg(unsigned nID, unsigned nCode, void* extra, SKRCmdHandlerInfo*) {
  if (nID != m_CmdID)
    return 0;
  if (m_pHandler == nullptr)
    return 1;
  // The code is named by its low 16 bits; the update request is the whole
  // value.
  const unsigned code = nCode == KR_CN_UPDATE_COMMAND_UI ? nCode : (nCode & 0xFFFFu);
  if (code == KR_CN_COMMAND)
    m_pHandler->OnCommand(m_ID, CKRString(), nullptr);
  else if (code == KR_CN_UPDATE_COMMAND_UI)
    m_pHandler->OnCommandUI(m_ID, static_cast<CKRCmdUI*>(extra));
  return 1;
}

int CKRPluginCmd::OnCommand(CKRGuid id, CKRString argument, void* data) {
  if (m_pHandler != nullptr && id == m_ID)
    m_pHandler->OnCommand(id, std::move(argument), data);
  return 0;
}

CKRPluginCmdTarget::~CKRPluginCmdTarget() = default;

CKRPluginCmdTarget* CKRPluginCmdTarget::GetCmdTarget() {
  return this;
}

int CKRPluginCmdTarget::GetCmdCount() {
  return static_cast<int>(m_Cmds.size());
}

CKRPluginCmd* CKRPluginCmdTarget::GetCmd(int index) {
  if (index < 0 || static_cast<std::size_t>(index) >= m_Cmds.size())
    return nullptr;
  return &m_Cmds[static_cast<std::size_t>(index)];
}

void CKRPluginCmdTarget::AddCmd(CKRPluginCmd cmd) {
  if (cmd.m_pHandler == nullptr)
    cmd.m_pHandler = static_cast<IKRPluginCmdHandler*>(this);
  m_Cmds.push_back(std::move(cmd));
}

int CKRPluginCmdTarget::OnCmdMsg(unsigned nID, unsigned nCode, void* extra, SKRCmdHandlerInfo* handlerInfo) {
  if (const int handled = CKRCmdTarget::OnCmdMsg(nID, nCode, extra, handlerInfo))
    return handled;
  if (handlerInfo != nullptr) {
    handlerInfo->m_pTarget = this;
    return 1;
  }
  // By index: a handler may add commands while it runs.
  for (std::size_t i = 0; i < m_Cmds.size(); ++i)
    if (const int handled = m_Cmds[i].OnCmdMsg(nID, nCode, extra, nullptr))
      return handled;
  return 0;
}

int CKRPluginCmdTarget::OnCommand(CKRGuid id, CKRString argument, void* data) {
  if (m_bPassingOn)
    return 0;
  m_bPassingOn = true;
  for (std::size_t i = 0; i < m_Cmds.size(); ++i)
    if (m_Cmds[i].m_pHandler != static_cast<IKRPluginCmdHandler*>(this))
      m_Cmds[i].OnCommand(id, argument, data);
  m_bPassingOn = false;
  return 0;
}

int CKRPluginCmdTarget::OnCommandUI(CKRGuid, CKRCmdUI*) {
  return 0;
}

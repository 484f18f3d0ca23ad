#include <krCoreLib/platform/KRCmdTarget.h>

CKRCmdUI::~CKRCmdUI() = default;

void CKRCmdUI::Enable(bool on) {
  m_bEnabled = on;
  m_bUpdated = true;
}

void CKRCmdUI::SetCheck(int check) {
  m_nCheck = check;
  m_bUpdated = true;
}

void CKRCmdUI::SetText(const wchar_t* text) {
  m_Text = text;
  m_bUpdated = true;
}

CKRCmdTarget::~CKRCmdTarget() = default;

int CKRCmdTarget::OnCmdMsg(unsigned nID, unsigned nCode, void* extra, SKRCmdHandlerInfo* handlerInfo) {
  if (nCode == KR_CN_UPDATE_COMMAND_UI) {
    auto entry = m_UpdateMap.find(nID);
    if (entry == m_UpdateMap.end())
      return 0;
    if (handlerInfo != nullptr)
      handlerInfo->m_pTarget = this;
    else
      entry->second(static_cast<CKRCmdUI*>(extra));
    return 1;
  }
  if ((nCode & 0xFFFFu) != KR_CN_COMMAND)
    return 0;
  auto entry = m_CommandMap.find(nID);
  if (entry == m_CommandMap.end())
    return 0;
  if (handlerInfo != nullptr)
    handlerInfo->m_pTarget = this;
  else
    entry->second();
  return 1;
}

void CKRCmdTarget::SetCommandHandler(unsigned nID, CommandHandler handler) {
  if (handler)
    m_CommandMap[nID] = std::move(handler);
  else
    m_CommandMap.erase(nID);
}

void CKRCmdTarget::SetUpdateHandler(unsigned nID, UpdateHandler handler) {
  if (handler)
    m_UpdateMap[nID] = std::move(handler);
  else
    m_UpdateMap.erase(nID);
}

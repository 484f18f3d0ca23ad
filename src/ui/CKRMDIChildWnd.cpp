#include <krCoreLib/ui/CKRMDIChildWnd.h>

#include <algorithm>

CKRMDIChildWnd::CKRMDIChildWnd(CKRString title)
    : CKRWnd(std::move(title)),
      m_pRouter(static_cast<CKRToolEventRouter*>(
          CKRToolEventRouter::GetCKRToolEventRouterType()->CreateInstance(CKRGuid()))) {}

CKRMDIChildWnd::~CKRMDIChildWnd() {
  Deactivate();
  for (CKRTool* tool : m_Tools)
    tool->Release();
  if (m_pRouter != nullptr)
    m_pRouter->Release();
}

int CKRMDIChildWnd::AddTool(CKRTool* tool) {
  if (tool == nullptr || std::find(m_Tools.begin(), m_Tools.end(), tool) != m_Tools.end())
    return -1;
  m_Tools.push_back(tool);
  return int(m_Tools.size()) - 1;
}

CKRTool* CKRMDIChildWnd::GetTool(int index) const {
  return index >= 0 && index < int(m_Tools.size()) ? m_Tools[std::size_t(index)] : nullptr;
}

int CKRMDIChildWnd::GetToolCount() const {
  return int(m_Tools.size());
}

int CKRMDIChildWnd::GetDefaultToolID() {
  return m_Tools.empty() ? -1 : 0;
}

void CKRMDIChildWnd::Deactivate() {
  if (m_pActiveTool == nullptr)
    return;
  m_pActiveTool->OnSetActivated(this, 0);
  if (m_pRouter != nullptr)
    m_pRouter->RemoveObserver(m_pActiveTool->GetObserver(), CKRObservation::TypeID);
  m_pActiveTool = nullptr;
  m_ActiveToolID = -1;
}

int CKRMDIChildWnd::SetActiveTool(int index) {
  CKRTool* tool = GetTool(index);
  if (tool == nullptr)
    return 0;
  Deactivate();
  if (tool->OnSetActivated(this, 1) == 0) {
    if (m_pRouter != nullptr)
      m_pRouter->AddObserver(tool->GetObserver(), CKRObservation::TypeID);
    m_pActiveTool = tool;
    m_ActiveToolID = index;
    return 1;
  }
  tool->OnSetActivated(this, 0);
  if (index == GetDefaultToolID())
    return 0;
  return SetDefaultTool();
}

int CKRMDIChildWnd::SetDefaultTool() {
  const int index = GetDefaultToolID();
  if (index < 0) {
    Deactivate();
    return 0;
  }
  return SetActiveTool(index);
}

int CKRMDIChildWnd::GetActiveToolID() {
  return m_ActiveToolID;
}

void CKRMDIChildWnd::RaiseEvent(CKRObservation* event) {
  if (m_pRouter != nullptr)
    m_pRouter->NotifyObservers(event);
}

#include "KRToolTestObjects.h"

#include "KRFrameworkTestObjects.h"

KR_IMPLEMENT_SERIAL_TYPE(CKRTestTool, CKRTool)
KR_IMPLEMENT_OBJECT_TYPE(CKRTestView, CKRView)

void CKRTestTool::CKRTestToolType::CreateFields(CKRSerialObjectTypeImpl* target, IKRObject* object) {
  AppendParentFields(target, object);
}

void CKRTestTool::OnUpdate(CKRObservation* observation) {
  ++m_Updates;
  CKRTool::OnUpdate(observation);
}

int CKRTestTool::OnSetActivated(CKRWnd* window, int activate) {
  Write(activate != 0 ? "on" : "off");
  CKRTool::OnSetActivated(window, activate);
  return activate != 0 ? m_Refuse : 0;
}

void CKRTestTool::OnMouseDown(int button, unsigned int flags, CKRScreenPoint point, const WorldPoint& world) {
  Write("down", button, flags, point.x, point.y, world[0], world[1], world[2], world[3]);
}
void CKRTestTool::OnMouseMove(int button, unsigned int flags, CKRScreenPoint point, const WorldPoint& world) {
  Write("move", button, flags, point.x, point.y, world[0], world[1], world[2], world[3]);
}
void CKRTestTool::OnMouseUp(int button, unsigned int flags, CKRScreenPoint point, const WorldPoint& world) {
  Write("up", button, flags, point.x, point.y, world[0], world[1], world[2], world[3]);
}
void CKRTestTool::OnMouseWheel(short delta, unsigned int flags, CKRScreenPoint point, const WorldPoint&) {
  Write("wheel", delta, flags, point.x, point.y);
}
void CKRTestTool::OnMouseLeave() {
  Write("leave");
}
void CKRTestTool::OnKeyDown(unsigned int key, unsigned int flags, int third, int fourth) {
  Write("keydown", key, flags, third, fourth);
}
void CKRTestTool::OnKeyUp(unsigned int key, unsigned int flags, int third, int fourth) {
  Write("keyup", key, flags, third, fourth);
}
void CKRTestTool::OnPaint(CKRDeviceContext context, int value, CKRScreenSize size, const PaintBound& bound, double scale) {
  Write("paint", context.m_Handle, value, size.cx, size.cy, bound.IsEmpty() ? "empty" : "bound", scale);
}
void CKRTestTool::OnFocusChanged(bool gained, CKRWnd* window) {
  Write(gained ? "focus+" : "focus-", window != nullptr ? window->GetTitle().ToUtf8() : "null");
}

void CKRTestView::OnUpdate(CKRObservation* observation) {
  auto* labelled = dynamic_cast<CKRTestObservationA*>(observation);
  if (m_pLog != nullptr)
    m_pLog->push_back(m_Name + ":" + (labelled != nullptr ? labelled->m_Label : std::string("plain")));
}

#include "KRToolTestObjects.h"

#include "KRFrameworkTestObjects.h"

#include <sstream>

KR_IMPLEMENT_SERIAL_TYPE(CKRTestTool, CKRTool)
KR_IMPLEMENT_OBJECT_TYPE(CKRTestView, CKRView)

void CKRTestTool::CKRTestToolType::CreateFields(CKRSerialObjectTypeImpl* target, IKRObject* object) {
  AppendParentFields(target, object);
}

namespace {
std::string Describe(int first, unsigned int second, CKRScreenPoint point, const CKRTool::WorldPoint& world) {
  std::ostringstream text;
  text << first << ' ' << second << " (" << point.x << ',' << point.y << ") [" << world[0] << ' ' << world[1] << ' '
       << world[2] << ' ' << world[3] << ']';
  return text.str();
}
}  // namespace

void CKRTestTool::Write(const std::string& text) {
  if (m_pLog != nullptr)
    m_pLog->push_back(m_Name + ":" + text);
  if (m_Hook)
    m_Hook();
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
  Write("down " + Describe(button, flags, point, world));
}
void CKRTestTool::OnMouseMove(int button, unsigned int flags, CKRScreenPoint point, const WorldPoint& world) {
  Write("move " + Describe(button, flags, point, world));
}
void CKRTestTool::OnMouseUp(int button, unsigned int flags, CKRScreenPoint point, const WorldPoint& world) {
  Write("up " + Describe(button, flags, point, world));
}
void CKRTestTool::OnMouseWheel(short delta, unsigned int flags, CKRScreenPoint point, const WorldPoint&) {
  Write("wheel " + std::to_string(delta) + ' ' + std::to_string(flags) + " (" + std::to_string(point.x) + ',' +
        std::to_string(point.y) + ')');
}
void CKRTestTool::OnMouseLeave() {
  Write("leave");
}
void CKRTestTool::OnKeyDown(unsigned int key, unsigned int flags, int third, int fourth) {
  Write("keydown " + std::to_string(key) + ' ' + std::to_string(flags) + ' ' + std::to_string(third) + ' ' +
        std::to_string(fourth));
}
void CKRTestTool::OnKeyUp(unsigned int key, unsigned int flags, int third, int fourth) {
  Write("keyup " + std::to_string(key) + ' ' + std::to_string(flags) + ' ' + std::to_string(third) + ' ' +
        std::to_string(fourth));
}
void CKRTestTool::OnPaint(CKRDeviceContext context, int value, CKRScreenSize size, const PaintBound& bound, double scale) {
  std::ostringstream text;
  text << "paint " << context.m_Handle << ' ' << value << " (" << size.cx << ',' << size.cy << ") "
       << (bound.IsEmpty() ? "empty" : "bound") << ' ' << scale;
  Write(text.str());
}
void CKRTestTool::OnFocusChanged(bool gained, CKRWnd* window) {
  Write(std::string(gained ? "focus+ " : "focus- ") + (window != nullptr ? window->GetTitle().ToUtf8() : "null"));
}

void CKRTestView::OnUpdate(CKRObservation* observation) {
  auto* labelled = dynamic_cast<CKRTestObservationA*>(observation);
  if (m_pLog != nullptr)
    m_pLog->push_back(m_Name + ":" + (labelled != nullptr ? labelled->m_Label : std::string("plain")));
}

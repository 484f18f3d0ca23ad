#include <krCoreLib/framework/CKRTool.h>

#include <krCoreLib/geometry/CKRBoundT.h>

KR_IMPLEMENT_SERIAL_TYPE(CKRTool, CKRSerialObject)

void CKRTool::CKRToolType::CreateFields(CKRSerialObjectTypeImpl* target, IKRObject* object) {
  // The tool's own type shows itself under its display name.
  if (target == this && object == nullptr) {
    SetName(L"Tool");
    SetDescription(L"A Tool");
  }
  AppendParentFields(target, object);
}

int CKRTool::OnInitialize() {
  if (CKRSerialObject::OnInitialize() == 0)
    return 0;
  m_pAdapter = static_cast<CKRObserverAdapter*>(CKRObserverAdapter::GetCKRObserverAdapterType()->CreateInstance(CKRGuid()));
  if (m_pAdapter != nullptr)
    m_pAdapter->SetListener(this);
  return 1;
}

int CKRTool::OnBeforeRelease() {
  if (m_pAdapter != nullptr) {
    // Forgotten by the router it may still be registered with.
    m_pAdapter->Release();
    m_pAdapter = nullptr;
  }
  return CKRSerialObject::OnBeforeRelease();
}

void CKRTool::OnUpdate(CKRObservation* observation) {
  if (observation == nullptr)
    return;
  if (observation->IsTypeOf(CKRToolEvent::TypeID) != 0)
    ProcessToolEvent(static_cast<CKRToolEvent*>(observation));
  else if (observation->IsTypeOf(CKRFocusEvent::TypeID) != 0) {
    auto* focus = static_cast<CKRFocusEvent*>(observation);
    OnFocusChanged(focus->m_Gained, focus->m_pWindow);
  }
}

void CKRTool::OnBeforeSave() {}

void CKRTool::ProcessToolEvent(CKRToolEvent* event) {
  if (event == nullptr)
    return;
  const CKRScreenPoint point{event->m_PositionX, event->m_PositionY};
  const WorldPoint world(float(event->m_WorldX), float(event->m_WorldY), float(event->m_WorldZ), 1.0f);
  switch (event->m_Kind) {
  case CKRToolEvent::KIND_MOUSE_DOWN:
    OnMouseDown(event->m_FirstParameter, event->m_SecondParameter, point, world);
    break;
  case CKRToolEvent::KIND_MOUSE_MOVE:
    OnMouseMove(event->m_FirstParameter, event->m_SecondParameter, point, world);
    break;
  case CKRToolEvent::KIND_MOUSE_UP:
    OnMouseUp(event->m_FirstParameter, event->m_SecondParameter, point, world);
    break;
  case CKRToolEvent::KIND_KEY_DOWN:
    OnKeyDown(unsigned(event->m_FirstParameter), event->m_SecondParameter, event->m_PositionX, event->m_PositionY);
    break;
  case CKRToolEvent::KIND_KEY_UP:
    OnKeyUp(unsigned(event->m_FirstParameter), event->m_SecondParameter, event->m_PositionX, event->m_PositionY);
    break;
  case CKRToolEvent::KIND_PAINT:
    // An empty bound: the freshly constructed one.
    OnPaint(CKRDeviceContext{event->m_FirstParameter}, int(event->m_SecondParameter),
            CKRScreenSize{event->m_PositionX, event->m_PositionY}, PaintBound(), 1.0);
    break;
  case CKRToolEvent::KIND_MOUSE_WHEEL:
    // The 4-D point carries no meaning for the wheel.
    OnMouseWheel(event->m_WheelDelta, event->m_SecondParameter, point, WorldPoint(0, 0, 0, 1));
    break;
  case CKRToolEvent::KIND_MOUSE_LEAVE:
    OnMouseLeave();
    break;
  default:
    break;
  }
}

int CKRTool::OnSetActivated(CKRWnd* window, int activate) {
  if (activate != 0)
    m_pWindow = window;
  return 0;
}

CKRObserver* CKRTool::GetObserver() {
  return m_pAdapter;
}

void CKRTool::OnMouseDown(int, unsigned int, CKRScreenPoint, const WorldPoint&) {}
void CKRTool::OnMouseMove(int, unsigned int, CKRScreenPoint, const WorldPoint&) {}
void CKRTool::OnMouseUp(int, unsigned int, CKRScreenPoint, const WorldPoint&) {}
void CKRTool::OnMouseWheel(short, unsigned int, CKRScreenPoint, const WorldPoint&) {}
void CKRTool::OnMouseLeave() {}
void CKRTool::OnKeyDown(unsigned int, unsigned int, int, int) {}
void CKRTool::OnKeyUp(unsigned int, unsigned int, int, int) {}
void CKRTool::OnPaint(CKRDeviceContext, int, CKRScreenSize, const PaintBound&, double) {}
void CKRTool::OnFocusChanged(bool, CKRWnd*) {}

// Application framework: a model that tells its two views about changes, and
// a document window whose active tool receives a few synthesised pointer and
// key events through the window's router.
#include "KRDemo.h"

namespace {
constexpr CKRGuid kRepository = CKRGuid::Literal("{7E0F1A2B-3C4D-4E5F-8A9B-0C1D2E3F4C00}");
}  // namespace

// A change of the demo's drawing: what was added.
class CKRDemoChange : public CKRObservation {
  KR_DECLARE_OBJECT_TYPE(CKRDemoChange, CKRObjectTypeImpl, "{7E0F1A2B-3C4D-4E5F-8A9B-0C1D2E3F4C01}")
public:
  CKRString m_What;
};
KR_IMPLEMENT_OBJECT_TYPE(CKRDemoChange, CKRObservation)

// A view that prints the changes it hears under its own name.
class CKRDemoView : public CKRView {
  KR_DECLARE_OBJECT_TYPE(CKRDemoView, CKRObjectTypeImpl, "{7E0F1A2B-3C4D-4E5F-8A9B-0C1D2E3F4C02}")
public:
  CKRString m_Name;
  void OnUpdate(CKRObservation* observation) override {
    if (auto* change = dynamic_cast<CKRDemoChange*>(observation))
      Print(CKRString::Formatted(L"  %s view shows: %s\n", m_Name.c_str(), change->m_What.c_str()));
  }
};
KR_IMPLEMENT_OBJECT_TYPE(CKRDemoView, CKRView)

// A line tool: a press starts a line, a release ends it and tells the model;
// Escape cancels.
class CKRDemoLineTool : public CKRTool {
  KR_DECLARE_SERIAL_TYPE(CKRDemoLineTool, CKRSerialObjectTypeImpl, "{7E0F1A2B-3C4D-4E5F-8A9B-0C1D2E3F4C03}")
public:
  CKRModel* m_pModel = nullptr;

  void OnMouseDown(int, unsigned int, CKRScreenPoint point, const WorldPoint& world) override {
    m_Start = world;
    m_Drawing = true;
    Print(CKRString::Formatted(L"  tool: press at pixel (%d, %d), world (%g, %g)\n", point.x, point.y, world[0], world[1]));
  }
  void OnMouseUp(int, unsigned int, CKRScreenPoint, const WorldPoint& world) override {
    if (!m_Drawing)
      return;
    m_Drawing = false;
    auto* change = static_cast<CKRDemoChange*>(CKRDemoChange::GetCKRDemoChangeType()->CreateInstance(CKRGuid()));
    change->m_What = CKRString::Formatted(L"line (%g, %g) - (%g, %g)", m_Start[0], m_Start[1], world[0], world[1]);
    m_pModel->NotifyObservers(change);
  }
  void OnKeyDown(unsigned int key, unsigned int, int, int) override {
    Print(CKRString::Formatted(L"  tool: key %u%s\n", key, key == kEscape && m_Drawing ? L", line cancelled" : L""));
    if (key == kEscape)
      m_Drawing = false;
  }

  static constexpr unsigned kEscape = 27;  // the ASCII escape character

private:
  WorldPoint m_Start;
  bool m_Drawing = false;
};
KR_IMPLEMENT_SERIAL_TYPE(CKRDemoLineTool, CKRTool)
void CKRDemoLineTool::CKRDemoLineToolType::CreateFields(CKRSerialObjectTypeImpl* target, IKRObject* object) {
  AppendParentFields(target, object);
}

namespace {
// What a window does with one piece of pointer or key input.
void Send(CKRMDIChildWnd& window, int kind, int first, int x, int y, double worldX, double worldY) {
  auto* event = static_cast<CKRToolEvent*>(CKRToolEvent::GetCKRToolEventType()->CreateInstance(CKRGuid()));
  event->m_Kind = kind;
  event->m_FirstParameter = first;
  event->m_PositionX = x;
  event->m_PositionY = y;
  event->m_WorldX = worldX;
  event->m_WorldY = worldY;
  window.RaiseEvent(event);  // the router releases the event after delivery
}
}  // namespace

void KRDemoTools() {
  CKRTypeSystem::Initialize(kRepository);
  auto* model = static_cast<CKRModel*>(CKRModelVoid::GetCKRModelVoidType()->CreateInstance(CKRGuid()));
  CKRDemoView* views[2] = {};
  const wchar_t* names[2] = {L"plan", L"list"};
  for (int i = 0; i < 2; ++i) {
    views[i] = static_cast<CKRDemoView*>(CKRDemoView::GetCKRDemoViewType()->CreateInstance(CKRGuid()));
    views[i]->m_Name = names[i];
    model->AddView(views[i]);
  }

  {
    CKRMDIChildWnd window(L"Drawing1");
    auto* tool = static_cast<CKRDemoLineTool*>(CKRDemoLineTool::GetCKRDemoLineToolType()->CreateInstance(CKRGuid()));
    tool->m_pModel = model;
    window.AddTool(tool);  // the window owns its tools
    Print(CKRString::Formatted(L"window \"%s\": %d tool, default tool %d, activated: %d\n", window.GetTitle().c_str(),
                               window.GetToolCount(), window.GetDefaultToolID(), window.SetDefaultTool()));
    Send(window, CKRToolEvent::KIND_MOUSE_DOWN, 1, 10, 20, 0.0, 0.0);
    Send(window, CKRToolEvent::KIND_MOUSE_MOVE, 1, 60, 20, 5.0, 0.0);
    Send(window, CKRToolEvent::KIND_MOUSE_UP, 1, 110, 70, 10.0, 5.0);
    Send(window, CKRToolEvent::KIND_MOUSE_DOWN, 1, 5, 5, -0.5, -0.5);
    Send(window, CKRToolEvent::KIND_KEY_DOWN, int(CKRDemoLineTool::kEscape), 0, 0, 0.0, 0.0);
    Send(window, CKRToolEvent::KIND_MOUSE_UP, 1, 8, 8, 1.0, 1.0);
  }

  model->RemoveView(views[1]->GetInstanceID());
  Print(L"the list view closed; the plan view still hears the model:\n");
  auto* change = static_cast<CKRDemoChange*>(CKRDemoChange::GetCKRDemoChangeType()->CreateInstance(CKRGuid()));
  change->m_What = L"drawing renamed";
  model->NotifyObservers(change);

  model->Release();
  for (CKRDemoView* view : views)
    view->Release();
}

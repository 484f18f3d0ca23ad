// Tools, tool events and their host: dispatch by kind, focus, activation
// and refusal, switching during delivery, and tools loaded from a store.
// Models and views.
#include <krCoreLib/objectmodel/CKRTypeSystem.h>

#include "KRFrameworkStore.h"
#include "KRFrameworkTestObjects.h"
#include "KRToolTestObjects.h"

#include <gtest/gtest.h>

#include <string>
#include <vector>

namespace {

using Log = std::vector<std::string>;
constexpr CKRGuid kRepository = CKRGuid::Literal("{6A000000-0000-4000-8000-0000000001F0}");

CKRToolEvent* Event(int kind) {
  auto* event = NewObject<CKRToolEvent>(CKRToolEvent::GetCKRToolEventType());
  event->m_Kind = kind;
  return event;
}

class CKRToolTest : public testing::Test {
protected:
  void SetUp() override { CKRTypeSystem::Initialize(kRepository); }

  // A tool in the host's table, logging under `name`.
  CKRTestTool* AddTool(const char* name, int refuse = 0) {
    auto* tool = NewObject<CKRTestTool>(CKRTestTool::GetCKRTestToolType());
    tool->m_Name = name;
    tool->m_pLog = &m_Log;
    tool->m_Refuse = refuse;
    EXPECT_GE(m_Host.AddTool(tool), 0);
    return tool;
  }

  Log m_Log;  // outlives the host, whose tools log when it closes
  CKRMDIChildWnd m_Host{L"host"};
};

// Each kind reaches its handler with the event's values; unknown kinds,
// focus changes and plain observations are counted but reach no handler
// of the wrong kind.
TEST_F(CKRToolTest, DispatchesEachKindToItsHandler) {
  CKRTestTool* tool = AddTool("t");
  ASSERT_EQ(m_Host.SetActiveTool(0), 1);
  const std::pair<int, const char*> cases[] = {
      {CKRToolEvent::KIND_MOUSE_DOWN, "t:down 7 8 9 -10 1.5 2.5 3.5 1"},
      {CKRToolEvent::KIND_MOUSE_MOVE, "t:move 7 8 9 -10 1.5 2.5 3.5 1"},
      {CKRToolEvent::KIND_MOUSE_UP, "t:up 7 8 9 -10 1.5 2.5 3.5 1"},
      {CKRToolEvent::KIND_KEY_DOWN, "t:keydown 7 8 9 -10"},
      {CKRToolEvent::KIND_KEY_UP, "t:keyup 7 8 9 -10"},
      {CKRToolEvent::KIND_PAINT, "t:paint 7 8 9 -10 empty 1"},
      {CKRToolEvent::KIND_MOUSE_WHEEL, "t:wheel -120 8 9 -10"},
      {CKRToolEvent::KIND_IGNORED, nullptr},
      {CKRToolEvent::KIND_MOUSE_LEAVE, "t:leave"},
      {9, nullptr},
      {-1, nullptr},
  };
  int updates = 0;
  for (const auto& [kind, expected] : cases) {
    SCOPED_TRACE(kind);
    CKRToolEvent* event = Event(kind);
    event->m_FirstParameter = 7;
    event->m_SecondParameter = 8;
    event->m_PositionX = 9;
    event->m_PositionY = -10;
    event->m_WheelDelta = -120;
    event->m_WorldX = 1.5;
    event->m_WorldY = 2.5;
    event->m_WorldZ = 3.5;
    m_Log.clear();
    m_Host.RaiseEvent(event);
    EXPECT_EQ(tool->m_Updates, ++updates);
    EXPECT_EQ(m_Log, expected != nullptr ? Log{expected} : Log{});
  }
  m_Log.clear();
  CKRWnd other(L"other");
  auto* focus = NewObject<CKRFocusEvent>(CKRFocusEvent::GetCKRFocusEventType());
  focus->m_Gained = true;
  focus->m_pWindow = &other;
  m_Host.RaiseEvent(focus);
  m_Host.RaiseEvent(NewObject<CKRFocusEvent>(CKRFocusEvent::GetCKRFocusEventType()));
  m_Host.RaiseEvent(NewObject<CKRObservation>(CKRObservation::GetCKRObservationType()));
  EXPECT_EQ(m_Log, (Log{"t:focus+ other", "t:focus- null"}));
  EXPECT_EQ(tool->m_Updates, updates + 3);
  // A tool needs no host to dispatch, and ignores null.
  tool->OnUpdate(nullptr);
  tool->ProcessToolEvent(nullptr);
}

TEST_F(CKRToolTest, ActivationSwitchesAndFallsBack) {
  EXPECT_EQ(m_Host.GetDefaultToolID(), -1);
  EXPECT_EQ(m_Host.SetDefaultTool(), 0);
  EXPECT_EQ(m_Host.SetActiveTool(0), 0);

  CKRTestTool* first = AddTool("t0");
  CKRTestTool* second = AddTool("t1");
  CKRTestTool* refusing = AddTool("t2", 1);
  EXPECT_EQ(m_Host.AddTool(first), -1);
  EXPECT_EQ(m_Host.AddTool(nullptr), -1);
  EXPECT_EQ(m_Host.GetDefaultToolID(), 0);
  ASSERT_EQ(m_Host.SetDefaultTool(), 1);
  EXPECT_EQ(first->GetWindow(), &m_Host);

  ASSERT_EQ(m_Host.SetActiveTool(1), 1);
  m_Host.RaiseEvent(Event(CKRToolEvent::KIND_MOUSE_LEAVE));
  EXPECT_EQ(m_Log, (Log{"t0:on", "t0:off", "t1:on", "t1:leave"}));
  EXPECT_EQ(first->m_Updates, 0);

  // Out of range or without a tool: refused, the active tool stays.
  EXPECT_EQ(m_Host.SetActiveTool(3), 0);
  EXPECT_EQ(m_Host.SetActiveTool(-2), 0);
  EXPECT_EQ(m_Host.GetActiveTool(), second);

  // A tool that refuses is told it is off again; the default takes over.
  m_Log.clear();
  EXPECT_EQ(m_Host.SetActiveTool(2), 1);
  EXPECT_EQ(m_Log, (Log{"t1:off", "t2:on", "t2:off", "t0:on"}));
  EXPECT_EQ(m_Host.GetActiveToolID(), 0);
  m_Host.RaiseEvent(Event(CKRToolEvent::KIND_MOUSE_LEAVE));
  EXPECT_EQ(refusing->m_Updates, 0);
  EXPECT_EQ(first->m_Updates, 1);

  // When the default refuses too, no tool is active.
  first->m_Refuse = 1;
  EXPECT_EQ(m_Host.SetActiveTool(2), 0);
  EXPECT_EQ(m_Host.GetActiveTool(), nullptr);
  EXPECT_EQ(m_Host.GetActiveToolID(), -1);
  m_Host.RaiseEvent(Event(CKRToolEvent::KIND_MOUSE_LEAVE));
  EXPECT_EQ(first->m_Updates + second->m_Updates + refusing->m_Updates, 2);
}

TEST_F(CKRToolTest, SwitchingDuringDeliveryTakesEffectAfterThePass) {
  CKRTestTool* first = AddTool("t0");
  CKRTestTool* second = AddTool("t1");
  ASSERT_EQ(m_Host.SetActiveTool(0), 1);
  // The first tool hands over on its first event and raises another.
  first->m_Hook = [&] {
    if (m_Log.back() == "t0:leave") {
      first->m_Hook = nullptr;
      m_Host.SetActiveTool(1);
      m_Host.RaiseEvent(Event(CKRToolEvent::KIND_KEY_DOWN));
    }
  };
  m_Log.clear();
  m_Host.RaiseEvent(Event(CKRToolEvent::KIND_MOUSE_LEAVE));
  m_Host.RaiseEvent(Event(CKRToolEvent::KIND_MOUSE_LEAVE));
  // The router's registrations hold still during a pass: the event raised
  // inside it still reaches the first tool, the next pass the second.
  EXPECT_EQ(m_Log, (Log{"t0:leave", "t0:off", "t1:on", "t0:keydown 0 0 0 0", "t1:leave"}));
  EXPECT_EQ(first->m_Updates, 2);
  EXPECT_EQ(second->m_Updates, 1);
}

// A loaded tool has its observer and works in a host.
TEST_F(CKRToolTest, LoadedToolKeepsWorking) {
  CKRFrameworkStore store;
  auto* tool = NewObject<CKRTestTool>(CKRTestTool::GetCKRTestToolType());
  ASSERT_EQ(store.Save({tool}), 1);
  auto* loaded = store.Load<CKRTestTool>(tool->GetInstanceID(), CKRTestTool::TypeID);
  tool->Release();
  ASSERT_NE(loaded, nullptr);
  ASSERT_NE(loaded->GetObserver(), nullptr);
  loaded->m_Name = "loaded";
  loaded->m_pLog = &m_Log;
  EXPECT_EQ(m_Host.AddTool(loaded), 0);
  ASSERT_EQ(m_Host.SetDefaultTool(), 1);
  m_Host.RaiseEvent(Event(CKRToolEvent::KIND_MOUSE_LEAVE));
  EXPECT_EQ(m_Log, (Log{"loaded:on", "loaded:leave"}));
}

// Views hear their model; other observers of the model are not views.
TEST(CKRModel, ViewsHearTheirModel) {
  CKRTypeSystem::Initialize(kRepository);
  auto* model = NewObject<CKRModelVoid>(CKRModelVoid::GetCKRModelVoidType());
  Log log;
  std::vector<CKRTestView*> views;
  for (const char* name : {"v0", "v1"}) {
    auto* view = NewObject<CKRTestView>(CKRTestView::GetCKRTestViewType());
    view->m_Name = name;
    view->m_pLog = &log;
    EXPECT_NE(model->AddView(view), 0);
    views.push_back(view);
  }
  auto* stranger = NewObject<CKRTestObserver>(CKRTestObserver::GetCKRTestObserverType());
  model->AddObserver(stranger, CKRObservation::TypeID);
  EXPECT_EQ(model->GetView(views[1]->GetInstanceID()), views[1]);
  EXPECT_EQ(model->GetView(stranger->GetInstanceID()), nullptr);

  auto* change = NewObject<CKRTestObservationA>(CKRTestObservationA::GetCKRTestObservationAType());
  change->m_Label = "edit";
  model->NotifyObservers(change);
  EXPECT_EQ(log, (Log{"v0:edit", "v1:edit"}));

  EXPECT_EQ(model->RemoveView(views[0]->GetInstanceID()), 1);
  EXPECT_EQ(model->RemoveView(views[0]->GetInstanceID()), 1);
  log.clear();
  model->NotifyObservers(NewObject<CKRObservation>(CKRObservation::GetCKRObservationType()));
  EXPECT_EQ(log, (Log{"v1:plain"}));

  model->Release();
  for (CKRTestView* view : views)
    view->Release();
  stranger->Release();
}

}  // namespace

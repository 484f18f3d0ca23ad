// Tools, tool events and their host: dispatch by kind, focus, activation
// and refusal, switching during delivery, and tools loaded from a store.
// Models and views.
#include <krCoreLib/objectmodel/CKRTypeSystem.h>

#include "KRFrameworkTestObjects.h"
#include "KRMemoryStore.h"
#include "KRToolTestObjects.h"

#include <gtest/gtest.h>

#include <string>
#include <vector>

namespace {

using Log = std::vector<std::string>;
constexpr CKRGuid kRepository = CKRGuid::Literal("{6A000000-0000-4000-8000-0000000001F0}");

CKRToolEvent* Event(int kind) {
  auto* event = static_cast<CKRToolEvent*>(CKRToolEvent::GetCKRToolEventType()->CreateInstance(CKRGuid()));
  event->m_Kind = kind;
  return event;
}

class CKRToolTest : public testing::Test {
protected:
  void SetUp() override { CKRTypeSystem::Initialize(kRepository); }

  // A tool in the host's table, logging under `name`.
  CKRTestTool* AddTool(const char* name, int refuse = 0) {
    auto* tool = static_cast<CKRTestTool*>(CKRTestTool::GetCKRTestToolType()->CreateInstance(CKRGuid()));
    tool->m_Name = name;
    tool->m_pLog = &m_Log;
    tool->m_Refuse = refuse;
    EXPECT_GE(m_Host.AddTool(tool), 0);
    return tool;
  }

  Log m_Log;  // outlives the host, whose tools log when it closes
  CKRMDIChildWnd m_Host{L"host"};
};

TEST_F(CKRToolTest, DispatchesEachKindToItsHandler) {
  CKRTestTool* tool = AddTool("t");
  ASSERT_EQ(m_Host.SetActiveTool(0), 1);
  m_Log.clear();
  struct Case {
    int m_Kind;
    const char* m_Expected;  // null: no handler
  };
  const Case cases[] = {
      {CKRToolEvent::KIND_MOUSE_DOWN, "t:down 7 8 (9,-10) [1.5 2.5 3.5 1]"},
      {CKRToolEvent::KIND_MOUSE_MOVE, "t:move 7 8 (9,-10) [1.5 2.5 3.5 1]"},
      {CKRToolEvent::KIND_MOUSE_UP, "t:up 7 8 (9,-10) [1.5 2.5 3.5 1]"},
      {CKRToolEvent::KIND_KEY_DOWN, "t:keydown 7 8 9 -10"},
      {CKRToolEvent::KIND_KEY_UP, "t:keyup 7 8 9 -10"},
      {CKRToolEvent::KIND_PAINT, "t:paint 7 8 (9,-10) empty 1"},
      {CKRToolEvent::KIND_MOUSE_WHEEL, "t:wheel -120 8 (9,-10)"},
      {7, nullptr},
      {CKRToolEvent::KIND_MOUSE_LEAVE, "t:leave"},
      {9, nullptr},
      {-1, nullptr},
  };
  int updates = 0;
  for (const Case& c : cases) {
    SCOPED_TRACE(c.m_Kind);
    CKRToolEvent* event = Event(c.m_Kind);
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
    EXPECT_EQ(m_Log, c.m_Expected != nullptr ? Log{c.m_Expected} : Log{});
  }
}

TEST_F(CKRToolTest, FocusAndOtherObservations) {
  CKRTestTool* tool = AddTool("t");
  ASSERT_EQ(m_Host.SetActiveTool(0), 1);
  m_Log.clear();
  CKRWnd other(L"other");
  auto* focus = static_cast<CKRFocusEvent*>(CKRFocusEvent::GetCKRFocusEventType()->CreateInstance(CKRGuid()));
  focus->m_Gained = true;
  focus->m_pWindow = &other;
  m_Host.RaiseEvent(focus);
  auto* lost = static_cast<CKRFocusEvent*>(CKRFocusEvent::GetCKRFocusEventType()->CreateInstance(CKRGuid()));
  m_Host.RaiseEvent(lost);
  m_Host.RaiseEvent(static_cast<CKRObservation*>(CKRObservation::GetCKRObservationType()->CreateInstance(CKRGuid())));
  EXPECT_EQ(m_Log, (Log{"t:focus+ other", "t:focus- null"}));
  EXPECT_EQ(tool->m_Updates, 3);
  // A tool needs no host to dispatch, and ignores null.
  tool->OnUpdate(nullptr);
  tool->ProcessToolEvent(nullptr);
}

TEST_F(CKRToolTest, ActivationSwitchesAndFallsBack) {
  EXPECT_EQ(m_Host.GetDefaultToolID(), -1);
  EXPECT_EQ(m_Host.SetDefaultTool(), 0);
  EXPECT_EQ(m_Host.SetActiveTool(0), 0);
  EXPECT_EQ(m_Host.GetActiveToolID(), -1);

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
  EXPECT_EQ(m_Host.GetActiveToolID(), 1);

  // Out of range or without a tool: refused, the active tool stays.
  EXPECT_EQ(m_Host.SetActiveTool(3), 0);
  EXPECT_EQ(m_Host.SetActiveTool(-2), 0);
  EXPECT_EQ(m_Host.GetActiveTool(), second);

  // A tool that refuses is told it is off again; the default takes over.
  m_Log.clear();
  EXPECT_EQ(m_Host.SetActiveTool(2), 1);
  EXPECT_EQ(m_Log, (Log{"t1:off", "t2:on", "t2:off", "t0:on"}));
  EXPECT_EQ(m_Host.GetActiveTool(), first);
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

TEST_F(CKRToolTest, TypeAndLoadedToolKeepWorking) {
  CKRTool::GetCKRToolType()->CreateFields(CKRTool::GetCKRToolType(), nullptr);
  EXPECT_EQ(CKRTool::GetCKRToolType()->GetName(), L"Tool");
  EXPECT_EQ(CKRTool::GetCKRToolType()->GetDescription(), L"A Tool");

  const CKRGuid documentID = CKRGuid::CreateNewGUID();
  SKRStoredMedium medium;
  CKRGuid toolID;
  {
    auto* archive = static_cast<CKRMemoryArchive*>(CKRMemoryArchive::GetCKRMemoryArchiveType()->CreateInstance(CKRGuid()));
    archive->SetMedium(&medium);
    ASSERT_TRUE(archive->Open(CKRArchive::AccessWrite));
    auto* tool = static_cast<CKRTestTool*>(CKRTestTool::GetCKRTestToolType()->CreateInstance(CKRGuid()));
    toolID = tool->GetInstanceID();
    EXPECT_TRUE(tool->SerializeTo(archive->CreateNewDocument(documentID, nullptr)));
    archive->Release();
    tool->Release();
  }
  auto* archive = static_cast<CKRMemoryArchive*>(CKRMemoryArchive::GetCKRMemoryArchiveType()->CreateInstance(CKRGuid()));
  archive->SetMedium(&medium);
  ASSERT_TRUE(archive->Open(CKRArchive::AccessRead));
  auto* document = static_cast<CKRDocument*>(archive->GetDocumentCollection()->Find(documentID));
  ASSERT_NE(document, nullptr);
  auto* loaded = dynamic_cast<CKRTestTool*>(document->GetObject(toolID, CKRTestTool::TypeID));
  ASSERT_NE(loaded, nullptr);
  ASSERT_NE(loaded->GetObserver(), nullptr);
  archive->Release();
  loaded->m_Name = "loaded";
  loaded->m_pLog = &m_Log;
  EXPECT_EQ(m_Host.AddTool(loaded), 0);
  ASSERT_EQ(m_Host.SetDefaultTool(), 1);
  m_Host.RaiseEvent(Event(CKRToolEvent::KIND_MOUSE_LEAVE));
  EXPECT_EQ(m_Log, (Log{"loaded:on", "loaded:leave"}));
}

TEST(CKRModel, ViewsHearTheirModel) {
  CKRTypeSystem::Initialize(kRepository);
  auto* model = static_cast<CKRModelVoid*>(CKRModelVoid::GetCKRModelVoidType()->CreateInstance(CKRGuid()));
  Log log;
  std::vector<CKRTestView*> views;
  for (const char* name : {"v0", "v1"}) {
    auto* view = static_cast<CKRTestView*>(CKRTestView::GetCKRTestViewType()->CreateInstance(CKRGuid()));
    view->m_Name = name;
    view->m_pLog = &log;
    EXPECT_NE(model->AddView(view), 0);
    views.push_back(view);
  }
  auto* stranger = static_cast<CKRTestObserver*>(CKRTestObserver::GetCKRTestObserverType()->CreateInstance(CKRGuid()));
  model->AddObserver(stranger, CKRObservation::TypeID);

  EXPECT_EQ(model->GetView(views[1]->GetInstanceID()), views[1]);
  EXPECT_EQ(model->GetView(stranger->GetInstanceID()), nullptr);
  EXPECT_EQ(model->GetView(CKRGuid::CreateNewGUID()), nullptr);
  EXPECT_NE(model->GetInterface(IID_IKRSerializable), nullptr);
  EXPECT_EQ(model->GetThisObject(), model);

  auto* change = static_cast<CKRTestObservationA*>(CKRTestObservationA::GetCKRTestObservationAType()->CreateInstance(CKRGuid()));
  change->m_Label = "edit";
  model->NotifyObservers(change);
  EXPECT_EQ(log, (Log{"v0:edit", "v1:edit"}));

  EXPECT_EQ(model->RemoveView(views[0]->GetInstanceID()), 1);
  EXPECT_EQ(model->RemoveView(views[0]->GetInstanceID()), 1);
  EXPECT_EQ(model->GetView(views[0]->GetInstanceID()), nullptr);
  log.clear();
  model->NotifyObservers(static_cast<CKRObservation*>(CKRObservation::GetCKRObservationType()->CreateInstance(CKRGuid())));
  EXPECT_EQ(log, (Log{"v1:plain"}));

  model->Release();
  for (CKRTestView* view : views)
    view->Release();
  stranger->Release();
}

}  // namespace

#include "KRPluginTestSupport.h"

using namespace KRPluginTest;
using namespace KRExamplePlugins;

namespace {

constexpr CKRGuid kMenuSocketID = CKRGuid::Literal("{AAAAAAAA-0000-4000-8000-0000000000F3}");

// An in-process plug-in whose command target the tests fill: a handler
// that logs, answering as told.
struct SKRLogHandler : IKRPluginCmdHandler {
  SKRLogHandler(std::vector<CKRString>* log, const wchar_t* name, int answer)
      : m_pLog(log), m_Name(name), m_Answer(answer) {}
  std::vector<CKRString>* m_pLog;
  const wchar_t* m_Name;
  int m_Answer;
  int OnCommand(CKRGuid, CKRString argument, void*) override {
    m_pLog->push_back(CKRString(m_Name) + L" command " + argument);
    return m_Answer;
  }
  int OnCommandUI(CKRGuid, CKRCmdUI* update) override {
    m_pLog->push_back(CKRString(m_Name) + L" update");
    if (update != nullptr)
      update->Enable(false);
    return m_Answer;
  }
};

class CKRTestCmdPlugin : public CKRPlugin {
  KR_DECLARE_OBJECT_TYPE(CKRTestCmdPlugin, CKRObjectTypeImpl, "{AAAAAAAA-0000-4000-8000-0000000000F4}")

public:
  void* GetInterface(CKRGuid iid) override {
    if (void* view = CKRPlugin::GetInterface(iid))
      return view;
    if (iid == IID_IKRPluginSocketCmdRegistrant || iid == IID_IKRPluginSocketCmdListener)
      return static_cast<IKRPluginSocketCmdRegistrant*>(&m_Target);
    return nullptr;
  }
  int ShouldFilter(CKRGuid) override { return 0; }
  int ShouldRegister(CKRPluginSocket*) override { return 1; }
  CKRPluginCfg* GetConfiguration() override { return nullptr; }
  CKRPluginCmdTarget m_Target;

protected:
  CKRTestCmdPlugin() = default;
};

KR_IMPLEMENT_OBJECT_TYPE(CKRTestCmdPlugin, CKRPlugin)

CKRTestCmdPlugin* NewCmdPlugin() {
  return dynamic_cast<CKRTestCmdPlugin*>(CKRTestCmdPlugin::GetCKRTestCmdPluginType()->CreateInstance(CKRGuid()));
}

// The items of a menu as "text#id", "-" for a separator.
std::vector<std::wstring> Items(HMENU menu) {
  std::vector<std::wstring> items;
  for (int i = 0; i < GetMenuItemCount(menu); ++i) {
    const unsigned state = GetMenuState(menu, static_cast<unsigned>(i), MF_BYPOSITION);
    if (state == MF_SEPARATOR)
      items.push_back(L"-");
    else
      items.push_back(GetMenuStringW(menu, static_cast<unsigned>(i), MF_BYPOSITION).str() + L"#" +
                      std::to_wstring(GetMenuItemID(menu, i)));
  }
  return items;
}

using CKRPluginSocketTest = CKRPluginTest;

}  // namespace

// The menu lists the menu commands of the visible plug-ins, a separator
// between plug-ins; command numbers are given once, in listing order, and
// kept across rebuilds; filters hide plug-ins, error plug-ins always.
TEST_F(CKRPluginSocketTest, MenuSocketBuildsStableMenusAndFilters) {
  CKRPluginManager::LoadPlugin(Wide(ExampleModule("shapes")));
  CKRPluginManager::LoadPlugin(Wide(ExampleModule("notes")));
  CKRPluginManager::LoadPlugin(Wide(BrokenModule(2)));  // an error plug-in
  HMENU bar = CreatePopupMenu();
  auto* socket = NewSocket<CKRPluginSocketMnu>(CKRPluginSocketMnu::GetCKRPluginSocketMnuType());
  ASSERT_NE(socket, nullptr);
  EXPECT_EQ(socket->GetPopupMenu(), nullptr);
  socket->RegisterWithManager();
  socket->Update();  // no pop-up yet: nothing happens
  socket->Attach(bar, L"&Plugins", kMenuSocketID);
  socket->Attach(bar, L"&Plugins", kMenuSocketID);  // same parent: no second pop-up
  EXPECT_EQ(socket->GetID(), kMenuSocketID);
  ASSERT_EQ(GetMenuItemCount(bar), 1);
  EXPECT_EQ(GetMenuStringW(bar, 0, MF_BYPOSITION), L"&Plugins");
  HMENU popup = socket->GetPopupMenu();
  ASSERT_EQ(GetSubMenu(bar, 0), popup);
  const std::vector<std::wstring> expected = {L"Draw &Hexagon#2345", L"Draw &Square#2346", L"-", L"&New Note#2347",
                                              L"&Clear Notes#2348"};
  EXPECT_EQ(Items(popup), expected);
  EXPECT_EQ(GetMenuState(bar, 0, MF_BYPOSITION), MF_POPUP | (5u << 8));
  socket->Update();
  CKRPluginManager::UpdateAllSockets();
  EXPECT_EQ(Items(popup), expected);

  // The error plug-in joined no socket; registered by hand it shows as an
  // empty group until any filter hides it.
  CKRPlugin* error = Plugins().back();
  socket->RegisterPlugin(error);
  socket->Update();
  EXPECT_EQ(Items(popup).size(), expected.size() + 1);
  socket->ApplyFilter(CKRGuid());
  socket->Update();
  EXPECT_EQ(Items(popup), expected);
  socket->ApplyFilter(kHideShapes);
  socket->Update();
  EXPECT_EQ(Items(popup), (std::vector<std::wstring>{L"&New Note#2347", L"&Clear Notes#2348"}));
  EXPECT_EQ(socket->GetRegisteredPlugins().GetCount(), 3);

  // A socket attached elsewhere after SetNextCmdID lists the commands with
  // the numbers they already have.
  CKRPluginManager::SetNextCmdID(9000);
  HMENU other = CreatePopupMenu();
  auto* second = NewSocket<CKRPluginSocketMnu>(CKRPluginSocketMnu::GetCKRPluginSocketMnuType());
  second->RegisterWithManager();
  second->Attach(other, L"More", kMenuSocketID);
  EXPECT_EQ(Items(second->GetPopupMenu()), expected);

  // A socket whose parent menu was destroyed under it stays harmless.
  DestroyMenu(bar);
  socket->Update();
  EXPECT_FALSE(IsMenu(popup));
  CKRPluginManager::ReleaseAllPlugins();
  socket->Release();
  second->Release();
  DestroyMenu(other);
}

// Command messages reach the example plug-ins through the command socket:
// by number (only the low 16 bits name the code), by ID with an argument,
// update requests with the update object; nothing once the manager is gone.
TEST_F(CKRPluginSocketTest, CommandSocketRoutesToTheExamplePlugins) {
  auto* commands = NewSocket<CKRPluginSocketCmd>(CKRPluginSocketCmd::GetCKRPluginSocketCmdType());
  auto* menu = NewSocket<CKRPluginSocketMnu>(CKRPluginSocketMnu::GetCKRPluginSocketMnuType());
  commands->RegisterWithManager();
  menu->RegisterWithManager();
  HMENU bar = CreatePopupMenu();
  menu->Attach(bar, L"Plugins", kMenuSocketID);
  CKRPluginManager::LoadPlugins(Wide(KR_EXAMPLE_PLUGIN_DIR));
  HMENU popup = menu->GetPopupMenu();
  ASSERT_EQ(GetMenuItemCount(popup), 5);
  CKRPlugin* shapes = PluginNamed(L"Shapes");

  const unsigned square = GetMenuItemID(popup, 1);
  EXPECT_EQ(commands->OnCmdMsg(square, KR_CN_COMMAND, nullptr, nullptr), 1);
  EXPECT_EQ(commands->OnCmdMsg(GetMenuItemID(popup, 0), 0x10000u, nullptr, nullptr), 1);
  EXPECT_EQ(shapes->GetConfiguration()->m_Description, L"Drew a hexagon (2 so far)");
  EXPECT_EQ(commands->OnCmdMsg(1, KR_CN_COMMAND, nullptr, nullptr), 0);
  EXPECT_EQ(commands->OnCmdMsg(9999, KR_CN_UPDATE_COMMAND_UI, nullptr, nullptr), 0);
  const unsigned clear = GetMenuItemID(popup, 4);
  CKRCmdUI clearState(clear);
  EXPECT_EQ(commands->OnCmdMsg(clear, KR_CN_UPDATE_COMMAND_UI, &clearState, nullptr), 1);
  EXPECT_FALSE(clearState.IsEnabled());  // no notes yet
  EXPECT_EQ(commands->OnCmdMsg(clear, 7, nullptr, nullptr), 1);  // neither command nor update: taken

  // By ID; a command handled by another object than its target never
  // answers for the target (notes), a target that handles it does (shapes).
  EXPECT_EQ(commands->OnCommand(kNewNote, L"buy milk", nullptr), 0);
  EXPECT_EQ(PluginNamed(L"Notes")->GetConfiguration()->m_Description, L"1 notes: buy milk");
  EXPECT_EQ(commands->OnCommand(kResetShapes, L"", nullptr), 1);
  EXPECT_EQ(commands->OnCommand(CKRGuid::CreateNewGUID(), L"", nullptr), 0);
  CKRCmdUI again(clear);
  commands->OnCmdMsg(clear, KR_CN_UPDATE_COMMAND_UI, &again, nullptr);
  EXPECT_TRUE(again.IsEnabled());

  CKRPluginManager::Release();
  EXPECT_EQ(commands->OnCmdMsg(square, KR_CN_COMMAND, nullptr, nullptr), 0);
  commands->Release();
  menu->Release();
  DestroyMenu(bar);
}

// The routing order: socket, then targets in registration order (the
// target's own table first, then its commands in insertion order); the
// first nonzero answer wins.
TEST_F(CKRPluginSocketTest, RoutingOrderAndFirstAnswerWins) {
  std::vector<CKRString> log;
  SKRLogHandler quiet(&log, L"quiet", 0);
  SKRLogHandler loud(&log, L"loud", 1);
  const CKRGuid shared = CKRGuid::CreateNewGUID();
  CKRTestCmdPlugin* first = NewCmdPlugin();
  CKRTestCmdPlugin* second = NewCmdPlugin();
  first->m_Target.AddCmd(CKRPluginCmd(shared, L"A", L"", &quiet, KR_PLUGINCMD_MENU));
  first->m_Target.AddCmd(CKRPluginCmd(shared, L"B", L"", &loud, KR_PLUGINCMD_MENU));
  second->m_Target.AddCmd(CKRPluginCmd(shared, L"C", L"", &loud, 0));
  first->m_Target.GetCmd(0)->m_CmdID = 10;
  first->m_Target.GetCmd(1)->m_CmdID = 10;
  second->m_Target.GetCmd(0)->m_CmdID = 10;
  auto* socket = NewSocket<CKRPluginSocketCmd>(CKRPluginSocketCmd::GetCKRPluginSocketCmdType());
  socket->RegisterPlugin(first);
  socket->RegisterPlugin(second);
  socket->RegisterPlugin(first);  // recorded once

  // By number: the first command with that number takes it, whatever its
  // handler answers.
  EXPECT_EQ(socket->OnCmdMsg(10, KR_CN_COMMAND, nullptr, nullptr), 1);
  EXPECT_EQ(log, (std::vector<CKRString>{L"quiet command "}));
  log.clear();
  CKRCmdUI state(10);
  EXPECT_EQ(socket->OnCmdMsg(10, KR_CN_UPDATE_COMMAND_UI, &state, nullptr), 1);
  EXPECT_EQ(log, (std::vector<CKRString>{L"quiet update"}));
  EXPECT_FALSE(state.IsEnabled());
  // By ID: every command's handler hears it, none answers for the target.
  log.clear();
  EXPECT_EQ(socket->OnCommand(shared, L"x", nullptr), 0);
  EXPECT_EQ(log, (std::vector<CKRString>{L"quiet command x", L"loud command x", L"loud command x"}));

  // The target's own table comes first; asked only who would handle, the
  // first target names itself.
  bool own = false;
  second->m_Target.SetCommandHandler(10, [&own] { own = true; });
  socket->UnregisterPlugin(first);
  log.clear();
  EXPECT_EQ(socket->OnCmdMsg(10, KR_CN_COMMAND, nullptr, nullptr), 1);
  EXPECT_TRUE(own);
  EXPECT_TRUE(log.empty());
  socket->RegisterPlugin(first);
  SKRCmdHandlerInfo info;
  EXPECT_EQ(socket->OnCmdMsg(10, KR_CN_COMMAND, nullptr, &info), 1);
  EXPECT_EQ(info.m_pTarget, &second->m_Target);
  EXPECT_TRUE(log.empty());

  // A command without handler is taken and does nothing; commands added
  // without handler are handled by their target.
  CKRPluginCmd bare(shared, L"", L"", nullptr, 0);
  bare.m_CmdID = 11;
  EXPECT_EQ(bare.OnCmdMsg(11, KR_CN_COMMAND, nullptr, nullptr), 1);
  EXPECT_EQ(bare.OnCmdMsg(12, KR_CN_COMMAND, nullptr, nullptr), 0);
  first->m_Target.AddCmd(bare);
  EXPECT_EQ(first->m_Target.GetCmd(2)->m_pHandler, static_cast<IKRPluginCmdHandler*>(&first->m_Target));
  EXPECT_EQ(first->m_Target.GetCmd(3), nullptr);
  EXPECT_EQ(first->m_Target.GetCmd(-1), nullptr);
  socket->Release();
  first->Release();
  second->Release();
}

// Handlers that point at each other's targets pass a command on once and
// come back with 0: no endless loop.
TEST_F(CKRPluginSocketTest, TargetsHandlingEachOthersCommandsDoNotLoop) {
  CKRTestCmdPlugin* left = NewCmdPlugin();
  CKRTestCmdPlugin* right = NewCmdPlugin();
  const CKRGuid id = CKRGuid::CreateNewGUID();
  left->m_Target.AddCmd(CKRPluginCmd(id, L"L", L"", &right->m_Target, 0));
  right->m_Target.AddCmd(CKRPluginCmd(id, L"R", L"", &left->m_Target, 0));
  auto* socket = NewSocket<CKRPluginSocketCmd>(CKRPluginSocketCmd::GetCKRPluginSocketCmdType());
  socket->RegisterPlugin(left);
  EXPECT_EQ(socket->OnCommand(id, L"", nullptr), 0);
  socket->Release();
  left->Release();
  right->Release();
}

#include "KRPluginTestSupport.h"

#include <fstream>

#include <sys/stat.h>
#include <unistd.h>

using namespace KRPluginTest;
using namespace KRExamplePlugins;

KR_IMPLEMENT_OBJECT_TYPE(CKRCountingSocket, CKRPluginSocket)

namespace {

// The plug-in class type IDs of the example modules and of the broken
// test modules.
constexpr CKRGuid kShapesPluginTypeID = CKRGuid::Literal("{5A3C1E20-7B14-4F0A-9C61-2E8D4B7A1003}");
constexpr CKRGuid kNotesFieldID = CKRGuid::Literal("{5A3C1E20-7B14-4F0A-9C61-2E8D4B7A2302}");
constexpr CKRGuid kBrokenThingTypeID = CKRGuid::Literal("{0B0B0B0B-0000-4000-8000-00000000B001}");
constexpr CKRGuid kBrokenPluginTypeID = CKRGuid::Literal("{0B0B0B0B-0000-4000-8000-00000000B002}");

using CKRPluginManagerTest = CKRPluginTest;

void Copy(const std::string& from, const std::string& to) {
  std::filesystem::copy_file(from, to, std::filesystem::copy_options::overwrite_existing);
}

}  // namespace

TEST_F(CKRPluginManagerTest, LoadsAFolderClaimsItsTypesAndReleasesThemWithTheModules) {
  CKRCountingSocket* socket = NewSocket<CKRCountingSocket>(CKRCountingSocket::GetCKRCountingSocketType());
  socket->RegisterWithManager();
  EXPECT_EQ(socket->m_Updates, 1);
  CKRPluginManager::LoadPlugins(Wide(KR_EXAMPLE_PLUGIN_DIR));
  EXPECT_EQ(socket->m_Updates, 2);  // once, after every module

  ASSERT_EQ(Plugins().size(), 2u);
  CKRPlugin* shapes = PluginNamed(L"Shapes");
  CKRPlugin* notes = PluginNamed(L"Notes");
  ASSERT_TRUE(shapes != nullptr && notes != nullptr);
  EXPECT_EQ(shapes->GetConfiguration()->m_PluginID, kShapesPluginID);
  EXPECT_EQ(socket->GetRegisteredPlugins().GetCount(), 2);
  // Claimed: linked to the library's types, initialised (the storable
  // configuration and plug-in have their fields), in a repository per module.
  EXPECT_EQ(shapes->IsTypeOf(CKRPlugin::TypeID), 1);
  EXPECT_EQ(notes->GetConfiguration()->IsTypeOf(CKRPluginCfg::TypeID), 1);
  EXPECT_NE(static_cast<IKRSerializable*>(notes->GetInterface(IID_IKRSerializable))->GetFieldData(kNotesFieldID), nullptr);
  EXPECT_NE(static_cast<IKRSerializable*>(notes->GetConfiguration()->GetInterface(IID_IKRSerializable))
                ->GetFieldData(CKRPluginCfg::NameFieldID),
            nullptr);
  const auto& records = CKRPluginManager::GetManager()->GetRecords();
  ASSERT_EQ(records.size(), 2u);
  EXPECT_NE(records[0].m_RepositoryID, records[1].m_RepositoryID);
  EXPECT_EQ(shapes->GetType()->GetRepositoryID(), records[records[0].m_pPlugin == shapes ? 0 : 1].m_RepositoryID);

  // Released without the host releasing any repository: the plug-in leaves
  // the socket, its types leave the type system, its module is unmapped,
  // and an instance of the module's class that the host made and forgot
  // ends before its code goes (the leak check of the sanitizer build sees
  // it otherwise).
  ASSERT_NE(CKRTypeSystem::FindType(kShapesPluginTypeID)->CreateInstance(CKRGuid()), nullptr);
  CKRPluginManager::ReleasePlugin(shapes);
  EXPECT_FALSE(socket->GetRegisteredPlugins().Contains(shapes));
  EXPECT_EQ(socket->GetVisiblePlugins().GetCount(), 1);
  EXPECT_EQ(CKRTypeSystem::FindType(kShapesPluginTypeID), nullptr);
  EXPECT_FALSE(IsMapped(ExampleModule("shapes")));
  CKRPluginManager::ReleasePlugin(shapes);  // no longer held: nothing happens
  CKRPluginManager::ReleasePlugin(nullptr);

  CKRPluginManager::ReleaseAllPlugins();
  EXPECT_EQ(socket->GetRegisteredPlugins().GetCount(), 0);
  EXPECT_TRUE(Plugins().empty());
  EXPECT_FALSE(IsMapped(ExampleModule("notes")));
  CKRPluginManager::UnregisterSocket(socket);
  socket->Release();
}

TEST_F(CKRPluginManagerTest, OneRecordPerPathAndPerPluginID) {
  CKRScratchFolder scratch;
  Copy(ExampleModule("shapes"), scratch.Path("shapes.plg"));
  Copy(ExampleModule("shapes"), scratch.Path("shapes-copy.plg"));
  const CKRString path = Wide(scratch.Path("shapes.plg"));
  CKRPluginManager::LoadPlugin(path);
  CKRPluginManager::LoadPlugin(path);
  CKRString shouted = path;
  CKRPluginManager::LoadPlugin(shouted.MakeUpper());
  EXPECT_EQ(CKRPluginManager::GetManager()->GetRecords().size(), 1u);

  // Another file whose plug-in has the same ID: discarded, module unloaded.
  CKRPluginManager::LoadPlugin(Wide(scratch.Path("shapes-copy.plg")));
  EXPECT_EQ(Plugins().size(), 1u);
  EXPECT_FALSE(IsMapped(scratch.Path("shapes-copy.plg")));
  EXPECT_TRUE(IsMapped(scratch.Path("shapes.plg")));
  EXPECT_EQ(CKRTypeSystem::FindType(kShapesPluginTypeID), Plugins()[0]->GetType());
}

// Every way a module can fail gives an error plug-in that names the reason,
// joins no socket, is hidden by every filter, leaves no module mapped and
// no type of the module registered; the host goes on loading.
TEST_F(CKRPluginManagerTest, BrokenModulesBecomeErrorPlugins) {
  CKRScratchFolder scratch;
  std::ofstream(scratch.Path("text.plg")) << std::string(200, 'x');  // longer than an ELF header
  std::ofstream(scratch.Path("empty.plg")).flush();
  std::filesystem::create_directory(scratch.Path("x.plg"));
  struct SKRCase {
    std::string m_Path;
    const char* m_Reason;  // the description, or a part of the loader's text
    bool m_Exact;
  };
  const std::vector<SKRCase> cases = {
      {scratch.Path("text.plg"), "invalid ELF header", false},
      {scratch.Path("empty.plg"), "file too short", false},
      {scratch.Path("x.plg"), "Is a directory", false},
      {scratch.Path("missing.plg"), "No such file or directory", false},
      {BrokenModule(1), "undefined symbol: GetPluginType", false},
      {BrokenModule(2), "Internal Plugin Error", true},
      {BrokenModule(3), "Couldn't Load Plugin", true},
      {BrokenModule(4), "Couldn't Load Plugin", true},
      {BrokenModule(5), "Couldn't Load Plugin", true},
      // Whether the exception ends the trial process or comes out of its
      // loader depends on the build: either way the module is refused.
      {BrokenModule(6), "the module's initialisation", false},
  };
  CKRCountingSocket* socket = NewSocket<CKRCountingSocket>(CKRCountingSocket::GetCKRCountingSocketType());
  socket->RegisterWithManager();
  for (std::size_t i = 0; i < cases.size(); ++i) {
    const SKRCase& c = cases[i];
    SCOPED_TRACE(c.m_Path);
    CKRPluginManager::LoadPlugin(Wide(c.m_Path));
    ASSERT_EQ(Plugins().size(), i + 1);
    CKRPlugin* error = Plugins().back();
    ASSERT_NE(error->GetConfiguration(), nullptr);
    EXPECT_EQ(error->GetConfiguration()->m_Name, L"Plugin Error");
    EXPECT_EQ(error->GetConfiguration()->m_PluginID, CKRPluginError::TypeID);
    const std::string description = error->GetConfiguration()->m_Description.ToUtf8();
    if (c.m_Exact)
      EXPECT_EQ(description, c.m_Reason);
    else
      EXPECT_NE(description.find(c.m_Reason), std::string::npos) << description;
    EXPECT_EQ(CKRPluginManager::GetManager()->GetRecords().back().m_hModule, nullptr);
    EXPECT_EQ(error->ShouldFilter(CKRGuid()), 1);
    EXPECT_FALSE(IsMapped(c.m_Path));
    EXPECT_EQ(CKRTypeSystem::FindType(kBrokenThingTypeID), nullptr);
    EXPECT_EQ(CKRTypeSystem::FindType(kBrokenPluginTypeID), nullptr);
  }
  EXPECT_EQ(socket->GetRegisteredPlugins().GetCount(), 0);
  EXPECT_EQ(socket->m_Updates, 1);  // LoadPlugin alone never updates

  // A working module still loads after all that.
  CKRPluginManager::LoadPlugin(Wide(ExampleModule("notes")));
  EXPECT_EQ(socket->GetRegisteredPlugins().GetCount(), 1);
  CKRPluginManager::ReleaseAllPlugins();
  EXPECT_TRUE(CKRPluginManager::GetManager()->GetRecords().empty());
  socket->Release();  // leaves the manager on its own
  EXPECT_FALSE(CKRPluginManager::GetSocketIterator().Next(1));
}

// A folder's new modules are tried together; one whose initialisation
// throws or crashes ends that trial, and the others still load.
TEST_F(CKRPluginManagerTest, FolderWithModulesThatFailAtLoadStillLoadsTheRest) {
  CKRScratchFolder scratch;
  Copy(ExampleModule("shapes"), scratch.Path("a-shapes.plg"));
  Copy(BrokenModule(6), scratch.Path("b-throws.plg"));
  Copy(BrokenModule(6), scratch.Path("c-throws.plg"));
  Copy(ExampleModule("notes"), scratch.Path("d-notes.plg"));
  CKRPluginManager::LoadPlugins(Wide(scratch.Root()));
  ASSERT_EQ(Plugins().size(), 4u);
  EXPECT_NE(PluginNamed(L"Shapes"), nullptr);
  EXPECT_NE(PluginNamed(L"Notes"), nullptr);
  int errors = 0;
  for (CKRPlugin* plugin : Plugins())
    errors += plugin->GetConfiguration()->m_Name == L"Plugin Error" ? 1 : 0;
  EXPECT_EQ(errors, 2);
}

TEST_F(CKRPluginManagerTest, MissingOrUnreadableFolderLoadsNothingAndUpdatesNothing) {
  CKRCountingSocket* socket = NewSocket<CKRCountingSocket>(CKRCountingSocket::GetCKRCountingSocketType());
  CKRPluginManager::RegisterSocket(socket);
  CKRPluginManager::RegisterSocket(socket);  // once only
  EXPECT_EQ(socket->m_Updates, 1);
  CKRScratchFolder scratch;
  std::ofstream(scratch.Path("file")) << "a file, not a folder";
  for (const std::string& folder : {scratch.Path("missing"), scratch.Path("file"), std::string()})
    CKRPluginManager::LoadPlugins(Wide(folder));
  if (geteuid() != 0) {  // the superuser reads any folder
    std::filesystem::create_directory(scratch.Path("locked"));
    Copy(ExampleModule("shapes"), scratch.Path("locked/shapes.plg"));
    chmod(scratch.Path("locked").c_str(), 0);
    CKRPluginManager::LoadPlugins(Wide(scratch.Path("locked")));
    chmod(scratch.Path("locked").c_str(), 0700);
  }
  EXPECT_TRUE(Plugins().empty());
  EXPECT_LE(socket->m_Updates, 2);
  socket->Release();
}

// Loading, releasing and loading the same modules again in one process:
// each round gets fresh type objects and a working plug-in, and nothing of
// the previous round is left (the sanitizer build checks the memory).
TEST_F(CKRPluginManagerTest, LoadReleaseAndReloadTheSameModules) {
  for (int round = 0; round < 3; ++round) {
    SCOPED_TRACE(round);
    CKRPluginSocketCmd* socket = NewSocket<CKRPluginSocketCmd>(CKRPluginSocketCmd::GetCKRPluginSocketCmdType());
    socket->RegisterWithManager();
    CKRPluginManager::LoadPlugins(Wide(KR_EXAMPLE_PLUGIN_DIR));
    ASSERT_EQ(Plugins().size(), 2u);
    EXPECT_NE(CKRTypeSystem::FindType(kShapesPluginTypeID), nullptr);
    EXPECT_EQ(socket->OnCommand(kDrawHexagon, L"", nullptr), 1);
    socket->OnCommand(kNewNote, L"round", nullptr);
    EXPECT_EQ(PluginNamed(L"Notes")->GetConfiguration()->m_Description, L"1 notes: round");
    // Each way of letting go leaves the socket without the plug-ins.
    if (round == 0) {
      CKRPluginManager::ReleaseAllPlugins();
      CKRPluginManager::UnregisterSocket(socket);
    } else if (round == 1) {
      CKRPluginManager::Release();
    } else {
      CKRPluginManager::UnregisterSocket(socket);  // keeps its plug-ins until they go
      EXPECT_EQ(socket->GetRegisteredPlugins().GetCount(), 2);
      CKRPluginManager::ReleaseAllPlugins();
    }
    EXPECT_EQ(socket->GetRegisteredPlugins().GetCount(), 0);
    EXPECT_EQ(socket->OnCommand(kDrawHexagon, L"", nullptr), 0);
    socket->Release();
    EXPECT_FALSE(IsMapped(ExampleModule("shapes")));
    EXPECT_FALSE(IsMapped(ExampleModule("notes")));
    EXPECT_EQ(CKRTypeSystem::FindType(kShapesPluginTypeID), nullptr);
  }
}

// A plug-in that refuses to end keeps its module loaded: its object must
// not outlive its code.
TEST_F(CKRPluginManagerTest, PluginThatRefusesToEndKeepsItsModule) {
  const std::string path = BrokenModule(7);
  CKRPluginManager::LoadPlugin(Wide(path));
  ASSERT_EQ(Plugins().size(), 1u);
  CKRPlugin* stubborn = Plugins()[0];
  CKRPluginManager::ReleasePlugin(stubborn);
  EXPECT_TRUE(Plugins().empty());
  EXPECT_TRUE(IsMapped(path));
  EXPECT_EQ(stubborn->GetType()->GetInstance(stubborn->GetInstanceID()), stubborn);
  EXPECT_EQ(stubborn->Release(), 1);  // it gives in the second time
}

TEST_F(CKRPluginManagerTest, CommandNumbersStartAfreshAfterRelease) {
  CKRPluginCmd first, second;
  CKRPluginManager::RegisterCmd(&first);
  CKRPluginManager::RegisterCmd(&second);
  CKRPluginManager::RegisterCmd(nullptr);
  EXPECT_EQ(first.m_CmdID, CKRPluginManager::FirstCmdID);
  EXPECT_EQ(second.m_CmdID, 2346u);
  CKRPluginManager::LoadPlugins(Wide(KR_EXAMPLE_PLUGIN_DIR));

  CKRPluginManager::Release();
  EXPECT_EQ(CKRPluginManager::GetPluginIterator().Next(1), nullptr);
  CKRPluginManager::SetNextCmdID(100);
  CKRPluginManager::RegisterCmd(&first);
  CKRPluginManager::RegisterCmd(&second);
  EXPECT_EQ(first.m_CmdID, 100u);
  EXPECT_EQ(second.m_CmdID, 101u);
}

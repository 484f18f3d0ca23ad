// The XML file archive: opening and closing, the file dialogs through the
// file-chooser hook, round trips of linked objects (cycles, derived
// classes, a chain of 30,000 objects on a default stack), hostile files,
// and saves that fail (a read-only folder, a failing write) without
// touching the old file.
#include <krCoreLib/platform/KRFileChooser.h>
#include <krCoreLib/storage/xml/CKRXMLFileTypeManifest.h>

#include "KRXMLTestSupport.h"

#include <csignal>
#include <functional>
#include <thread>

#include <grp.h>
#include <sys/resource.h>
#include <sys/stat.h>
#include <sys/wait.h>
#include <unistd.h>

using namespace KRTestFields;

namespace {

class CKRXMLFileArchiveTest : public testing::Test {
protected:
  void SetUp() override { CKRTypeSystem::Initialize(kXMLTestRepository); }
  void TearDown() override { SKRFileChooser::SetChooser(nullptr); }

  CKRTestRecord* Get(CKRDocument* document, const CKRGuid& id) {
    return dynamic_cast<CKRTestRecord*>(document->GetObject(id, CKRTestRecord::TypeID));
  }

  CKRScratchFolder m_Scratch;
};

// Runs `body` in a forked child; its result, or -1 when the child did not
// end normally.
int RunInChild(const std::function<int()>& body) {
  const pid_t child = ::fork();
  if (child == 0)
    ::_exit(body());
  int status = 0;
  if (child < 0 || ::waitpid(child, &status, 0) != child || !WIFEXITED(status))
    return -1;
  return WEXITSTATUS(status);
}

// A chooser that answers with `path` (empty: cancel) and counts requests.
struct SKRChooserScript {
  std::wstring m_Path;
  int m_Requests = 0;
  bool m_LastForSaving = false;
  std::wstring m_LastTitle;
  std::wstring m_LastFilter;
  static bool Answer(const SKRFileChooserRequest& request, std::wstring& path, void* context) {
    auto* script = static_cast<SKRChooserScript*>(context);
    ++script->m_Requests;
    script->m_LastForSaving = request.m_ForSaving;
    script->m_LastTitle = request.m_Title;
    script->m_LastFilter = request.m_Filter;
    path = script->m_Path;
    return !path.empty();
  }
};

}  // namespace

// Open and Close pair up: a second Open is refused, Close on a closed
// archive does nothing, modes other than read and write are refused, Save
// only confirms write access, and Close of an archive opened for reading
// never touches the file.
TEST_F(CKRXMLFileArchiveTest, OpenAndCloseFollowTheArchiveStates) {
  const std::string path = m_Scratch.Path("states.xml");
  CKRTestRecord* record = NewRecord(L"kept");
  ASSERT_TRUE(KRSaveXML(path, {record}));
  const std::string saved = KRReadBytes(path);

  CKRXMLFileArchive* archive = KRNewXMLArchive(path);
  EXPECT_EQ(archive->CreateNewDocument(kXMLTestDocument, nullptr), nullptr);  // no tree yet
  EXPECT_TRUE(archive->Close());
  EXPECT_FALSE(archive->Open(CKRArchive::AccessMode(3)));
  EXPECT_TRUE(archive->Close());
  ASSERT_TRUE(archive->Open(CKRArchive::AccessRead));
  EXPECT_FALSE(archive->Open(CKRArchive::AccessWrite));  // already open: unchanged
  const CKRBOOL save = archive->Save();
  EXPECT_FALSE(save);
  EXPECT_EQ(save.GetMessage(), L"Archive Not Open in Write Mode");
  EXPECT_EQ(archive->GetDocumentCollection()->GetCount(), 1);
  ::unlink(path.c_str());
  EXPECT_TRUE(archive->Close());
  EXPECT_EQ(archive->GetDocumentCollection()->GetCount(), 0);
  EXPECT_FALSE(std::filesystem::exists(path));  // reading never writes
  EXPECT_TRUE(archive->Close());

  ASSERT_TRUE(archive->Open(CKRArchive::AccessWrite));
  EXPECT_TRUE(archive->Save());
  EXPECT_FALSE(std::filesystem::exists(path));  // Save does not write
  EXPECT_NE(archive->CreateNewDocument(kXMLTestDocument, nullptr), nullptr);
  EXPECT_EQ(archive->CreateNewDocument(kXMLTestDocument, nullptr), nullptr);
  archive->Release();  // releasing closes, and closing writes
  EXPECT_TRUE(std::filesystem::exists(path));

  // Two archives open at once share the XML library; closing one leaves
  // the other working.
  KRWriteBytes(path, saved);
  SKRXMLLoad first = KRLoadXML(path);
  SKRXMLLoad second = KRLoadXML(path);
  ASSERT_TRUE(first.m_Opened && second.m_Opened);
  first.Release();
  CKRTestRecord* loaded = Get(second.Document(), record->GetInstanceID());
  ASSERT_NE(loaded, nullptr);
  EXPECT_EQ(loaded->m_Name, L"kept");
  second.Release();
  loaded->Release();
  record->Release();
}

// The dialogs: none while a file name is set; with none, the chooser's
// answer, and a cancel leaves the archive as it was (closed for Open, open
// for Close). The default chooser cancels.
TEST_F(CKRXMLFileArchiveTest, DialogsOnlyWithoutAFileName) {
  SKRChooserScript script;
  SKRFileChooser::SetChooser(&SKRChooserScript::Answer, &script);
  const std::string path = m_Scratch.Path("chosen.xml");
  CKRXMLFileArchive* archive = KRNewXMLArchive(path);
  ASSERT_TRUE(archive->OpenWithUI(CKRArchive::AccessWrite));
  EXPECT_TRUE(archive->CloseWithUI());
  EXPECT_EQ(script.m_Requests, 0);
  archive->Release();

  archive = static_cast<CKRXMLFileArchive*>(CKRXMLFileArchive::GetCKRXMLFileArchiveType()->CreateInstance(CKRGuid()));
  EXPECT_FALSE(archive->OpenWithUI(CKRArchive::AccessWrite));  // cancelled: nothing opened
  EXPECT_EQ(script.m_Requests, 1);
  EXPECT_FALSE(script.m_LastForSaving);
  EXPECT_EQ(script.m_LastTitle, L"Open Archive");
  EXPECT_EQ(script.m_LastFilter, L"All Files (*.*)|*.*||");
  EXPECT_EQ(archive->CreateNewDocument(kXMLTestDocument, nullptr), nullptr);
  EXPECT_TRUE(archive->Close());

  ASSERT_TRUE(archive->Open(CKRArchive::AccessWrite));
  EXPECT_FALSE(archive->CloseWithUI());  // cancelled: still open
  EXPECT_EQ(script.m_LastTitle, L"Save Archive");
  EXPECT_TRUE(script.m_LastForSaving);
  EXPECT_NE(archive->CreateNewDocument(kXMLTestDocument, nullptr), nullptr);
  script.m_Path = CKRString::FromUtf8(path).str();
  EXPECT_TRUE(archive->CloseWithUI());
  EXPECT_EQ(archive->GetFile(), CKRString::FromUtf8(path));
  EXPECT_EQ(CKRTestXMLReader::Read(KRReadBytes(path)).m_Children.size(), 1u);
  archive->Release();

  // The default chooser answers cancel.
  SKRFileChooser::SetChooser(nullptr);
  archive = static_cast<CKRXMLFileArchive*>(CKRXMLFileArchive::GetCKRXMLFileArchiveType()->CreateInstance(CKRGuid()));
  EXPECT_FALSE(archive->OpenWithUI(CKRArchive::AccessRead));
  archive->Release();
}

// Linked objects come back as one live object each: cycles, shared
// children, derived classes with the fields of every level, two documents
// in the order they were made, and links that resolve to nothing.
TEST_F(CKRXMLFileArchiveTest, LinkedObjectsRoundTrip) {
  std::vector<CKRTestRecord*> ring{NewRecord(L"r0"), NewRecord(L"r1"), NewRecord(L"r2")};
  for (std::size_t i = 0; i < ring.size(); ++i) {
    ring[i]->m_pNext = ring[(i + 1) % ring.size()];
    ring[i]->m_Children.Add(ring[0]);
  }
  auto* leaf = static_cast<CKRTestLeaf*>(CKRTestLeaf::GetCKRTestLeafType()->CreateInstance(CKRGuid()));
  leaf->m_Base = L"base";
  leaf->m_Middle = L"middle";
  leaf->m_Leaf = L"leaf";
  const std::string path = m_Scratch.Path("linked.xml");
  ASSERT_TRUE(KRSaveXML(path, {ring[1], leaf}));

  SKRXMLLoad load = KRLoadXML(path);
  ASSERT_TRUE(load.m_Opened);
  CKRTestRecord* first = Get(load.Document(), ring[0]->GetInstanceID());
  ASSERT_NE(first, nullptr);
  CKRTestRecord* walk = first;
  for (std::size_t i = 0; i < ring.size(); ++i) {
    EXPECT_EQ(walk->m_Name, ring[i]->m_Name);
    ASSERT_EQ(walk->m_Children.GetCount(), 1);
    EXPECT_EQ(*walk->m_Children.begin(), first);
    walk = walk->m_pNext;
  }
  EXPECT_EQ(walk, first);
  auto* loadedLeaf = dynamic_cast<CKRTestLeaf*>(load.Document()->GetObject(leaf->GetInstanceID(), CKRTestLeaf::TypeID));
  ASSERT_NE(loadedLeaf, nullptr);
  EXPECT_EQ(loadedLeaf->m_Base + loadedLeaf->m_Middle + loadedLeaf->m_Leaf, L"basemiddleleaf");
  // Asked with the wrong type: a manifest for it is made, no object.
  EXPECT_EQ(load.Document()->GetObject(leaf->GetInstanceID(), CKRTestRecord::TypeID), nullptr);
  load.Release();
  for (int i = 0; i < 3; ++i) {
    CKRTestRecord* following = walk->m_pNext;
    walk->Release();
    walk = following;
  }
  loadedLeaf->Release();

  // Links to a type the type system does not know and to an object the
  // file does not hold read as null; a collection skips them.
  std::string text = KRReadBytes(path);
  const std::string typeID = KRXML64(CKRTestRecord::TypeID);
  const std::size_t link = text.find("T=\"" + typeID + "\"");
  ASSERT_NE(link, std::string::npos);
  text.replace(link + 3, 22, KRXML64(CKRGuid::CreateNewGUID()));  // the Next link of ring[1]
  const std::size_t member = text.find("I=\"" + KRXML64(ring[0]->GetInstanceID()) + "\"", link);
  ASSERT_NE(member, std::string::npos);
  text.replace(member + 3, 22, KRXML64(CKRGuid::CreateNewGUID()));  // its only child
  KRWriteBytes(path, text);
  load = KRLoadXML(path);
  ASSERT_TRUE(load.m_Opened);
  CKRTestRecord* broken = Get(load.Document(), ring[1]->GetInstanceID());
  ASSERT_NE(broken, nullptr);
  EXPECT_EQ(broken->m_pNext, nullptr);
  EXPECT_EQ(broken->m_Children.GetCount(), 0);
  load.Release();
  broken->Release();
  for (CKRTestRecord* record : ring)
    record->Release();
  leaf->Release();

  // Two documents, in the order they were made.
  const CKRGuid second = CKRGuid::Literal("{00000000-0000-4000-8000-000000000001}");
  CKRXMLFileArchive* archive = KRNewXMLArchive(path);
  ASSERT_TRUE(archive->Open(CKRArchive::AccessWrite));
  ASSERT_NE(archive->CreateNewDocument(kXMLTestDocument, nullptr), nullptr);
  ASSERT_NE(archive->CreateNewDocument(second, nullptr), nullptr);
  EXPECT_TRUE(archive->Close());
  archive->Release();
  const SKRTestElement file = CKRTestXMLReader::Read(KRReadBytes(path));
  ASSERT_EQ(file.m_Children.size(), 2u);
  EXPECT_EQ(file.m_Children[0].m_Name, KRElementForm(kXMLTestDocument));
  EXPECT_EQ(file.m_Children[1].m_Name, KRElementForm(second));
}

// A chain of 30,000 objects (fifteen times the document's bound on native
// nesting) saves and loads on a thread with the default stack, each object
// once.
TEST_F(CKRXMLFileArchiveTest, LongChainRoundTripsOnADefaultStack) {
  constexpr int kLength = 30000;
  std::vector<CKRTestRecord*> chain;
  for (int i = 0; i < kLength; ++i)
    chain.push_back(NewRecord());
  for (int i = 0; i + 1 < kLength; ++i)
    chain[i]->m_pNext = chain[i + 1];
  const std::string path = m_Scratch.Path("chain.xml");
  bool saved = false;
  std::thread([&] { saved = KRSaveXML(path, {chain[0]}); }).join();
  ASSERT_TRUE(saved);
  SKRXMLLoad load;
  CKRTestRecord* first = nullptr;
  std::thread([&] {
    load = KRLoadXML(path);
    if (load.m_Opened)
      first = Get(load.Document(), chain[0]->GetInstanceID());
  }).join();
  ASSERT_TRUE(load.m_Opened);
  int length = 0;
  for (CKRTestRecord* walk = first; walk != nullptr; walk = walk->m_pNext)
    ++length;
  EXPECT_EQ(length, kLength);
  load.Release();
  ReleaseChains(first, chain);
}

// Hostile files: each gives false from Open (or loads what it can), never
// a crash or a hang; external entities are never read; whatever was read
// stays available.
TEST_F(CKRXMLFileArchiveTest, HostileFilesFailCleanly) {
  CKRTestRecord* record = NewRecord(L"valid");
  const std::string valid = m_Scratch.Path("valid.xml");
  ASSERT_TRUE(KRSaveXML(valid, {record}));
  const std::string good = KRReadBytes(valid);
  const std::string secret = m_Scratch.Path("secret.txt");
  KRWriteBytes(secret, "SECRET");
  const std::string document = KRElementForm(kXMLTestDocument);
  // 100,000 levels of elements inside the stored object.
  std::string nested;
  for (int i = 0; i < 100000; ++i)
    nested += "<a>";
  for (int i = 0; i < 100000; ++i)
    nested += "</a>";
  std::string deep = good;
  deep.insert(deep.find("</" + KRElementForm(record->GetInstanceID())), nested);
  struct SKRCase {
    const char* m_Name;
    std::string m_Bytes;
    bool m_Opens;
  };
  const std::vector<SKRCase> cases{
      {"empty file", "", false},
      {"not XML", "this is not XML", false},
      {"truncated", good.substr(0, good.size() / 2), false},
      {"no root", "<?xml version=\"1.0\"?>", false},
      {"two roots", "<KRXML/><KRXML/>", false},
      {"billion laughs",
       "<?xml version=\"1.0\"?><!DOCTYPE r [<!ENTITY a \"aaaaaaaaaa\"><!ENTITY b \"&a;&a;&a;&a;&a;&a;&a;&a;&a;&a;\">"
       "<!ENTITY c \"&b;&b;&b;&b;&b;&b;&b;&b;&b;&b;\"><!ENTITY d \"&c;&c;&c;&c;&c;&c;&c;&c;&c;&c;\">"
       "<!ENTITY e \"&d;&d;&d;&d;&d;&d;&d;&d;&d;&d;\"><!ENTITY f \"&e;&e;&e;&e;&e;&e;&e;&e;&e;&e;\">"
       "<!ENTITY g \"&f;&f;&f;&f;&f;&f;&f;&f;&f;&f;\"><!ENTITY h \"&g;&g;&g;&g;&g;&g;&g;&g;&g;&g;\">]><r>&h;</r>",
       false},
      {"external entity",
       "<?xml version=\"1.0\"?><!DOCTYPE r [<!ENTITY x SYSTEM \"file://" + secret + "\">]><KRXML><" + document +
           ">&x;</" + document + "></KRXML>",
       false},
      {"external DTD", "<?xml version=\"1.0\"?><!DOCTYPE KRXML SYSTEM \"file://" + secret + "\"><KRXML/>", false},
      {"garbage names", "<KRXML><_!!!!!!!!!!!!!!!!!!!!!!/></KRXML>", false},
      {"23 characters of name garbage", "<KRXML><_......................><x/></_......................></KRXML>", true},
      {"deep nesting", deep, true},
      {"unclosed nesting", "<KRXML>" + nested.substr(0, nested.size() / 2) + "</KRXML>", false},
      {"long attribute", "<KRXML><" + document + " V=\"" + std::string(10 << 20, 'v') + "\"/></KRXML>", true},
      {"binary", std::string("\0\xff\xfe<\x01", 5), false},
  };
  for (const SKRCase& hostile : cases) {
    SCOPED_TRACE(hostile.m_Name);
    const std::string path = m_Scratch.Path("hostile.xml");
    KRWriteBytes(path, hostile.m_Bytes);
    SKRXMLLoad load = KRLoadXML(path);
    EXPECT_EQ(load.m_Opened, hostile.m_Opens);
    KRLoadEverything(load);
  }

  // A missing file, a directory and an empty file name.
  for (const std::string& path : {m_Scratch.Path("missing.xml"), m_Scratch.Root(), std::string()}) {
    SCOPED_TRACE(path);
    SKRXMLLoad load = KRLoadXML(path);
    EXPECT_FALSE(load.m_Opened);
    EXPECT_EQ(load.m_pArchive->GetDocumentCollection()->GetCount(), 0);
    load.Release();
  }

  // A truncated file keeps the documents that were read.
  KRWriteBytes(valid, good.substr(0, good.find("</" + KRElementForm(record->GetInstanceID()))));
  SKRXMLLoad load = KRLoadXML(valid);
  EXPECT_FALSE(load.m_Opened);
  EXPECT_NE(load.Document(), nullptr);
  load.Release();
  record->Release();
}

// A save that cannot be written reports false with a message and leaves
// the old file as it was, with no temporary file left behind: a folder the
// process may not write to, a write that fails half-way (the file-size
// limit), a directory where the file should be, and no file name.
TEST_F(CKRXMLFileArchiveTest, FailedSavesKeepTheOldFile) {
  CKRTestRecord* record = NewRecord(std::wstring(200000, L'x').c_str());
  const std::string old = "<KRXML/>";

  // A read-only folder, as a user that permissions bind (root's writes
  // ignore them).
  const std::string folder = m_Scratch.Path("readonly");
  std::filesystem::create_directory(folder);
  const std::string path = folder + "/archive.xml";
  KRWriteBytes(path, old);
  ::chmod(m_Scratch.Root().c_str(), 0755);
  ::chmod(path.c_str(), 0666);
  ::chmod(folder.c_str(), 0555);
  EXPECT_EQ(RunInChild([&] {
              if (::geteuid() == 0 && (::setgroups(0, nullptr) != 0 || ::setgid(65534) != 0 || ::setuid(65534) != 0))
                return 9;
              CKRXMLFileArchive* archive = KRNewXMLArchive(path);
              archive->Open(CKRArchive::AccessWrite);
              record->SerializeTo(archive->CreateNewDocument(kXMLTestDocument, nullptr));
              const CKRBOOL closed = archive->Close();
              archive->Release();
              return !closed && closed.GetMessage() == L"Archive File Not Written" ? 0 : 1;
            }),
            0);
  ::chmod(folder.c_str(), 0755);
  EXPECT_EQ(KRReadBytes(path), old);
  EXPECT_EQ(KRFolderEntries(folder).size(), 1u);

  // A write that fails after the first bytes: the file-size limit of the
  // process stops the temporary file at 4 KiB.
  EXPECT_EQ(RunInChild([&] {
              std::signal(SIGXFSZ, SIG_IGN);
              const rlimit limit{4096, 4096};
              if (::setrlimit(RLIMIT_FSIZE, &limit) != 0)
                return 9;
              return KRSaveXML(path, {record}) ? 1 : 0;
            }),
            0);
  EXPECT_EQ(KRReadBytes(path), old);
  EXPECT_EQ(KRFolderEntries(folder).size(), 1u);

  // A directory where the file should be, and no file name.
  const std::string directory = m_Scratch.Path("directory.xml");
  std::filesystem::create_directory(directory);
  EXPECT_FALSE(KRSaveXML(directory, {record}));
  EXPECT_TRUE(std::filesystem::is_directory(directory));
  EXPECT_FALSE(KRSaveXML("", {record}));

  // And a save that can be written replaces the file whole.
  ASSERT_TRUE(KRSaveXML(path, {record}));
  EXPECT_GT(KRReadBytes(path).size(), 200000u);
  EXPECT_EQ(KRFolderEntries(folder).size(), 1u);
  record->Release();
}

// The inputs kept from fuzzing (tests/storage/fuzz_inputs) load without a
// crash, a hang or a leak.
TEST_F(CKRXMLFileArchiveTest, FuzzInputsLoadCleanly) {
  int inputs = 0;
  for (const auto& entry : std::filesystem::directory_iterator(KR_FUZZ_INPUTS)) {
    SCOPED_TRACE(entry.path().filename().string());
    SKRXMLLoad load = KRLoadXML(entry.path().string());
    KRLoadEverything(load);
    ++inputs;
  }
  EXPECT_GT(inputs, 0);
}

#include <krCoreLib/storage/registry/CKRRegistrySerializer.h>

#include <krCoreLib/framework/CKRGraphNode.h>
#include <krCoreLib/framework/CKRGraphNodeVisitor.h>
#include <krCoreLib/framework/CKRPreferences.h>
#include <krCoreLib/storage/registry/CKRRegistryTypeManifest.h>

#include "KRXMLTestSupport.h"

#include <cstdlib>
#include <set>
#include <string>
#include <vector>

namespace {

using Bytes = std::vector<std::uint8_t>;

// The archive bytes of a list of ASCII strings, written out by hand (counts
// and lengths below 255); `count` overrides the stored count.
Bytes ListBytes(const std::vector<std::string>& strings, int count = -1) {
  Bytes bytes{static_cast<std::uint8_t>(count < 0 ? strings.size() : count), 0};
  for (const std::string& text : strings) {
    bytes.insert(bytes.end(), {0xFF, 0xFE, 0xFF, static_cast<std::uint8_t>(text.size())});
    for (char c : text)
      bytes.insert(bytes.end(), {static_cast<std::uint8_t>(c), 0});
  }
  return bytes;
}

std::string Ascii(const CKRGuid& id) {
  return id.GetCString().ToUtf8();
}

template <class T>
T* New(IKRObjectType* type) {
  return static_cast<T*>(type->CreateInstance(CKRGuid()));
}

class CKRRegistrySerializerTest : public testing::Test {
protected:
  // Every test has a store of its own.
  void SetUp() override {
    CKRTypeSystem::Initialize(kXMLTestRepository);
    ::setenv("KR_REGISTRY_DIR", m_Scratch.Root().c_str(), 1);
  }
  void TearDown() override { ::unsetenv("KR_REGISTRY_DIR"); }

  // A serializer at the test's location, opened (loaded) when asked.
  CKRRegistrySerializer* NewSerializer(bool open) {
    auto* serializer = New<CKRRegistrySerializer>(CKRRegistrySerializer::GetCKRRegistrySerializerType());
    EXPECT_EQ(serializer->SetLocation(HKEY_CURRENT_USER, m_Location), 1);
    if (open) {
      EXPECT_EQ(serializer->Open(), 1);
    }
    return serializer;
  }
  bool Save(const std::vector<CKRSerialObject*>& roots) {
    CKRRegistrySerializer* serializer = NewSerializer(false);
    bool ok = true;
    for (CKRSerialObject* root : roots)
      ok = root->SerializeTo(serializer) != 0 && ok;
    serializer->Release();
    return ok;
  }
  // Releases the serializer and every object loaded through it.
  static void ReleaseLoaded(CKRRegistrySerializer* serializer) {
    std::set<IKRObject*> loaded;
    auto manifests = serializer->GetTypeManifestIterator();
    for (CKRTypeManifest* manifest = manifests.Next(1); manifest != nullptr; manifest = manifests.Next(0)) {
      auto streams = manifest->GetInstanceFieldStreamIterator();
      for (CKRFieldStream* stream = streams.Next(1); stream != nullptr; stream = streams.Next(0))
        if (stream->GetResult() != nullptr)
          loaded.insert(stream->GetResult());
    }
    serializer->Release();
    for (IKRObject* object : loaded)
      object->Release();
  }
  CKRString ObjectKey(const CKRGuid& typeID, const CKRGuid& instanceID) const {
    return m_Location + L"\\" + typeID.GetCString() + L"\\" + instanceID.GetCString();
  }
  // A stored value's bytes, read with the platform calls; empty when absent.
  Bytes RawValue(const CKRString& path, const wchar_t* name, std::uint32_t* type = nullptr) {
    HKEY key = nullptr;
    Bytes bytes(1 << 20);
    std::uint32_t size = static_cast<std::uint32_t>(bytes.size());
    if (KRRegOpenKeyEx(HKEY_CURRENT_USER, path.GetString(), 0, KRKEY_READ, &key) != KRERROR_SUCCESS)
      return {};
    const long result = KRRegQueryValueEx(key, name, type, bytes.data(), &size);
    KRRegCloseKey(key);
    bytes.resize(result == KRERROR_SUCCESS ? size : 0);
    return bytes;
  }
  void SetRaw(const CKRString& path, const wchar_t* name, std::uint32_t type, const Bytes& bytes) {
    HKEY key = nullptr;
    ASSERT_EQ(KRRegOpenKeyEx(HKEY_CURRENT_USER, path.GetString(), 0, KRKEY_ALL_ACCESS, &key), KRERROR_SUCCESS);
    EXPECT_EQ(KRRegSetValueEx(key, name, type, bytes.data(), static_cast<std::uint32_t>(bytes.size())), KRERROR_SUCCESS);
    KRRegCloseKey(key);
  }

  CKRScratchFolder m_Scratch;
  const CKRString m_Location = L"Software\\krCoreLibTests";
};

TEST_F(CKRRegistrySerializerTest, StoresObjectsInTheDocumentedLayoutAndLoadsThem) {
  CKRTestRecord* record = NewRecord(L"Width");
  record->m_Count = 7;
  record->m_ReadOnly = L"never stored";
  std::vector<CKRTestRecord*> children{NewRecord(L"a"), NewRecord(L"b"), NewRecord(L"c")};
  for (CKRTestRecord* child : children)
    record->m_Children.Add(child);
  ASSERT_TRUE(Save({record}));

  const CKRGuid typeID = CKRTestRecord::TypeID;
  const CKRString typeKey = m_Location + L"\\" + typeID.GetCString();
  std::uint32_t type = 0;
  const Bytes name = RawValue(typeKey, CKRRegistrySerializer::kTypeManifestName, &type);
  EXPECT_EQ(type, KRREG_SZ);
  EXPECT_EQ(std::string(name.begin(), name.end()), std::string("C\0K\0R\0T\0e\0s\0t\0R\0e\0c\0o\0r\0d\0\0\0", 28));
  const CKRString objectKey = ObjectKey(typeID, record->GetInstanceID());
  EXPECT_EQ(RawValue(objectKey, L"Name", &type).size(), 12u);
  EXPECT_EQ(type, KRREG_SZ);
  EXPECT_EQ(RawValue(objectKey, L"Next", &type), ListBytes({"", ""}));
  EXPECT_EQ(type, KRREG_BINARY);
  std::vector<std::string> links;
  for (CKRTestRecord* child : children) {
    links.push_back("T:" + Ascii(typeID));
    links.push_back("I:" + Ascii(child->GetInstanceID()));
  }
  EXPECT_EQ(RawValue(objectKey, L"Children"), ListBytes(links));
  EXPECT_TRUE(RawValue(objectKey, L"ReadOnly").empty());

  // GUID key names are braced and lower-case.
  CKRRegistrySerializer* loader = NewSerializer(true);
  CKRRegistryStringList keys;
  ASSERT_EQ(loader->VerifyKey(HKEY_CURRENT_USER, typeKey), 1);
  loader->EnumerateSubKeys(keys);
  EXPECT_EQ(keys.size(), 4u);
  EXPECT_NE(std::find(keys.begin(), keys.end(), record->GetInstanceID().GetCString()), keys.end());
  auto* loaded = dynamic_cast<CKRTestRecord*>(loader->GetObject(record->GetInstanceID(), typeID));
  ASSERT_NE(loaded, nullptr);
  EXPECT_EQ(loaded->m_Name, CKRString(L"Width"));
  EXPECT_EQ(loaded->m_Count, 7);
  EXPECT_EQ(loaded->m_pNext, nullptr);
  ASSERT_EQ(loaded->m_Children.GetCount(), 3);
  auto each = loaded->m_Children.GetIterator();
  for (CKRTestRecord* child : children)
    EXPECT_EQ(each.Next(child == children.front() ? 1 : 0)->GetInstanceID(), child->GetInstanceID());
  ReleaseLoaded(loader);
  ReleaseChains(record, children);
}

TEST_F(CKRRegistrySerializerTest, LongTextsAndLargeLinkCollectionsReadBack) {
  // Texts around and far beyond 100 characters, and a collection whose
  // list is many times 4096 bytes.
  for (const int length : {0, 99, 100, 5000, 200000}) {
    SCOPED_TRACE(length);
    CKRTestRecord* record = NewRecord(CKRString(std::size_t(length), L'\x20AC').GetString());
    std::vector<CKRTestRecord*> children;
    for (int i = 0; i < (length == 5000 ? 300 : 1); ++i)
      record->m_Children.Add(children.emplace_back(NewRecord(L"child")));
    ASSERT_TRUE(Save({record}));
    CKRRegistrySerializer* loader = NewSerializer(true);
    auto* loaded = dynamic_cast<CKRTestRecord*>(loader->GetObject(record->GetInstanceID(), CKRTestRecord::TypeID));
    ASSERT_NE(loaded, nullptr);
    EXPECT_EQ(loaded->m_Name, record->m_Name);
    EXPECT_EQ(loaded->m_Children.GetCount(), int(children.size()));
    ReleaseLoaded(loader);
    ReleaseChains(record, children);
  }
}

TEST_F(CKRRegistrySerializerTest, TypedValuesRoundTripAndRefuseOtherTypes) {
  CKRRegistrySerializer* s = NewSerializer(false);
  ASSERT_EQ(s->CreateKey(HKEY_CURRENT_USER, m_Location + L"\\values"), 1);
  const CKRString text = CKRString(L"caf\u00e9 \U0001F600 ") + CKRString(std::size_t(300), L'x');
  const CKRRegistryStringArray strings{L"", text, L"third"};
  EXPECT_EQ(s->Write(L"int", -5), 1);
  EXPECT_EQ(s->Write(L"ulong", 0xFFFFFFFFul), 1);
  EXPECT_EQ(s->Write(L"too wide", 0x100000000ul), 0);
  EXPECT_EQ(s->Write(L"beyond the store's limit", CKRString(std::size_t(600000), L'x')), 0);
  EXPECT_EQ(s->Write(L"text", text), 1);
  EXPECT_EQ(s->GetLastValueSize(), std::uint32_t(text.GetLength() + 2));  // the emoji is two UTF-16 units
  EXPECT_EQ(s->Write(L"bytes", CKRRegistryByteArray{0, 255, 7}), 1);
  EXPECT_EQ(s->Write(L"words", CKRRegistryWordArray{1, 0xFFFF}), 1);
  EXPECT_EQ(s->Write(L"array", strings), 1);
  EXPECT_EQ(s->Write(L"list", CKRRegistryStringList(strings.begin(), strings.end())), 1);
  EXPECT_EQ(s->Write(L"rect", CKRScreenRect{1, 2, 3, 4}), 1);
  EXPECT_EQ(s->Write(L"point", CKRScreenPoint{-6, 9}), 1);

  int number = 0;
  unsigned long wide = 0;
  CKRString readText;
  CKRRegistryByteArray bytes;
  CKRRegistryWordArray words;
  CKRRegistryDWordArray dwords;
  CKRRegistryStringArray array;
  CKRRegistryStringList list;
  CKRScreenRect rect;
  CKRScreenPoint point;
  EXPECT_TRUE(s->Read(L"int", number) && number == -5);
  EXPECT_TRUE(s->Read(L"ulong", wide) && wide == 0xFFFFFFFFul);
  EXPECT_EQ(s->VerifyValue(L"too wide"), 0);
  EXPECT_TRUE(s->Read(L"text", readText) && readText == text);
  EXPECT_TRUE(s->Read(L"bytes", bytes) && bytes == CKRRegistryByteArray({0, 255, 7}));
  EXPECT_TRUE(s->Read(L"words", words) && words == CKRRegistryWordArray({1, 0xFFFF}));
  EXPECT_TRUE(s->Read(L"array", array) && array == strings);
  EXPECT_TRUE(s->Read(L"list", list) && CKRRegistryStringArray(list.begin(), list.end()) == strings);
  EXPECT_TRUE(s->Read(L"rect", dwords) && dwords == CKRRegistryDWordArray({2, 4, 1, 3, 0}));
  EXPECT_TRUE(s->Read(L"rect", rect) && rect == CKRScreenRect({1, 2, 3, 4}));
  EXPECT_TRUE(s->Read(L"point", point) && point == CKRScreenPoint({-6, 9}));

  // A value of another type, or a list of other elements, fails and leaves
  // the target as it was.
  EXPECT_EQ(s->Read(L"int", readText), 0);
  EXPECT_EQ(s->Read(L"text", number), 0);
  EXPECT_EQ(s->Read(L"text", bytes), 0);
  EXPECT_EQ(s->Read(L"bytes", array), 0);
  EXPECT_EQ(s->Read(L"words", rect), 0);
  EXPECT_EQ(s->Read(L"missing", point), 0);
  EXPECT_EQ(s->GetLastResult(), KRERROR_FILE_NOT_FOUND);
  EXPECT_EQ(readText, text);
  EXPECT_EQ(number, -5);
  EXPECT_EQ(array, strings);
  EXPECT_EQ(rect, CKRScreenRect({1, 2, 3, 4}));
  s->Release();
}

TEST_F(CKRRegistrySerializerTest, LocationsAndKeys) {
  auto* s = New<CKRRegistrySerializer>(CKRRegistrySerializer::GetCKRRegistrySerializerType());
  EXPECT_EQ(s->Open(), 0);  // no location
  EXPECT_EQ(s->SetLocation(HKEY_CURRENT_USER, L""), 0);
  EXPECT_EQ(s->SetLocation(nullptr, m_Location), 0);
  EXPECT_EQ(s->SetLocation(HKEY_CURRENT_USER, m_Location), 1);
  EXPECT_EQ(s->Open(), 1);  // missing: nothing to load
  EXPECT_EQ(s->GetTypeManifestCollection()->GetCount(), 0);
  EXPECT_EQ(s->VerifyKey(HKEY_CURRENT_USER, m_Location), 0);

  // Subkey names of every length the store allows are listed.
  ASSERT_EQ(s->CreateKey(HKEY_CURRENT_USER, m_Location), 1);
  std::set<CKRString> made;
  for (const int length : {1, 79, 80, 200, 254}) {
    made.insert(CKRString(std::size_t(length), L'k'));
    EXPECT_EQ(s->CreateKey(HKEY_CURRENT_USER, m_Location + L"\\" + *made.rbegin() + L""), 1) << length;
  }
  EXPECT_EQ(s->CreateKey(HKEY_CURRENT_USER, m_Location + L"\\" + CKRString(std::size_t(255), L'k')), 0);
  EXPECT_EQ(s->VerifyKey(HKEY_CURRENT_USER, m_Location), 1);
  CKRRegistryStringList names;
  EXPECT_EQ(s->EnumerateSubKeys(names), 5);
  EXPECT_EQ(std::set<CKRString>(names.begin(), names.end()), made);

  // Values of the current key; a failed open leaves none to write to.
  EXPECT_EQ(s->VerifyKey(L"k"), 1);
  EXPECT_EQ(s->Write(L"v", 1), 1);
  EXPECT_EQ(s->VerifyValue(L"V"), 1);
  EXPECT_EQ(s->DeleteValue(L"v"), 1);
  EXPECT_EQ(s->VerifyValue(L"v"), 0);
  EXPECT_EQ(s->VerifyKey(L"absent"), 0);
  EXPECT_EQ(s->GetCurrentKey(), nullptr);
  EXPECT_EQ(s->Write(L"v", 1), 0);
  EXPECT_EQ(s->DeleteValueKey(HKEY_CURRENT_USER, m_Location + L"\\k"), 1);
  EXPECT_EQ(s->VerifyKey(HKEY_CURRENT_USER, m_Location + L"\\k"), 0);
  EXPECT_EQ(s->CloseRegistry(), 1);
  s->Release();
}

TEST_F(CKRRegistrySerializerTest, HostileBinaryValuesFailWithoutChangingTheTarget) {
  CKRRegistrySerializer* s = NewSerializer(false);
  ASSERT_EQ(s->CreateKey(HKEY_CURRENT_USER, m_Location), 1);
  Bytes huge{0xFF, 0xFF, 0xFE, 0xFF, 0xFF, 0xFF};  // a count of 4 billion
  Bytes longString = ListBytes({"ab"});
  longString[5] = 200;  // 200 characters announced, 2 present
  Bytes twoMarkers{1, 0, 0xFF, 0xFE, 0xFF, 0xFF, 0xFE, 0xFF, 0};
  const struct {
    const char* m_What;
    Bytes m_Bytes;
  } cases[] = {
      {"empty", {}},
      {"count too high", ListBytes({"a", "b"}, 3)},
      {"count too low", ListBytes({"a", "b"}, 1)},
      {"string cut short", longString},
      {"half a count", {1}},
      {"huge count", huge},
      {"marker twice", twoMarkers},
  };
  for (const auto& each : cases) {
    SCOPED_TRACE(each.m_What);
    SetRaw(m_Location, L"list", KRREG_BINARY, each.m_Bytes);
    CKRRegistryStringArray strings{L"kept"};
    EXPECT_EQ(s->Read(L"list", strings), 0);
    EXPECT_EQ(strings, CKRRegistryStringArray{L"kept"});
  }
  // A string value without its terminator reads to its end; an odd byte is
  // no character.
  SetRaw(m_Location, L"text", KRREG_SZ, {'h', 0, 'i', 0, '!'});
  CKRString text;
  EXPECT_TRUE(s->Read(L"text", text) && text == CKRString(L"hi"));
  SetRaw(m_Location, L"short", KRREG_DWORD, {1, 2, 3});
  int number = 9;
  EXPECT_EQ(s->Read(L"short", number), 0);
  EXPECT_EQ(number, 9);
  SetRaw(m_Location, L"three", KRREG_BINARY, {3, 0, 1, 0, 0, 0, 2, 0, 0, 0, 3, 0, 0, 0});
  CKRScreenPoint point{5, 5};
  CKRScreenRect rect{5, 5, 5, 5};
  EXPECT_TRUE(s->Read(L"three", point) && point == CKRScreenPoint({1, 2}));
  EXPECT_EQ(s->Read(L"three", rect), 0);
  s->Release();
}

TEST_F(CKRRegistrySerializerTest, HostileStoredFieldsLoadAsTheEmptyValue) {
  const std::string instance = "I:" + Ascii(CKRGuid::CreateNewGUID());
  const std::string type = "T:" + Ascii(CKRTestRecord::TypeID);
  const struct {
    const char* m_What;
    const wchar_t* m_Field;
    std::uint32_t m_Type;
    Bytes m_Bytes;
    bool m_Loads;
  } cases[] = {
      {"name as a number", L"Name", KRREG_DWORD, {1, 0, 0, 0}, true},
      {"link not GUIDs", L"Next", KRREG_BINARY, ListBytes({"T:nonsense", "I:{nonsense}"}), true},
      {"link of three strings", L"Next", KRREG_BINARY, ListBytes({type, instance, type}), true},
      {"link to nothing stored", L"Next", KRREG_BINARY, ListBytes({type, instance}), true},
      {"link of another type", L"Next", KRREG_BINARY, ListBytes({"T:" + Ascii(CKRPreferences::TypeID), instance}), true},
      {"link as text", L"Next", KRREG_SZ, {'x', 0, 0, 0}, true},
      {"odd link strings", L"Children", KRREG_BINARY, ListBytes({type, instance, type}), true},
      {"collection not GUIDs", L"Children", KRREG_BINARY, ListBytes({"T:x", "I:y"}), true},
      {"collection cut short", L"Children", KRREG_BINARY, {4, 0, 0xFF}, true},
      {"object key gone", nullptr, 0, {}, false},
  };
  for (const auto& each : cases) {
    SCOPED_TRACE(each.m_What);
    CKRTestRecord* record = NewRecord(L"original");
    CKRTestRecord* next = NewRecord(L"next");
    record->m_pNext = next;
    ASSERT_TRUE(Save({record}));
    const CKRString key = ObjectKey(CKRTestRecord::TypeID, record->GetInstanceID());
    if (each.m_Field != nullptr)
      SetRaw(key, each.m_Field, each.m_Type, each.m_Bytes);
    else
      KRRegDeleteKey(HKEY_CURRENT_USER, key.GetString());
    CKRRegistrySerializer* loader = NewSerializer(true);
    auto* loaded = dynamic_cast<CKRTestRecord*>(loader->GetObject(record->GetInstanceID(), CKRTestRecord::TypeID));
    EXPECT_EQ(loaded != nullptr, each.m_Loads);
    if (loaded != nullptr) {
      const std::wstring field = each.m_Field;
      EXPECT_EQ(loaded->m_Name, CKRString(field == L"Name" ? L"" : L"original"));
      EXPECT_EQ(loaded->m_pNext == nullptr, field == L"Next");
      EXPECT_EQ(loaded->m_Children.GetCount(), 0);
    }
    ReleaseLoaded(loader);
    ReleaseChains(record, {});
  }
}

TEST_F(CKRRegistrySerializerTest, PreferencesAndGraphsRoundTrip) {
  auto* preferences = New<CKRPreferences>(CKRPreferences::GetCKRPreferencesType());
  for (const wchar_t* name : {L"Display", L"Units"}) {
    auto* section = New<CKRPreferenceSection>(CKRPreferenceSection::GetCKRPreferenceSectionType());
    section->SetName(name);
    section->SetDescription(CKRString(std::size_t(150), L'd'));
    preferences->GetPreferenceSectionMap().Add(section);
  }
  CKRGraphNode* nodes[4];
  for (CKRGraphNode*& node : nodes)
    node = New<CKRGraphNode>(CKRGraphNode::GetCKRGraphNodeType());
  for (const auto& [a, b] : {std::pair{0, 1}, {1, 2}, {2, 0}, {2, 3}}) {
    auto* edge = New<CKRGraphEdge>(CKRGraphEdge::GetCKRGraphEdgeType());
    edge->SetNodes(nodes[a], nodes[b]);
    edge->Connect();
  }
  ASSERT_TRUE(Save({preferences, nodes[0]}));

  CKRRegistrySerializer* loader = NewSerializer(true);
  auto* prefs = dynamic_cast<CKRPreferences*>(loader->GetObject(preferences->GetInstanceID(), CKRPreferences::TypeID));
  auto* graph = dynamic_cast<CKRGraphNode*>(loader->GetObject(nodes[0]->GetInstanceID(), CKRGraphNode::TypeID));
  ASSERT_NE(prefs, nullptr);
  ASSERT_NE(graph, nullptr);
  std::vector<CKRString> names;
  auto sections = prefs->GetPreferenceSectionMap().GetIterator();
  for (CKRPreferenceSection* section = sections.Next(1); section != nullptr; section = sections.Next(0)) {
    names.push_back(section->GetName());
    EXPECT_EQ(section->GetDescription().GetLength(), 150);
  }
  std::sort(names.begin(), names.end());
  EXPECT_EQ(names, (std::vector<CKRString>{L"Display", L"Units"}));
  auto* walk = New<CKRDFSVisitor>(CKRDFSVisitor::GetCKRDFSVisitorType());
  walk->Start(graph);
  EXPECT_EQ(walk->GetDFSNodeCollection()->GetCount(), 4);
  EXPECT_EQ(graph->GetEdgeCollection()->GetCount(), 2);
  walk->Release();
  loader->Release();

  auto* release = New<CKRReleaseVisitor>(CKRReleaseVisitor::GetCKRReleaseVisitorType());
  release->Start(graph);
  release->Start(nodes[0]);
  prefs->GetPreferenceSectionMap().RemoveAll(true);
  prefs->Release();
  release->Release();
  preferences->GetPreferenceSectionMap().RemoveAll(true);
  preferences->Release();
}

TEST_F(CKRRegistrySerializerTest, AStoreThatIsNotADatabaseFailsEveryCall) {
  for (const char* file : {"registry.db", "krCoreLib-volatile-registry.db"})
    KRWriteBytes(m_Scratch.Path(file), std::string(8192, 'x'));
  CKRRegistrySerializer* s = NewSerializer(false);
  CKRTestRecord* record = NewRecord(L"lost");
  EXPECT_EQ(s->Open(), 0);
  EXPECT_EQ(record->SerializeTo(s), 0);
  EXPECT_EQ(s->CreateKey(HKEY_CURRENT_USER, m_Location), 0);
  EXPECT_EQ(s->GetLastResult(), KRERROR_ACCESS_DENIED);
  record->Release();
  s->Release();
}

}  // namespace

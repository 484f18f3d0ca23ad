// CKRRegistry against a fresh store: typed values round trip and refuse
// what they cannot store, hostile stored data reads safely, and the REGEDIT4
// export matches expected text byte for byte.
#include <krCoreLib/system/CKRRegistry.h>

#include "KRFilesScratch.h"

namespace {

class CKRRegistryFixture : public ::testing::Test {
protected:
  void SetUp() override {
    ::setenv("KR_REGISTRY_DIR", m_Scratch.Native("store").c_str(), 1);
    HKEY software = nullptr;
    ASSERT_EQ(KRRegCreateKeyEx(HKEY_CURRENT_USER, L"SOFTWARE", 0, KRKEY_ALL_ACCESS, &software, nullptr), 0);
    KRRegCloseKey(software);
    ASSERT_EQ(m_Registry.Initialize(L"Maker", L"App", HKEY_CURRENT_USER), KRREGISTRY_SUCCESS);
  }
  void TearDown() override { ::unsetenv("KR_REGISTRY_DIR"); }

  // Writes raw bytes to App\section\entry through the store.
  void PutRaw(const wchar_t* entry, std::uint32_t type, const std::string& bytes) {
    HKEY key = nullptr;
    ASSERT_EQ(KRRegCreateKeyEx(m_Registry.GetApplicationKey(), L"Raw", 0, KRKEY_ALL_ACCESS, &key, nullptr), 0);
    EXPECT_EQ(KRRegSetValueEx(key, entry, type, reinterpret_cast<const std::uint8_t*>(bytes.data()),
                              std::uint32_t(bytes.size())),
              0);
    KRRegCloseKey(key);
  }

  CKRFilesScratch m_Scratch;
  CKRRegistry m_Registry;
};

std::string Utf16(const std::u16string& text) {
  std::string bytes;
  for (const char16_t unit : text) {
    bytes.push_back(char(unit & 0xFF));
    bytes.push_back(char(unit >> 8));
  }
  return bytes;
}

}  // namespace

TEST_F(CKRRegistryFixture, InitializeNeedsSoftwareAndNames) {
  CKRRegistry registry;
  int number = 0;
  EXPECT_EQ(registry.GetRegValue(L"S", L"e", number, 3), KRREGISTRY_NOT_INITIALIZED);
  EXPECT_EQ(number, 3);
  EXPECT_EQ(registry.Initialize(L"Maker", L"App", HKEY_USERS), KRREGISTRY_NO_SOFTWARE_KEY);
  EXPECT_EQ(registry.Initialize(L"", L"App", HKEY_CURRENT_USER), KRREGISTRY_NO_COMPANY_KEY);
  EXPECT_EQ(registry.Initialize(L"Maker", nullptr, HKEY_CURRENT_USER), KRREGISTRY_NO_APPLICATION_KEY);
  EXPECT_EQ(registry.PutRegValue(L"S", L"e", 1), KRREGISTRY_NOT_INITIALIZED);
  EXPECT_EQ(registry.Initialize(L"Maker", L"App", HKEY_CURRENT_USER), KRREGISTRY_SUCCESS);
  EXPECT_EQ(registry.Save(), 1);
  EXPECT_EQ(registry.Load(), 1);
}

TEST_F(CKRRegistryFixture, NumbersRoundTripAndRefuseWhatDoesNotFit) {
  int number = 0;
  EXPECT_EQ(m_Registry.GetRegValue(L"Window\\Main", L"Width", number, 42), KRREGISTRY_FAILED);
  EXPECT_EQ(number, 42);
  HKEY section = nullptr;
  EXPECT_EQ(KRRegOpenKeyEx(m_Registry.GetApplicationKey(), L"Window\\Main", 0, KRKEY_READ, &section), 0)
      << "reading creates the section";
  KRRegCloseKey(section);

  EXPECT_EQ(m_Registry.PutRegValue(L"Window\\Main", L"Width", -5), KRREGISTRY_SUCCESS);
  EXPECT_EQ(m_Registry.GetRegValue(L"Window\\Main", L"Width", number, 0), KRREGISTRY_SUCCESS);
  EXPECT_EQ(number, -5);
  EXPECT_EQ(m_Registry.GetRegValue(L"Window\\Main", L"Height", number, 7), KRREGISTRY_FAILED);
  EXPECT_EQ(number, 7);
  unsigned long largest = 0;
  EXPECT_EQ(m_Registry.PutRegValue(L"N", L"u", 0xFFFFFFFFul), KRREGISTRY_SUCCESS);
  EXPECT_EQ(m_Registry.GetRegValue(L"N", L"u", largest, 0ul), KRREGISTRY_SUCCESS);
  EXPECT_EQ(largest, 0xFFFFFFFFul);
  long negative = 0;
  EXPECT_EQ(m_Registry.PutRegValue(L"N", L"l", -2147483648l), KRREGISTRY_SUCCESS);
  EXPECT_EQ(m_Registry.GetRegValue(L"N", L"l", negative, 0l), KRREGISTRY_SUCCESS);
  EXPECT_EQ(negative, -2147483648l);
  // Wider than type 4: refused, the old value stays.
  EXPECT_EQ(m_Registry.PutRegValue(L"N", L"u", 0x100000000ul), KRREGISTRY_FAILED);
  EXPECT_EQ(m_Registry.PutRegValue(L"N", L"l", 0x80000000l), KRREGISTRY_FAILED);
  EXPECT_EQ(m_Registry.GetRegValue(L"N", L"u", largest, 0ul), KRREGISTRY_SUCCESS);
  EXPECT_EQ(largest, 0xFFFFFFFFul);

  EXPECT_EQ(m_Registry.PutRegValue(L"N", L"text", CKRString(L"12")), KRREGISTRY_SUCCESS);
  EXPECT_EQ(m_Registry.GetRegValue(L"N", L"text", number, 9), KRREGISTRY_WRONG_TYPE);
  EXPECT_EQ(number, 9);
  PutRaw(L"short", KRREG_DWORD, "\1\2\3");
  EXPECT_EQ(m_Registry.GetRegValue(L"Raw", L"short", number, 9), KRREGISTRY_FAILED);
  EXPECT_EQ(number, 9);
}

TEST_F(CKRRegistryFixture, TextsOfAnyLengthAndHostileData) {
  CKRString text;
  for (int i = 0; i < 3000; ++i)
    text += (i % 7 == 0) ? L'\u00e9' : (i % 11 == 0) ? L'\U0001F600' : wchar_t(L'a' + i % 26);
  CKRString back;
  EXPECT_EQ(m_Registry.PutRegValue(L"T", L"long", text), KRREGISTRY_SUCCESS);
  EXPECT_EQ(m_Registry.GetRegValue(L"T", L"long", back, CKRString(L"d")), KRREGISTRY_SUCCESS);
  EXPECT_EQ(back, text);
  EXPECT_EQ(m_Registry.PutRegValue(L"T", L"null", CKRString(std::wstring(L"a\0b", 3))), KRREGISTRY_FAILED);
  EXPECT_EQ(m_Registry.GetRegValue(L"T", L"null", back, CKRString(L"d")), KRREGISTRY_FAILED);
  EXPECT_EQ(back, L"d");
  EXPECT_EQ(m_Registry.PutRegValue(L"T", L"n", 5), KRREGISTRY_SUCCESS);
  EXPECT_EQ(m_Registry.GetRegValue(L"T", L"n", back, CKRString(L"d")), KRREGISTRY_WRONG_TYPE);
  EXPECT_EQ(back, L"d");

  const struct {
    const char* what;
    std::string bytes;
    const wchar_t* expected;
  } hostile[] = {{"no terminator", Utf16(u"abc"), L"abc"},
                 {"odd byte count", Utf16(u"ab") + "c", L"ab"},
                 {"empty", "", L""},
                 {"one byte", "x", L""},
                 {"null inside", Utf16(std::u16string(u"ab\0cd", 5)), L"ab"},
                 {"lone surrogate", Utf16(u"a\xD800z"), L"a\uFFFDz"}};
  for (const auto& item : hostile) {
    SCOPED_TRACE(item.what);
    PutRaw(L"v", KRREG_SZ, item.bytes);
    EXPECT_EQ(m_Registry.GetRegValue(L"Raw", L"v", back, CKRString(L"d")), KRREGISTRY_SUCCESS);
    EXPECT_EQ(back, item.expected);
  }
}

TEST_F(CKRRegistryFixture, ListsRoundTripAndRefuseEmptyStrings) {
  std::vector<CKRString> list;
  for (int i = 0; i < 1000; ++i)
    list.push_back(CKRString::Formatted(L"entry %d \u00fc\u4e2d", i));
  std::vector<CKRString> back = {CKRString(L"stale")};
  EXPECT_EQ(m_Registry.PutRegValue(L"L", L"many", list), KRREGISTRY_SUCCESS);
  EXPECT_EQ(m_Registry.GetRegValue(L"L", L"many", back), KRREGISTRY_SUCCESS);
  EXPECT_EQ(back, list);
  EXPECT_EQ(m_Registry.PutRegValue(L"L", L"none", std::vector<CKRString>()), KRREGISTRY_SUCCESS);
  EXPECT_EQ(m_Registry.GetRegValue(L"L", L"none", back), KRREGISTRY_SUCCESS);
  EXPECT_TRUE(back.empty());
  // An empty string would end the list when read back: refused.
  EXPECT_EQ(m_Registry.PutRegValue(L"L", L"many", std::vector<CKRString>{L"a", L"", L"b"}), KRREGISTRY_FAILED);
  EXPECT_EQ(m_Registry.GetRegValue(L"L", L"many", back), KRREGISTRY_SUCCESS);
  EXPECT_EQ(back.size(), 1000u);
  EXPECT_EQ(m_Registry.PutRegValue(L"L", L"text", CKRString(L"x")), KRREGISTRY_SUCCESS);
  EXPECT_EQ(m_Registry.GetRegValue(L"L", L"text", back), KRREGISTRY_WRONG_TYPE);
  EXPECT_TRUE(back.empty());

  PutRaw(L"unended", KRREG_MULTI_SZ, Utf16(std::u16string(u"ab\0cd", 5)));
  EXPECT_EQ(m_Registry.GetRegValue(L"Raw", L"unended", back), KRREGISTRY_SUCCESS);
  EXPECT_EQ(back, (std::vector<CKRString>{L"ab", L"cd"}));
  PutRaw(L"odd", KRREG_MULTI_SZ, Utf16(std::u16string(u"ab\0\0zz", 6)) + "q");
  EXPECT_EQ(m_Registry.GetRegValue(L"Raw", L"odd", back), KRREGISTRY_SUCCESS);
  EXPECT_EQ(back, std::vector<CKRString>{L"ab"});
}

TEST_F(CKRRegistryFixture, GuidMapsReplaceOnlyGuidValues) {
  CKRGuid first;
  CKRGuid second;
  ASSERT_TRUE(first.ReadCString(L"{6b835319-de4f-445f-ac3a-2794dd5f1265}"));
  ASSERT_TRUE(second.ReadCString(L"{9a07311e-341f-4022-aafc-f1bbf96ea76a}"));
  std::map<CKRGuid, CKRString> map = {{first, L"one"}, {second, L"two \u4e2d"}};
  EXPECT_EQ(m_Registry.PutRegValue(L"G", L"Docks", map), KRREGISTRY_SUCCESS);
  HKEY docks = nullptr;
  ASSERT_EQ(KRRegOpenKeyEx(m_Registry.GetApplicationKey(), L"G\\Docks", 0, KRKEY_ALL_ACCESS, &docks), 0);
  const std::string kept = Utf16(std::u16string(u"keep\0", 5));
  ASSERT_EQ(KRRegSetValueEx(docks, L"Other", KRREG_SZ, reinterpret_cast<const std::uint8_t*>(kept.data()),
                            std::uint32_t(kept.size())),
            0);
  ASSERT_EQ(KRRegSetValueEx(docks, L"{00000000-0000-0000-0000-000000000001}", KRREG_DWORD,
                            reinterpret_cast<const std::uint8_t*>("\1\0\0\0"), 4),
            0);

  std::map<CKRGuid, CKRString> back = {{CKRGuid(), L"stale"}};
  EXPECT_EQ(m_Registry.GetRegValue(L"G", L"Docks", back), KRREGISTRY_SUCCESS);
  EXPECT_EQ(back, map) << "names that are not GUIDs, and values that are not texts, are left out";

  EXPECT_EQ(m_Registry.PutRegValue(L"G", L"Docks", std::map<CKRGuid, CKRString>{{second, L"2"}}), KRREGISTRY_SUCCESS);
  EXPECT_EQ(m_Registry.GetRegValue(L"G", L"Docks", back), KRREGISTRY_SUCCESS);
  EXPECT_EQ(back, (std::map<CKRGuid, CKRString>{{second, L"2"}}));
  std::uint32_t values = 0;
  EXPECT_EQ(KRRegQueryInfoKey(docks, nullptr, nullptr, &values, nullptr, nullptr), 0);
  EXPECT_EQ(values, 2u) << "Other and the new GUID value";
  KRRegCloseKey(docks);
  EXPECT_EQ(m_Registry.GetRegValue(L"G", L"Missing", back), KRREGISTRY_FAILED);
  EXPECT_TRUE(back.empty());
}

TEST_F(CKRRegistryFixture, ExportWritesRegedit4ByteForByte) {
  HKEY a = nullptr;
  ASSERT_EQ(KRRegCreateKeyEx(HKEY_CURRENT_USER, L"Software\\A", 0, KRKEY_ALL_ACCESS, &a, nullptr), 0);
  const auto put = [&](HKEY key, const wchar_t* name, std::uint32_t type, const std::string& bytes) {
    ASSERT_EQ(KRRegSetValueEx(key, name, type, reinterpret_cast<const std::uint8_t*>(bytes.data()),
                              std::uint32_t(bytes.size())),
              0);
  };
  put(a, L"n", KRREG_DWORD, std::string("\x10\0\0\0", 4));
  put(a, L"s", KRREG_SZ, Utf16(std::u16string(u"a\"b\\c\t\u00e9\0", 8)));
  std::string bytes;
  for (int i = 0; i < 34; ++i)
    bytes.push_back(char(i));
  put(a, L"bin", KRREG_BINARY, bytes);
  put(a, L"", KRREG_EXPAND_SZ, Utf16(std::u16string(u"%P%\0", 4)));
  put(a, L"wide", KRREG_SZ, Utf16(std::u16string(u"\u4e2d\0", 2)));
  put(a, L"o\"d\\d", 0x1b, "\xff");
  HKEY child = nullptr;
  ASSERT_EQ(KRRegCreateKeyEx(a, L"b\\C", 0, KRKEY_ALL_ACCESS, &child, nullptr), 0);
  put(child, L"multi", KRREG_MULTI_SZ, Utf16(std::u16string(u"x\0\0", 3)));
  KRRegCloseKey(child);
  ASSERT_EQ(KRRegCreateKeyEx(a, L"\u4e2dB", 0, KRKEY_ALL_ACCESS, &child, nullptr), 0);
  KRRegCloseKey(child);
  KRRegCloseKey(a);

  const std::string expected =
      "REGEDIT4\r\n"
      "\r\n[HKEY_CURRENT_USER\\Software\\A]\r\n"
      "\"n\"=dword:00000010\r\n"
      "\"s\"=\"a\\\"b\\\\c\\09\xe9\"\r\n"
      "\"bin\"=hex:00,01,02,03,04,05,06,07,08,09,0a,0b,0c,0d,0e,0f,10,\\\r\n"
      "  11,12,13,14,15,16,17,18,19,1a,1b,1c,1d,1e,1f,20,\\\r\n"
      "  21\r\n"
      "\"\"=hex(2):25,00,50,00,25,00,00,00\r\n"
      "\"wide\"=hex(1):2d,4e,00,00\r\n"
      "\"o\\\"d\\\\d\"=hex(1b):ff\r\n"
      "\r\n[HKEY_CURRENT_USER\\Software\\A\\b]\r\n"
      "\r\n[HKEY_CURRENT_USER\\Software\\A\\b\\C]\r\n"
      "\"multi\"=hex(7):78,00,00,00,00,00\r\n"
      "\r\n[HKEY_CURRENT_USER\\Software\\A\\?B]\r\n";
  ASSERT_TRUE(
      CKRRegistry::WriteRegistryTreeToFile(HKEY_CURRENT_USER, L"Software\\A", m_Scratch.Wide("out.reg").GetString()));
  EXPECT_EQ(KRLoadText(m_Scratch.Wide("out.reg")), expected);
  ASSERT_TRUE(CKRRegistry::WriteRegistryTreeToFile(L"HKCU\\Software\\A", m_Scratch.Wide("short.reg").GetString()));
  EXPECT_EQ(KRLoadText(m_Scratch.Wide("short.reg")), expected);
}

TEST_F(CKRRegistryFixture, ExportFailuresLeaveNoFile) {
  m_Scratch.WriteFile("keep.reg", "old");
  const CKRString keep = m_Scratch.Wide("keep.reg");
  const struct {
    const char* what;
    const wchar_t* path;
  } refused[] = {{"no backslash", L"HKLM"},
                 {"unknown root", L"HKEY_NOWHERE\\Software"},
                 {"bare prefix of a root", L"HKEY_C\\Software"},
                 {"empty root", L"\\Software"},
                 {"missing key", L"HKEY_CURRENT_USER\\Software\\Missing"}};
  for (const auto& item : refused) {
    SCOPED_TRACE(item.what);
    EXPECT_FALSE(CKRRegistry::WriteRegistryTreeToFile(item.path, keep.GetString()));
    EXPECT_EQ(KRLoadText(keep), "old");
  }
  EXPECT_FALSE(CKRRegistry::WriteRegistryTreeToFile(nullptr, L"Software", keep.GetString()));
  EXPECT_FALSE(CKRRegistry::WriteRegistryTreeToFile(HKEY_CURRENT_USER, L"", keep.GetString()));
  EXPECT_FALSE(CKRRegistry::WriteRegistryTreeToFile(HKEY_CURRENT_USER, L"SOFTWARE", L""));
  const CKRString nowhere = m_Scratch.Wide("no/folder.reg");
  EXPECT_FALSE(CKRRegistry::WriteRegistryTreeToFile(HKEY_CURRENT_USER, L"SOFTWARE", nowhere.GetString()));
  // Nothing but the kept file is left in the folder (no temporary files).
  std::vector<std::string> names;
  for (const auto& entry : std::filesystem::directory_iterator(m_Scratch.Native()))
    names.push_back(entry.path().filename().string());
  std::sort(names.begin(), names.end());
  EXPECT_EQ(names, (std::vector<std::string>{"keep.reg", "store"}));
}

// The written file format, checked with an independent reading of the
// bytes (levels, element names, attributes, orders), and the reading of
// fields from hand-made files: missing values, duplicate field elements,
// names that are no GUID forms, any root name.
#include <krCoreLib/storage/xml/CKRXMLFileFieldStream.h>

#include "KRXMLTestSupport.h"

using namespace KRTestFields;

namespace {

class CKRXMLFileFieldStreamTest : public testing::Test {
protected:
  void SetUp() override { CKRTypeSystem::Initialize(kXMLTestRepository); }

  // A file of one document holding one record with the given field
  // elements (raw XML), with the record's element name `objectName`.
  std::string RecordFile(const std::string& fields, const std::string& root = "KRXML") {
    return "<?xml version=\"1.0\" encoding=\"UTF-8\"?>\n<" + root + "><" + KRElementForm(kXMLTestDocument) + "><" +
           KRElementForm(CKRTestRecord::TypeID) + "><" + KRElementForm(m_ID) + ">" + fields + "</" +
           KRElementForm(m_ID) + "></" + KRElementForm(CKRTestRecord::TypeID) + "></" +
           KRElementForm(kXMLTestDocument) + "></" + root + ">";
  }
  std::string Field(const CKRGuid& field, const std::string& attributes) {
    return "<" + KRElementForm(field) + " " + attributes + "/>";
  }

  CKRScratchFolder m_Scratch;
  const CKRGuid m_ID = CKRGuid::CreateNewGUID();
};

}  // namespace

// One object with a string field, an empty link, a set link and a
// two-element collection: four levels below "KRXML", type elements in the
// order their first object was stored, fields in the object's order, links
// as "T" and "I", every name 23 characters starting with "_", every ID 22.
TEST_F(CKRXMLFileFieldStreamTest, WritesTheFourLevelsInTheirOrders) {
  CKRTestRecord* root = NewRecord(L"a<b>&\"c'");
  CKRTestRecord* next = NewRecord(L"next");
  CKRTestLeaf* leaf = static_cast<CKRTestLeaf*>(CKRTestLeaf::GetCKRTestLeafType()->CreateInstance(CKRGuid()));
  CKRTestRecord* child = NewRecord(L"child");
  root->m_Count = 7;
  root->m_pNext = next;
  root->m_Children.Add(child);
  root->m_Children.Add(next);
  root->m_WriteOnly = L"w";
  const std::string path = m_Scratch.Path("format.xml");
  ASSERT_TRUE(KRSaveXML(path, {leaf, root}));

  const std::string bytes = KRReadBytes(path);
  EXPECT_EQ(bytes.rfind("<?xml version=\"1.0\" encoding=\"UTF-8\"", 0), 0u) << bytes.substr(0, 60);
  const SKRTestElement file = CKRTestXMLReader::Read(bytes);
  EXPECT_EQ(file.m_Name, "KRXML");
  EXPECT_TRUE(file.m_Attributes.empty());
  ASSERT_EQ(file.m_Children.size(), 1u);
  const SKRTestElement& document = file.m_Children[0];
  EXPECT_EQ(document.m_Name, KRElementForm(kXMLTestDocument));
  // The leaf was stored first, then the record type.
  ASSERT_EQ(document.m_Children.size(), 2u);
  EXPECT_EQ(document.m_Children[0].m_Name, KRElementForm(CKRTestLeaf::TypeID));
  const SKRTestElement& records = document.m_Children[1];
  EXPECT_EQ(records.m_Name, KRElementForm(CKRTestRecord::TypeID));
  // Objects in the order their headers were written: the root, then what
  // it links, depth first.
  ASSERT_EQ(records.m_Children.size(), 3u);
  EXPECT_EQ(records.m_Children[0].m_Name, KRElementForm(root->GetInstanceID()));
  EXPECT_EQ(records.m_Children[1].m_Name, KRElementForm(next->GetInstanceID()));
  EXPECT_EQ(records.m_Children[2].m_Name, KRElementForm(child->GetInstanceID()));
  const SKRTestElement& object = records.m_Children[0];
  // Name, Count, Ref, Next, Children, WriteOnly (ReadOnly is not written).
  ASSERT_EQ(object.m_Children.size(), 6u);
  const std::vector<CKRGuid> order{kName, kCount, kRef, kNext, kChildren, kWriteOnly};
  for (std::size_t i = 0; i < order.size(); ++i)
    EXPECT_EQ(object.m_Children[i].m_Name, KRElementForm(order[i])) << i;
  ASSERT_EQ(object.m_Children[0].m_Attributes.size(), 1u);
  EXPECT_EQ(*object.m_Children[0].Attribute("V"), "a<b>&\"c'");
  EXPECT_EQ(*object.m_Children[1].Attribute("V"), "7");
  const SKRTestElement& link = object.m_Children[3];
  ASSERT_EQ(link.m_Attributes.size(), 2u);  // in the XML library's order
  EXPECT_EQ(*link.Attribute("T"), KRXML64(CKRTestRecord::TypeID));
  EXPECT_EQ(*link.Attribute("I"), KRXML64(next->GetInstanceID()));
  const SKRTestElement& collection = object.m_Children[4];
  EXPECT_TRUE(collection.m_Attributes.empty());
  ASSERT_EQ(collection.m_Children.size(), 2u);
  EXPECT_EQ(collection.m_Children[0].m_Name, "L");
  EXPECT_EQ(*collection.m_Children[0].Attribute("I"), KRXML64(child->GetInstanceID()));
  EXPECT_EQ(*collection.m_Children[1].Attribute("I"), KRXML64(next->GetInstanceID()));
  // The child's empty link: the element without attributes.
  const SKRTestElement& childLink = records.m_Children[2].m_Children[3];
  EXPECT_EQ(childLink.m_Name, KRElementForm(kNext));
  EXPECT_TRUE(childLink.m_Attributes.empty());

  // Every name below the root 23 characters starting with "_" (or "L"),
  // every "T" and "I" 22 characters, and the levels no deeper than five.
  std::vector<std::pair<const SKRTestElement*, int>> walk{{&file, 0}};
  while (!walk.empty()) {
    const auto [element, level] = walk.back();
    walk.pop_back();
    ASSERT_LE(level, 5);
    if (level > 0 && element->m_Name != "L") {
      EXPECT_EQ(element->m_Name.size(), 23u);
      EXPECT_EQ(element->m_Name[0], '_');
    }
    EXPECT_EQ(element->m_Name == "L", level == 5);
    for (const auto& [key, value] : element->m_Attributes) {
      if (key != "V") {
        EXPECT_EQ(value.size(), 22u);
      }
    }
    for (const SKRTestElement& child2 : element->m_Children)
      walk.emplace_back(&child2, level + 1);
  }
  for (IKRObject* object2 : std::initializer_list<IKRObject*>{root, next, child, leaf})
    object2->Release();
}

// Values of every kind of character survive: markup characters, line
// ends, tabs, leading and trailing spaces, characters beyond the BMP and
// very long texts.
TEST_F(CKRXMLFileFieldStreamTest, ValuesRoundTripCharacterForCharacter) {
  const std::vector<std::wstring> values{L"", L"plain", L"<&>\"'", L"line\nend\r\n\ttab", L"  spaced  ",
                                         L"\u00e9\u4e2d\U0001F600\U0010FFFD", std::wstring(100000, L'x')};
  for (const std::wstring& value : values) {
    SCOPED_TRACE(CKRString(value).ToUtf8().substr(0, 40));
    CKRTestRecord* record = NewRecord(value.c_str());
    const std::string path = m_Scratch.Path("values.xml");
    ASSERT_TRUE(KRSaveXML(path, {record}));
    SKRXMLLoad load = KRLoadXML(path);
    ASSERT_TRUE(load.m_Opened);
    auto* loaded = dynamic_cast<CKRTestRecord*>(load.Document()->GetObject(record->GetInstanceID(), CKRTestRecord::TypeID));
    ASSERT_NE(loaded, nullptr);
    EXPECT_EQ(loaded->m_Name.str(), value);
    loaded->Release();
    load.Release();
    record->Release();
  }
}

// A value the file cannot hold (a control character XML 1.0 does not
// allow) makes the save fail instead of writing a file that does not read
// back; the old file stays.
TEST_F(CKRXMLFileFieldStreamTest, AValueXMLCannotHoldFailsTheSave) {
  const std::string path = m_Scratch.Path("control.xml");
  KRWriteBytes(path, "old");
  CKRTestRecord* record = NewRecord(L"bell\x07");
  EXPECT_FALSE(KRSaveXML(path, {record}));
  EXPECT_EQ(KRReadBytes(path), "old");
  EXPECT_EQ(KRFolderEntries(m_Scratch.Root()).size(), 1u);
  record->Release();
}

// Reading hand-made files: a missing "V" reads as empty text; a field whose
// element occurs twice fails alone (the object does not load, the other
// fields read and the object loads); any root name works; text, comments
// and processing instructions are passed over; null-GUID and wrongly sized
// names are skipped at every level.
TEST_F(CKRXMLFileFieldStreamTest, ReadsFieldsAsTheFileHasThem) {
  const std::string path = m_Scratch.Path("made.xml");
  KRWriteBytes(path, RecordFile(Field(kName, "") + Field(kCount, "V=\"5\""), "AnyRoot"));
  SKRXMLLoad load = KRLoadXML(path);
  ASSERT_TRUE(load.m_Opened);
  auto* record = dynamic_cast<CKRTestRecord*>(load.Document()->GetObject(m_ID, CKRTestRecord::TypeID));
  ASSERT_NE(record, nullptr);
  EXPECT_EQ(record->m_Name, L"");
  EXPECT_EQ(record->m_Count, 5);
  EXPECT_EQ(record->m_pNext, nullptr);  // no element: the link reads as null
  record->Release();
  load.Release();

  // The duplicate Count fails that field only: it keeps its value.
  const std::string nullName = "_" + std::string(22, 'A');
  KRWriteBytes(path, RecordFile(Field(kName, "V=\"n\"") + Field(kCount, "V=\"1\"") + Field(kCount, "V=\"2\"")));
  load = KRLoadXML(path);
  ASSERT_TRUE(load.m_Opened);
  record = dynamic_cast<CKRTestRecord*>(load.Document()->GetObject(m_ID, CKRTestRecord::TypeID));
  ASSERT_NE(record, nullptr);
  EXPECT_EQ(record->m_Name, L"n");
  EXPECT_EQ(record->m_Count, 0);
  record->Release();
  load.Release();

  // Text, comments, character data sections and processing instructions
  // around and between the field elements are not part of the store.
  KRWriteBytes(path, RecordFile("text<!-- a comment -->" + Field(kName, "V=\"n\"") + "<?pi data?><![CDATA[<x/>]]>&amp;" +
                                Field(kCount, "V=\"3\"") + "\n  "));
  load = KRLoadXML(path);
  ASSERT_TRUE(load.m_Opened);
  record = dynamic_cast<CKRTestRecord*>(load.Document()->GetObject(m_ID, CKRTestRecord::TypeID));
  ASSERT_NE(record, nullptr);
  EXPECT_EQ(record->m_Name, L"n");
  EXPECT_EQ(record->m_Count, 3);
  record->Release();
  load.Release();

  // Elements named by the null GUID, by a short name and by 24 characters
  // are skipped.

  std::string skipped = RecordFile(Field(kName, "V=\"n\""));
  const std::size_t rootEnd = skipped.find("</KRXML>");
  skipped.insert(rootEnd, "<" + nullName + "/><_short/><" + KRElementForm(CKRGuid::CreateNewGUID()) + "x/>");
  KRWriteBytes(path, skipped);
  load = KRLoadXML(path);
  ASSERT_TRUE(load.m_Opened);
  EXPECT_EQ(load.m_pArchive->GetDocumentCollection()->GetCount(), 1);
  load.Release();
}

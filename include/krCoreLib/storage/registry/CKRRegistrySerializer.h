// CKRRegistrySerializer: a document bound to one registry location that
// stores framework objects as registry keys and values the moment they are
// serialized (there is no archive and no save step). Its manifests are
// CKRRegistryTypeManifests, its streams CKRRegistryFieldStreams.
//
// Layout below root \ location (GUIDs braced and lower-case, 38
// characters; keys created volatile, opened with full access):
//
//   {type ID}                   "Type Manifest Name" (string): the type's name
//   {type ID}\{instance ID}     one value per stored field, named by the
//                               field's name:
//     field with string storage   string: the field's text
//     link                        binary string list "T:{type ID}",
//                                 "I:{instance ID}" (two empty strings for
//                                 an empty link)
//     link collection             binary string list, two strings as above
//                                 per linked object in iteration order
//
// Binary values use the platform class library's archive layout (all
// numbers little-endian):
//
//   count     a 16-bit count below 0xFFFF; otherwise the word 0xFFFF and a
//             32-bit count
//   string    the byte 0xFF and the word 0xFFFE (UTF-16 follows), then the
//             length in UTF-16 code units: a byte below 0xFF; otherwise the
//             byte 0xFF and a word below 0xFFFF; otherwise the byte 0xFF, the
//             word 0xFFFF and a 32-bit length; then the code units, without
//             a terminator. Reading also takes strings without the marker
//             (one byte per character, read as Latin-1).
//   string list, string array    count, then each string
//   byte array                   count, then the bytes
//   16-bit / 32-bit array        count, then each number
//   rectangle   32-bit array of 5: top, bottom, left, right, 0
//   point       32-bit array of 5: x, y, 0, 0, 0
//
// Example: a list of the one string "ab" is 01 00 | FF FE FF 02 | 61 00 62 00.
//
// Values of any size are read (the size is asked first); a value of the
// wrong type, a binary value that does not hold exactly one well-formed
// collection, or one that ends early fails the read and leaves the target
// unchanged. A string value is read up to its first null character, or to
// its end when it has none. Every operation records the platform status
// of its last registry call (GetLastResult).
//
// Keys: the serializer holds one current key; every open, create or verify
// replaces it, closing the one it opened before. A failed open leaves no
// current key, so that value operations fail instead of acting on another
// key. The root key is the caller's and never closed. Not synchronised: a
// serializer is used by one thread at a time.
#pragma once

#include <krCoreLib/platform/KRRegistryAPI.h>
#include <krCoreLib/serialization/CKRDocument.h>
#include <krCoreLib/storage/registry/KRRegistryValues.h>

#include <cstdint>
#include <vector>

class CKRRegistryTypeManifest;
class CKRRegistryFieldStream;

class KRCORELIB_API CKRRegistrySerializer : public CKRDocument {
  KR_DECLARE_OBJECT_TYPE(CKRRegistrySerializer, CKRObjectTypeImpl, "{6B835319-DE4F-445F-AC3A-2794DD5F1265}")

public:
  // The value under every type key that names the type.
  static constexpr const wchar_t* kTypeManifestName = L"Type Manifest Name";

  // Closes the current key, then the base's release (the manifests go).
  int OnBeforeRelease() override;

  // --- Location and keys: 1 on success, 0 on failure.

  // The root key (predefined or open, the caller's) and the path of the
  // serializer's key below it; both the current and the root key become
  // `root`. 0, changing nothing, for a null root or an empty path.
  virtual int SetLocation(HKEY root, const CKRString& path);
  // Opens root \ location as the current key and builds a manifest per
  // subkey named by a valid GUID, each with a stream per subkey of its own
  // named by a valid GUID; 1 also when the key does not exist (nothing is
  // loaded). 0 without a location.
  int Open() override;
  // Location `path` below `root`, opened as the current key.
  virtual int OpenRegistry(HKEY root, const CKRString& path);
  // Creates (or opens) root \ path, volatile, as the current key.
  virtual int CreateKey(HKEY root, const CKRString& path);
  // Opens root \ path as the current key: 1 when it exists.
  virtual int VerifyKey(HKEY root, const CKRString& path);
  // The same below the current key.
  virtual int VerifyKey(const CKRString& path);
  // 1 when the current key has a value `name`.
  virtual int VerifyValue(const CKRString& name);
  // Closes the current key, if any: 1.
  virtual int CloseRegistry();
  virtual int DeleteValue(const CKRString& name);
  // Deletes the key root \ path with everything below it.
  virtual int DeleteValueKey(HKEY root, const CKRString& path);
  // Appends the names of the current key's subkeys, in enumeration order
  // and of any length, to `list`; returns the list's count.
  virtual int EnumerateSubKeys(CKRRegistryStringList& list);

  // --- Values of the current key: 1 on success, 0 on failure.

  // 32-bit number values (pass an int or an unsigned long; other integer
  // types need a cast). An unsigned long above 0xFFFFFFFF is refused.
  int Write(const CKRString& name, int value);
  int Write(const CKRString& name, unsigned long value);
  // A string value with its terminator.
  int Write(const CKRString& name, const CKRString& text);
  int Write(const CKRString& name, const wchar_t* text) { return Write(name, CKRString(text)); }
  // Binary values in the layout above.
  int Write(const CKRString& name, const CKRRegistryByteArray& bytes);
  int Write(const CKRString& name, const CKRRegistryWordArray& numbers);
  int Write(const CKRString& name, const CKRRegistryDWordArray& numbers);
  int Write(const CKRString& name, const CKRRegistryStringArray& strings);
  int Write(const CKRString& name, const CKRRegistryStringList& strings);
  int Write(const CKRString& name, const CKRScreenRect& rect);
  int Write(const CKRString& name, const CKRScreenPoint& point);

  int Read(const CKRString& name, int& value);
  int Read(const CKRString& name, unsigned long& value);
  int Read(const CKRString& name, CKRString& text);
  int Read(const CKRString& name, CKRRegistryByteArray& bytes);
  int Read(const CKRString& name, CKRRegistryWordArray& numbers);
  int Read(const CKRString& name, CKRRegistryDWordArray& numbers);
  int Read(const CKRString& name, CKRRegistryStringArray& strings);
  int Read(const CKRString& name, CKRRegistryStringList& strings);
  // Elements 0 to 3 (top, bottom, left, right); fewer elements fail.
  int Read(const CKRString& name, CKRScreenRect& rect);
  // Elements 0 and 1 (x, y); fewer elements fail.
  int Read(const CKRString& name, CKRScreenPoint& point);

  // --- State.

  // The platform status of the most recent registry call (0: success).
  long GetLastResult() const { return m_LastResult; }
  // Type and size of the value most recently read or written (strings
  // written: characters with the terminator; otherwise bytes).
  std::uint32_t GetLastValueType() const { return m_LastValueType; }
  std::uint32_t GetLastValueSize() const { return m_LastValueSize; }
  HKEY GetCurrentKey() const { return m_hCurrentKey; }
  HKEY GetRootKey() const { return m_hRootKey; }
  const CKRString& GetLocation() const { return m_Location; }
  // location \ {type ID} and location \ {type ID} \ {instance ID}.
  CKRString GetTypeKeyPath(CKRGuid typeID) const;
  CKRString GetObjectKeyPath(CKRGuid typeID, CKRGuid instanceID) const;

  // Without a type, a CKRRegistryTypeManifest bound to this serializer;
  // with one, the base's result.
  CKRTypeManifest* CreateTypeManifest(CKRGuid typeID, IKRObjectType* manifestType) override;

protected:
  CKRRegistrySerializer() = default;
  ~CKRRegistrySerializer() override = default;

private:
  friend class CKRRegistryTypeManifest;
  friend class CKRRegistryFieldStream;

  // Makes `key` the current key, closing the previous one when this
  // serializer opened it.
  void ReplaceCurrentKey(HKEY key, bool owned);
  // Opens or creates `path` below `base` as the current key.
  int OpenCurrent(HKEY base, const CKRString& path, bool create);
  // Opens or creates root \ `subPath` (built on the location): 0 without a
  // root or location.
  int OpenStored(const CKRString& subPath, bool create);
  int SetValue(const CKRString& name, std::uint32_t type, const std::vector<std::uint8_t>& bytes);
  // The whole value `name` of type `type`, of any size the store holds.
  bool QueryValue(const CKRString& name, std::uint32_t type, std::vector<std::uint8_t>& bytes);
  template <typename T>
  int WriteNumbers(const CKRString& name, const std::vector<T>& numbers);
  template <typename T>
  int ReadNumbers(const CKRString& name, std::vector<T>& numbers);
  int WriteStrings(const CKRString& name, const std::vector<CKRString>& strings);
  int ReadStrings(const CKRString& name, std::vector<CKRString>& strings);

  long m_LastResult = KRERROR_SUCCESS;
  std::uint32_t m_LastValueType = KRREG_NONE;
  std::uint32_t m_LastValueSize = 0;
  HKEY m_hCurrentKey = nullptr;
  HKEY m_hRootKey = nullptr;
  CKRString m_Location;
  bool m_OwnsCurrentKey = false;
};

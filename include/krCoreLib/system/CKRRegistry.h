// CKRRegistry: an application's settings in the registry, below
// root\SOFTWARE\company\application, with typed reads and writes, and the
// export of any registry subtree to a REGEDIT4 text file.
//
// Every Get and Put needs the three keys Initialize opens (else
// KRREGISTRY_NOT_INITIALIZED), then creates or opens `section` (a
// "\"-separated path, empty for the base key itself) below the base key:
// `key` when given, else the application key. Reading therefore creates a
// missing section. `entry` names the value (empty or null: the key's default
// value).
//
// Stored forms: numbers as type 4 (4 bytes, little-endian); texts as type 1,
// UTF-16 with a terminating null; string lists as type 7, each string
// followed by a null and the list by one more; GUID maps as a key `entry`
// below the section holding one type 1 value per map entry, named by the
// braced GUID ("{xxxxxxxx-...}", CKRGuid::GetCString).
//
// What is refused rather than stored wrongly (KRREGISTRY_FAILED, nothing
// written): a long or unsigned long beyond the 32 bits of type 4; a text
// with a null character (it would read back cut short); a string list with
// an empty string or one holding a null (the list would read back ending
// there). Reading is robust against any stored data: texts and lists of any
// length up to kMaxValueSize are read whole; a text without its terminator
// ends at the end of the data; a stray odd byte is ignored; an unpaired
// UTF-16 surrogate reads as U+FFFD; a number whose size is not 4, or any
// value larger than kMaxValueSize, gives KRREGISTRY_FAILED and the default.
//
// Thread safety: an object is used by one thread at a time; the store
// itself may be shared by threads and processes. Nothing throws.
#pragma once

#include <krCoreLib/core/CKRString.h>
#include <krCoreLib/objectmodel/CKRGuid.h>
#include <krCoreLib/platform/KRRegistryAPI.h>

#include <cstdint>
#include <map>
#include <string>
#include <vector>

// The result of every CKRRegistry operation.
enum _EKRRegistryErrors : int {
  KRREGISTRY_SUCCESS = 0,
  KRREGISTRY_NO_APPLICATION_KEY = 1,  // the application key could not be created
  KRREGISTRY_NO_COMPANY_KEY = 2,      // the company key could not be created
  KRREGISTRY_NO_SOFTWARE_KEY = 3,     // "SOFTWARE" could not be opened under the root key
  KRREGISTRY_NOT_INITIALIZED = 4,     // one of the three keys is missing
  KRREGISTRY_FAILED = 6,              // a key or value could not be made, opened, read or written, or is absent
  KRREGISTRY_WRONG_TYPE = 7,          // the value exists with another type than the one asked for
};

class KRCORELIB_API CKRRegistry {
public:
  // Largest value read, in bytes: the store's own bound (1 MiB). A larger
  // value can only come from a damaged or foreign store and is not read.
  static constexpr std::uint32_t kMaxValueSize = KRREG_MAX_VALUE_SIZE;
  // Deepest key nesting the export descends into, as the desktop
  // registry's limit of 512 levels; a deeper tree fails the export.
  static constexpr int kMaxExportDepth = 512;

  CKRRegistry() noexcept = default;
  CKRRegistry(const wchar_t* company, const wchar_t* application, HKEY root);
  // Closes the keys.
  virtual ~CKRRegistry();
  CKRRegistry(const CKRRegistry&) = delete;
  CKRRegistry& operator=(const CKRRegistry&) = delete;

  // Opens root\SOFTWARE for reading, then creates or opens `company` below
  // it and `application` below that (all access). Keys held before are
  // closed first. Null or empty company or application names fail (2 or 1).
  _EKRRegistryErrors Initialize(const wchar_t* company, const wchar_t* application, HKEY root);
  _EKRRegistryErrors GetState() const noexcept { return m_eState; }
  HKEY GetApplicationKey() const noexcept { return m_hApplicationKey; }
  HKEY GetCompanyKey() const noexcept { return m_hCompanyKey; }
  HKEY GetSoftwareKey() const noexcept { return m_hSoftwareKey; }

  // Numbers and texts: `value` is set to `defaultValue` first and keeps it
  // unless the entry is read.
  _EKRRegistryErrors GetRegValue(const wchar_t* section, const wchar_t* entry, int& value, int defaultValue,
                                 HKEY key = nullptr);
  _EKRRegistryErrors GetRegValue(const wchar_t* section, const wchar_t* entry, long& value, long defaultValue,
                                 HKEY key = nullptr);
  _EKRRegistryErrors GetRegValue(const wchar_t* section, const wchar_t* entry, unsigned long& value,
                                 unsigned long defaultValue, HKEY key = nullptr);
  _EKRRegistryErrors GetRegValue(const wchar_t* section, const wchar_t* entry, CKRString& value,
                                 const CKRString& defaultValue, HKEY key = nullptr);
  // The list is emptied first.
  _EKRRegistryErrors GetRegValue(const wchar_t* section, const wchar_t* entry, std::vector<CKRString>& value,
                                 HKEY key = nullptr);
  // The map is emptied first; values of the key `entry` whose names are not
  // braced GUIDs, or that are not texts, are left out.
  _EKRRegistryErrors GetRegValue(const wchar_t* section, const wchar_t* entry, std::map<CKRGuid, CKRString>& value,
                                 HKEY key = nullptr);

  _EKRRegistryErrors PutRegValue(const wchar_t* section, const wchar_t* entry, int value, HKEY key = nullptr);
  _EKRRegistryErrors PutRegValue(const wchar_t* section, const wchar_t* entry, long value, HKEY key = nullptr);
  _EKRRegistryErrors PutRegValue(const wchar_t* section, const wchar_t* entry, unsigned long value,
                                 HKEY key = nullptr);
  _EKRRegistryErrors PutRegValue(const wchar_t* section, const wchar_t* entry, const CKRString& value,
                                 HKEY key = nullptr);
  _EKRRegistryErrors PutRegValue(const wchar_t* section, const wchar_t* entry, const std::vector<CKRString>& value,
                                 HKEY key = nullptr);
  // Replaces every GUID-named value of the key `entry` by the map's entries;
  // other values of that key stay.
  _EKRRegistryErrors PutRegValue(const wchar_t* section, const wchar_t* entry,
                                 const std::map<CKRGuid, CKRString>& value, HKEY key = nullptr);

  // Hooks for derived classes that keep settings of their own; 1 here.
  virtual int Save();
  virtual int Load();

  // Writes the tree below root\subkey to `file` as REGEDIT4 text (8-bit,
  // lines ending in CR LF). The file is written under a temporary name in
  // its folder and renamed over `file` only when everything was written: on
  // any failure (a key or value unreadable or larger than kMaxValueSize, a
  // short write, nesting beyond kMaxExportDepth) it returns false and `file`
  // is as it was. Forms:
  // - a text (type 1) whose characters all lie below U+0100 as the quoted
  //   text: '"' and '\' escaped with '\', characters 0x20 to 0x7E and 0xA0
  //   to 0xFF as themselves, others as '\' and two hex digits; a text with
  //   a character above U+00FF, or stored data that is not a terminated
  //   UTF-16 text, as "hex(1):" and its bytes, so that nothing is lost;
  // - a number (type 4 of 4 bytes) as "dword:" and 8 hex digits;
  // - binary data as "hex:", expandable texts (type 2), string lists and
  //   every other type as "hex(t):" with t in hex, and their bytes.
  // Bytes are two lower-case hex digits separated by ","; after the bytes
  // at positions 16, 32, ... (from 0) the line continues on the next: ","
  // then "\" and CR LF, and two spaces. Key paths and value names are
  // written one byte per character; a character above U+00FF in them is
  // written as "?", and '"' and '\' in a value name are escaped with '\'.
  static bool WriteRegistryTreeToFile(HKEY root, const wchar_t* subkey, const wchar_t* file);
  // The same for a path "ROOT\subkey", ROOT being a root key's name or its
  // short form (HKCR, HKCU, HKLM, HKCC, HKU, HKPD, HKDD): the whole part
  // before the first "\", case-sensitive (so "HKEY_C" names no root); false
  // for a path without "\" or with an unknown root.
  static bool WriteRegistryTreeToFile(const wchar_t* keyPath, const wchar_t* file);

private:
  // The section key below the base key (all access), or the reason why not.
  _EKRRegistryErrors OpenSection(const wchar_t* section, HKEY key, HKEY& opened) const;
  // The key `entry` below the section (all access), created when `create`
  // is set: the key that holds a GUID map.
  _EKRRegistryErrors OpenMapKey(const wchar_t* section, const wchar_t* entry, HKEY key, bool create, HKEY& map) const;
  // The bytes of a value of the given type in the section; wrong type: 7.
  _EKRRegistryErrors ReadEntry(const wchar_t* section, const wchar_t* entry, HKEY key, std::uint32_t type,
                               std::string& bytes) const;
  _EKRRegistryErrors WriteEntry(const wchar_t* section, const wchar_t* entry, HKEY key, std::uint32_t type,
                                const std::string& bytes) const;
  _EKRRegistryErrors GetNumber(const wchar_t* section, const wchar_t* entry, std::uint32_t& number, HKEY key) const;
  _EKRRegistryErrors PutNumber(const wchar_t* section, const wchar_t* entry, std::uint32_t number, HKEY key) const;
  void CloseKeys() noexcept;

  _EKRRegistryErrors m_eState = KRREGISTRY_NOT_INITIALIZED;
  HKEY m_hApplicationKey = nullptr;
  HKEY m_hCompanyKey = nullptr;
  HKEY m_hSoftwareKey = nullptr;
};

// The durable store behind the registry calls: two SQLite databases, one
// per user for the ordinary keys and one in the user's runtime folder for
// the volatile keys, opened on one connection (the volatile one attached).
//
// Where the stores live: both in $KR_REGISTRY_DIR when it is set and not
// empty; otherwise the ordinary store in $XDG_CONFIG_HOME/krCoreLib (an
// absolute $XDG_CONFIG_HOME, else ~/.config) and the volatile one in the
// runtime folder of the single-instance code. The folder and the files are
// made owner-only (0700, 0600) and refused when anyone else may use them.
// The location is looked up on every call: a changed $KR_REGISTRY_DIR, or a
// store file that was removed (the runtime folder is cleared at log-out and
// restart), makes the next call reopen; handles to keys of a reopened store
// are then invalid.
//
// Layout of each database: keys(id, parent, name, fold) and
// vals(key, seq, name, fold, type, data). Names are the wide characters'
// bytes; `fold` is each character upper-cased (simple Unicode mapping) as a
// big-endian 32-bit number, so that byte order is the case-insensitive name
// order. `seq` numbers the values of a key in the order first written. Key
// ids are never reused (AUTOINCREMENT); volatile keys count from 2^40 so
// that one id names a key in either store. The seven root keys are the
// ordinary store's ids 1 to 7.
//
// All members are safe to call from any thread (one process-wide mutex;
// every call is one SQLite transaction, so other processes see whole calls).
#pragma once

#include <krCoreLib/platform/KRRegistryAPI.h>

#include <cstdint>

struct SKRRegistryStore {
  // Largest value the store keeps, in bytes: 1 MiB. The desktop registry
  // advises against values beyond a few kilobytes and slows down well below
  // this; a bound keeps a hostile or mistaken caller from filling the disk
  // one call at a time.
  static constexpr std::uint32_t kMaxValueSize = 1u << 20;
  // Longest key name (one part of a path) is 254 characters and longest
  // value name 16383 characters, as on the desktop registry.
  static constexpr std::size_t kMaxKeyNameLength = 254;
  static constexpr std::size_t kMaxValueNameLength = 16383;
  // How long a call waits for another writer before it gives up with
  // KRERROR_ACCESS_DENIED.
  static constexpr int kBusyTimeoutMs = 5000;

  static long OpenKey(HKEY key, const wchar_t* subKey, std::uint32_t access, bool create, std::uint32_t options,
                      HKEY* result, std::uint32_t* disposition);
  static long QueryInfo(HKEY key, std::uint32_t* subKeys, std::uint32_t* maxSubKeyLength, std::uint32_t* values,
                        std::uint32_t* maxValueNameLength, std::uint32_t* maxValueLength);
  static long QueryValue(HKEY key, const wchar_t* name, std::uint32_t* type, std::uint8_t* data,
                         std::uint32_t* size);
  static long SetValue(HKEY key, const wchar_t* name, std::uint32_t type, const std::uint8_t* data,
                       std::uint32_t size);
  static long EnumValue(HKEY key, std::uint32_t index, wchar_t* name, std::uint32_t* nameLength,
                        std::uint32_t* type, std::uint8_t* data, std::uint32_t* size);
  static long EnumKey(HKEY key, std::uint32_t index, wchar_t* name, std::uint32_t* nameLength);
  static long DeleteValue(HKEY key, const wchar_t* name);
  static long DeleteKey(HKEY key, const wchar_t* subKey);
  static long CloseKey(HKEY key);
};

// The registry calls the settings classes make: a durable, per-user store of
// keys and typed values with the semantics of a desktop system registry.
//
// Keys form a tree below seven predefined root keys. Key and value names
// compare case-insensitively and keep the case they were created with;
// subkeys enumerate in name order, values in the order they were first
// written. A value is a type number and bytes; string data (types 1, 2 and
// 7) is UTF-16 in the stored bytes, with its terminating null character(s).
// Key paths separate their parts with "\".
//
// Every call returns a status code of the platform (KRERROR_...). Handles
// are opaque; a handle returned by an open or create call must be closed with
// KRRegCloseKey. The predefined root keys are never closed. A handle may be
// used by one thread at a time; different handles may be used by different
// threads and processes at once: every change is one atomic, durable
// transaction.
//
// Where it lives: one store per user, $XDG_CONFIG_HOME/krCoreLib/registry.db
// (~/.config when $XDG_CONFIG_HOME is not set), and the volatile keys in
// krCoreLib-volatile-registry.db in the user's runtime folder
// ($XDG_RUNTIME_DIR, else a private folder in /tmp); both in the folder
// $KR_REGISTRY_DIR instead when that is set. Folders are made mode 0700 and
// files 0600; a folder or file that others may use is refused.
//
// Failures: a store that cannot be opened, is not a database, is damaged,
// or stays locked by another writer for more than 5 seconds gives
// KRERROR_ACCESS_DENIED, as does a change through a handle opened with read
// access only. A handle that was never returned, is already closed, or
// refers to a key deleted since (or to a volatile key whose store was
// cleared) gives KRERROR_INVALID_HANDLE; closing it still succeeds for a
// handle of a deleted key. A forked child opens a connection of its own on
// its first call and leaves its parent's alone; handles it inherited are
// then invalid. As with any lock, a child forked while another thread was
// inside a registry call must exec before it uses the registry.
#pragma once

#include <krCoreLib/core/KRExport.h>

#include <cstdint>

// A key handle. The predefined root keys are fixed values, as on the desktop
// platform, so that they can be compared and named.
typedef struct SKRRegKey* HKEY;

#define HKEY_CLASSES_ROOT (reinterpret_cast<HKEY>(static_cast<std::uintptr_t>(0x80000000u)))
#define HKEY_CURRENT_USER (reinterpret_cast<HKEY>(static_cast<std::uintptr_t>(0x80000001u)))
#define HKEY_LOCAL_MACHINE (reinterpret_cast<HKEY>(static_cast<std::uintptr_t>(0x80000002u)))
#define HKEY_USERS (reinterpret_cast<HKEY>(static_cast<std::uintptr_t>(0x80000003u)))
#define HKEY_PERFORMANCE_DATA (reinterpret_cast<HKEY>(static_cast<std::uintptr_t>(0x80000004u)))
#define HKEY_CURRENT_CONFIG (reinterpret_cast<HKEY>(static_cast<std::uintptr_t>(0x80000005u)))
#define HKEY_DYN_DATA (reinterpret_cast<HKEY>(static_cast<std::uintptr_t>(0x80000006u)))

// Status codes.
constexpr long KRERROR_SUCCESS = 0;
constexpr long KRERROR_FILE_NOT_FOUND = 2;
constexpr long KRERROR_ACCESS_DENIED = 5;
constexpr long KRERROR_INVALID_HANDLE = 6;
// A name or size out of bounds: an empty part of a key path, a key name of
// 255 or more characters, a value name of more than 16383 characters, a
// value of more than 1 MiB, or a null buffer with a non-zero size.
constexpr long KRERROR_INVALID_PARAMETER = 87;
constexpr long KRERROR_MORE_DATA = 234;
constexpr long KRERROR_NO_MORE_ITEMS = 259;
// A key created without the volatile option below a volatile key (which
// could not outlive its parent).
constexpr long KRERROR_CHILD_MUST_BE_VOLATILE = 1021;

// Largest value the store keeps, in bytes: 1 MiB. The desktop registry
// advises against values beyond a few kilobytes and slows down well below
// this; the bound keeps a hostile or mistaken caller from filling the disk
// one call at a time, and lets readers refuse larger sizes, which can only
// come from a damaged store, before they allocate.
constexpr std::uint32_t KRREG_MAX_VALUE_SIZE = 1u << 20;

// Value types. Any other type number is stored and returned as bytes.
constexpr std::uint32_t KRREG_NONE = 0;
constexpr std::uint32_t KRREG_SZ = 1;
constexpr std::uint32_t KRREG_EXPAND_SZ = 2;
constexpr std::uint32_t KRREG_BINARY = 3;
constexpr std::uint32_t KRREG_DWORD = 4;
constexpr std::uint32_t KRREG_MULTI_SZ = 7;

// Options of KRRegCreateKeyEx: a volatile key (and every key created below
// it) is shared by the user's processes and gone after a restart.
constexpr std::uint32_t KRREG_OPTION_NON_VOLATILE = 0;
constexpr std::uint32_t KRREG_OPTION_VOLATILE = 1;

// Access masks: a handle opened with read access queries and enumerates,
// and cannot set or delete values of its key. Opening, creating and
// deleting keys below a handle work through any handle (the desktop
// registry checks those against the keys, not the handle).
constexpr std::uint32_t KRKEY_READ = 0x20019;
constexpr std::uint32_t KRKEY_ALL_ACCESS = 0xF003F;

// Dispositions reported by KRRegCreateKeyEx.
constexpr std::uint32_t KRREG_CREATED_NEW_KEY = 1;
constexpr std::uint32_t KRREG_OPENED_EXISTING_KEY = 2;

// Opens `subKey` (a "\"-separated path, empty or null for `key` itself)
// below `key`. On success *result receives a new handle.
KRCORELIB_API long KRRegOpenKeyEx(HKEY key, const wchar_t* subKey, std::uint32_t options, std::uint32_t access,
                                  HKEY* result);

// Opens `subKey` below `key`, creating it and every missing key on its path
// with `options`. `disposition` (may be null) says whether it was created.
KRCORELIB_API long KRRegCreateKeyEx(HKEY key, const wchar_t* subKey, std::uint32_t options, std::uint32_t access,
                                    HKEY* result, std::uint32_t* disposition);

// Counts and sizes of a key; every out parameter may be null. Lengths are in
// characters without the terminator, data sizes in bytes.
KRCORELIB_API long KRRegQueryInfoKey(HKEY key, std::uint32_t* subKeys, std::uint32_t* maxSubKeyLength,
                                     std::uint32_t* values, std::uint32_t* maxValueNameLength,
                                     std::uint32_t* maxValueLength);

// Reads the value `name` (null or empty: the key's default value). `type` and
// `data` may be null. *size holds the buffer's size in bytes on entry and the
// value's size on return; a buffer too small gives KRERROR_MORE_DATA and
// copies nothing.
KRCORELIB_API long KRRegQueryValueEx(HKEY key, const wchar_t* name, std::uint32_t* type, std::uint8_t* data,
                                     std::uint32_t* size);

// Writes the value `name` with `size` bytes of `data`, replacing any value of
// that name (which keeps its place in the enumeration order).
KRCORELIB_API long KRRegSetValueEx(HKEY key, const wchar_t* name, std::uint32_t type, const std::uint8_t* data,
                                   std::uint32_t size);

// The value at `index` in enumeration order: its name into `name` (*nameLength
// characters on entry including the terminator, characters written without it
// on return) and, as KRRegQueryValueEx, its type and data. KRERROR_NO_MORE_ITEMS
// past the last value; KRERROR_MORE_DATA when a buffer is too small.
KRCORELIB_API long KRRegEnumValue(HKEY key, std::uint32_t index, wchar_t* name, std::uint32_t* nameLength,
                                  std::uint32_t* type, std::uint8_t* data, std::uint32_t* size);

// The name of the subkey at `index` in name order, as KRRegEnumValue.
KRCORELIB_API long KRRegEnumKeyEx(HKEY key, std::uint32_t index, wchar_t* name, std::uint32_t* nameLength);

// Deletes the value `name` of `key`.
KRCORELIB_API long KRRegDeleteValue(HKEY key, const wchar_t* name);

// Deletes `subKey` below `key` with everything below it.
KRCORELIB_API long KRRegDeleteKey(HKEY key, const wchar_t* subKey);

// Closes a handle returned by an open or create call.
KRCORELIB_API long KRRegCloseKey(HKEY key);

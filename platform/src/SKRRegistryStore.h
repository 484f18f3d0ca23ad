// The durable store behind the registry calls of KRRegistryAPI.h, which
// SKRRegistryStore.cpp defines: two SQLite databases, one per user for the
// ordinary keys and one in the user's runtime folder for the volatile keys,
// opened on one connection (the volatile one attached).
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
// Every call is safe from any thread (one process-wide mutex) and is one
// SQLite transaction, so other processes see whole calls.
#pragma once

#include <krCoreLib/platform/KRRegistryAPI.h>

#include <cstdint>

// The store's bounds.
struct SKRRegistryStore {
  // Longest key name (one part of a path) is 254 characters and longest
  // value name 16383 characters, as on the desktop registry.
  static constexpr std::size_t kMaxKeyNameLength = 254;
  static constexpr std::size_t kMaxValueNameLength = 16383;
  // How long a call waits for another writer before it gives up with
  // KRERROR_ACCESS_DENIED.
  static constexpr int kBusyTimeoutMs = 5000;
};

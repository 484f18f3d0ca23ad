#include "SKRRegistryStore.h"

#include "SKRInstanceChannel.h"
#include "SKROwnerOnly.h"

#include <sqlite3.h>

#include <algorithm>
#include <array>
#include <cerrno>
#include <cstdlib>
#include <cstring>
#include <cwctype>
#include <fcntl.h>
#include <locale.h>
#include <map>
#include <mutex>
#include <pwd.h>
#include <string>
#include <sys/stat.h>
#include <unistd.h>
#include <unordered_set>
#include <vector>
#include <wctype.h>

namespace {

// Volatile keys are numbered from here, so that an id says which store
// holds the key (2^40 leaves the ordinary store a trillion keys).
constexpr std::int64_t kVolatileBase = std::int64_t(1) << 40;
constexpr std::int64_t kRootCount = 7;
// The access bit that lets a handle change its key's values.
constexpr std::uint32_t kWriteAccess = 0x0002;
const char* const kVolatileFile = "krCoreLib-volatile-registry.db";

using SKRBytes = std::string;  // names and folds as raw bytes

bool IsVolatile(std::int64_t id) noexcept {
  return id >= kVolatileBase;
}

// The C.UTF-8 locale gives towupper the Unicode mapping whatever locale the
// host selected; without it only ASCII letters fold.
locale_t FoldLocale() {
  static const locale_t locale = ::newlocale(LC_CTYPE_MASK, "C.UTF-8", locale_t(0));
  return locale;
}

wchar_t FoldChar(wchar_t c) {
  if (c < 0x80)
    return (c >= L'a' && c <= L'z') ? wchar_t(c - 32) : c;
  const locale_t locale = FoldLocale();
  return locale != locale_t(0) ? wchar_t(::towupper_l(wint_t(c), locale)) : c;
}

SKRBytes NameBytes(const wchar_t* text, std::size_t length) {
  return SKRBytes(reinterpret_cast<const char*>(text), length * sizeof(wchar_t));
}

SKRBytes FoldBytes(const wchar_t* text, std::size_t length) {
  SKRBytes fold(length * 4, '\0');
  for (std::size_t i = 0; i < length; ++i) {
    const auto c = std::uint32_t(FoldChar(text[i]));
    fold[4 * i] = char(c >> 24);
    fold[4 * i + 1] = char(c >> 16);
    fold[4 * i + 2] = char(c >> 8);
    fold[4 * i + 3] = char(c);
  }
  return fold;
}

// Splits a "\"-separated path; false for an empty part or a part longer
// than a key name may be.
bool SplitPath(const wchar_t* path, std::vector<std::wstring>& parts) {
  parts.clear();
  if (path == nullptr || path[0] == L'\0')
    return true;
  const wchar_t* start = path;
  for (const wchar_t* at = path;; ++at) {
    if (*at == L'\\' || *at == L'\0') {
      const auto length = std::size_t(at - start);
      if (length == 0 || length > SKRRegistryStore::kMaxKeyNameLength)
        return false;
      parts.emplace_back(start, length);
      if (*at == L'\0')
        return true;
      start = at + 1;
    }
  }
}

// Where an enumeration stopped, so that the next index continues from there
// instead of counting again from the start. Valid only while neither store
// changed (`m_Stamp`).
struct SKREnumCursor {
  std::int64_t m_nIndex = -1;
  std::int64_t m_nSeq = 0;  // values: the seq of item m_nIndex
  SKRBytes m_Fold;          // subkeys: the fold of item m_nIndex
  std::array<std::int64_t, 3> m_Stamp{};
};

}  // namespace

// What a handle refers to: a key by its id, and the generation of the store
// the id belongs to, so that a handle outliving its store is refused.
struct SKRRegKey {
  std::int64_t m_nId = 0;
  std::uint64_t m_nGeneration = 0;
  bool m_bWritable = false;
  SKREnumCursor m_Values;
  SKREnumCursor m_Keys;
};

namespace {

struct SKRFileIdentity {
  dev_t m_Device = 0;
  ino_t m_Inode = 0;
  bool operator==(const SKRFileIdentity&) const = default;
};

bool Identify(const std::string& path, SKRFileIdentity& identity) {
  struct stat info {};
  if (::stat(path.c_str(), &info) != 0)
    return false;
  identity = {info.st_dev, info.st_ino};
  return true;
}

// Makes `path` an owner-only folder (creating it and missing parents);
// false when it is not a directory of ours closed to others.
bool PrepareFolder(const std::string& path, bool checkOwnerOnly) {
  if (path.empty())
    return false;
  for (std::size_t slash = path.find('/', 1);; slash = path.find('/', slash + 1)) {
    const std::string part = path.substr(0, slash);
    if (::mkdir(part.c_str(), 0700) != 0 && errno != EEXIST)
      return false;
    if (slash == std::string::npos)
      break;
  }
  const int fd = ::open(path.c_str(), O_RDONLY | O_DIRECTORY | O_CLOEXEC);
  if (fd < 0)
    return false;
  const bool good = !checkOwnerOnly || SKROwnerOnly::Check(fd, S_IFDIR);
  ::close(fd);
  return good;
}

// Creates the store file owner-only when missing (never through a symbolic
// link) and checks that nobody else may use it.
bool PrepareFile(const std::string& path, SKRFileIdentity& identity) {
  const int fd = ::open(path.c_str(), O_RDWR | O_CREAT | O_NOFOLLOW | O_CLOEXEC | O_NOCTTY, 0600);
  if (fd < 0)
    return false;
  struct stat info {};
  const bool good = SKROwnerOnly::Check(fd, S_IFREG) && ::fstat(fd, &info) == 0;
  ::close(fd);
  identity = {info.st_dev, info.st_ino};
  return good;
}

std::string Environment(const char* name) {
  const char* value = std::getenv(name);
  return value != nullptr ? std::string(value) : std::string();
}

std::string HomeFolder() {
  std::string home = Environment("HOME");
  if (!home.empty() && home[0] == '/')
    return home;
  if (const passwd* entry = ::getpwuid(::geteuid()); entry != nullptr && entry->pw_dir != nullptr)
    return entry->pw_dir;
  return std::string();
}

// A failed SQLite call, a store that cannot be opened, is corrupt, or stays
// locked past the wait: all report access denied.
long Status(int result) noexcept {
  return (result == SQLITE_OK || result == SQLITE_ROW || result == SQLITE_DONE) ? KRERROR_SUCCESS
                                                                                  : KRERROR_ACCESS_DENIED;
}

class SKRConnection {
public:
  std::mutex m_Mutex;
  std::unordered_set<SKRRegKey*> m_Handles;
  std::array<SKREnumCursor, 2 * kRootCount> m_RootCursors;

  // Opens or reopens the stores as the environment and the files say.
  long Ensure() {
    if (m_pDb != nullptr && m_nProcess != ::getpid()) {
      // A connection must not be used, nor closed, in a forked child: closing
      // it could checkpoint and remove the parent's write-ahead log.
      m_pDb = nullptr;
      m_Statements.clear();
      ++m_nMainGeneration;
      ++m_nVolatileGeneration;
    }
    const std::string location = Environment("KR_REGISTRY_DIR") + '\n' + Environment("XDG_CONFIG_HOME") + '\n' +
                                 Environment("HOME") + '\n' + Environment("XDG_RUNTIME_DIR") + '\n' +
                                 Environment("TMPDIR");
    if (m_pDb != nullptr && location == m_Location) {
      SKRFileIdentity main;
      SKRFileIdentity changing;
      if (Identify(m_MainPath, main) && main == m_MainIdentity && Identify(m_VolatilePath, changing) &&
          changing == m_VolatileIdentity)
        return KRERROR_SUCCESS;
    }
    Close();
    m_Location = location;
    return Open();
  }

  sqlite3_stmt* Statement(const std::string& sql) {
    auto at = m_Statements.find(sql);
    if (at != m_Statements.end()) {
      sqlite3_reset(at->second);
      sqlite3_clear_bindings(at->second);
      return at->second;
    }
    sqlite3_stmt* statement = nullptr;
    if (sqlite3_prepare_v3(m_pDb, sql.c_str(), int(sql.size()), SQLITE_PREPARE_PERSISTENT, &statement, nullptr) !=
        SQLITE_OK)
      return nullptr;
    m_Statements.emplace(sql, statement);
    return statement;
  }

  int Execute(const char* sql) { return sqlite3_exec(m_pDb, sql, nullptr, nullptr, nullptr); }

  std::uint64_t Generation(std::int64_t id) const {
    return IsVolatile(id) ? m_nVolatileGeneration : m_nMainGeneration;
  }

  // The state of both stores: changes by other processes, and this process's
  // own writes.
  bool Stamp(std::array<std::int64_t, 3>& stamp) {
    for (int i = 0; i < 2; ++i) {
      sqlite3_stmt* statement = Statement(i == 0 ? "PRAGMA main.data_version" : "PRAGMA vol.data_version");
      if (statement == nullptr || sqlite3_step(statement) != SQLITE_ROW)
        return false;
      stamp[std::size_t(i)] = sqlite3_column_int64(statement, 0);
      sqlite3_reset(statement);
    }
    stamp[2] = std::int64_t(m_nWrites);
    return true;
  }

  void CountWrite() { ++m_nWrites; }

  sqlite3* Database() const { return m_pDb; }

private:
  long Open() {
    std::string folder = Environment("KR_REGISTRY_DIR");
    std::string volatileFolder;
    if (!folder.empty()) {
      if (!PrepareFolder(folder, true))
        return KRERROR_ACCESS_DENIED;
      volatileFolder = folder;
    } else {
      std::string config = Environment("XDG_CONFIG_HOME");
      if (config.empty() || config[0] != '/') {
        config = HomeFolder();
        if (config.empty())
          return KRERROR_ACCESS_DENIED;
        config += "/.config";
      }
      if (!PrepareFolder(config, false))
        return KRERROR_ACCESS_DENIED;
      folder = config + "/krCoreLib";
      if (!PrepareFolder(folder, true))
        return KRERROR_ACCESS_DENIED;
      const int runtime = SKRInstanceChannel::OpenRuntimeFolder(volatileFolder);
      if (runtime < 0)
        return KRERROR_ACCESS_DENIED;
      ::close(runtime);
    }
    m_MainPath = folder + "/registry.db";
    m_VolatilePath = volatileFolder + "/" + kVolatileFile;
    SKRFileIdentity main;
    SKRFileIdentity changing;
    if (!PrepareFile(m_MainPath, main) || !PrepareFile(m_VolatilePath, changing))
      return KRERROR_ACCESS_DENIED;
    if (!(main == m_MainIdentity))
      ++m_nMainGeneration;
    if (!(changing == m_VolatileIdentity))
      ++m_nVolatileGeneration;
    m_MainIdentity = main;
    m_VolatileIdentity = changing;
    // A reopened store starts its change counters afresh: no enumeration
    // may continue from a position found before.
    ++m_nWrites;

    if (sqlite3_open_v2(m_MainPath.c_str(), &m_pDb, SQLITE_OPEN_READWRITE | SQLITE_OPEN_NOMUTEX | SQLITE_OPEN_NOFOLLOW,
                        nullptr) != SQLITE_OK) {
      Close();
      return KRERROR_ACCESS_DENIED;
    }
    m_nProcess = ::getpid();
    sqlite3_busy_timeout(m_pDb, SKRRegistryStore::kBusyTimeoutMs);
    // A store file written by someone else must not run code or bend the
    // schema: defensive mode, and no functions from the schema.
    sqlite3_db_config(m_pDb, SQLITE_DBCONFIG_DEFENSIVE, 1, nullptr);
    sqlite3_db_config(m_pDb, SQLITE_DBCONFIG_TRUSTED_SCHEMA, 0, nullptr);
    sqlite3_limit(m_pDb, SQLITE_LIMIT_ATTACHED, 1);
    long status = Status(Execute("PRAGMA main.journal_mode=WAL; PRAGMA main.synchronous=FULL"));
    if (status == KRERROR_SUCCESS) {
      sqlite3_stmt* attach = nullptr;
      int result = sqlite3_prepare_v2(m_pDb, "ATTACH DATABASE ?1 AS vol", -1, &attach, nullptr);
      if (result == SQLITE_OK)
        result = sqlite3_bind_text(attach, 1, m_VolatilePath.c_str(), -1, SQLITE_TRANSIENT);
      if (result == SQLITE_OK)
        result = sqlite3_step(attach);
      sqlite3_finalize(attach);
      status = Status(result);
    }
    // Volatile data is gone after a restart anyway: a lost last commit on
    // power failure costs nothing, so that store skips the sync per commit.
    if (status == KRERROR_SUCCESS)
      status = Status(Execute("PRAGMA vol.journal_mode=WAL; PRAGMA vol.synchronous=NORMAL"));
    if (status == KRERROR_SUCCESS)
      status = CreateSchema();
    if (status != KRERROR_SUCCESS)
      Close();
    return status;
  }

  long CreateSchema() {
    static const char* const kTables[] = {
        "CREATE TABLE IF NOT EXISTS %s.keys(id INTEGER PRIMARY KEY AUTOINCREMENT, parent INTEGER NOT NULL,"
        " name BLOB NOT NULL, fold BLOB NOT NULL)",
        "CREATE UNIQUE INDEX IF NOT EXISTS %s.keys_child ON keys(parent, fold)",
        "CREATE TABLE IF NOT EXISTS %s.vals(key INTEGER NOT NULL, seq INTEGER NOT NULL, name BLOB NOT NULL,"
        " fold BLOB NOT NULL, type INTEGER NOT NULL, data BLOB NOT NULL, PRIMARY KEY(key, fold)) WITHOUT ROWID",
        "CREATE UNIQUE INDEX IF NOT EXISTS %s.vals_order ON vals(key, seq)",
    };
    if (Execute("BEGIN IMMEDIATE") != SQLITE_OK)
      return KRERROR_ACCESS_DENIED;
    int result = SQLITE_OK;
    for (const char* schema : {"main", "vol"}) {
      for (const char* table : kTables) {
        std::string sql = table;
        sql.replace(sql.find("%s"), 2, schema);
        if (result == SQLITE_OK)
          result = Execute(sql.c_str());
      }
    }
    // The roots: parent -id keeps them apart in the unique index.
    for (std::int64_t id = 1; id <= kRootCount && result == SQLITE_OK; ++id) {
      const std::string sql = "INSERT OR IGNORE INTO main.keys(id, parent, name, fold) VALUES(" + std::to_string(id) +
                              ", " + std::to_string(-id) + ", x'', x'')";
      result = Execute(sql.c_str());
    }
    if (result == SQLITE_OK)
      result = Execute(("INSERT INTO vol.sqlite_sequence(name, seq) SELECT 'keys', " + std::to_string(kVolatileBase) +
                        " WHERE NOT EXISTS (SELECT 1 FROM vol.sqlite_sequence WHERE name = 'keys')")
                           .c_str());
    if (result == SQLITE_OK)
      result = Execute("COMMIT");
    if (result != SQLITE_OK)
      Execute("ROLLBACK");
    return Status(result);
  }

  void Close() {
    for (auto& [sql, statement] : m_Statements)
      sqlite3_finalize(statement);
    m_Statements.clear();
    if (m_pDb != nullptr)
      sqlite3_close_v2(m_pDb);
    m_pDb = nullptr;
  }

  sqlite3* m_pDb = nullptr;
  pid_t m_nProcess = 0;
  std::string m_Location;
  std::string m_MainPath;
  std::string m_VolatilePath;
  SKRFileIdentity m_MainIdentity;
  SKRFileIdentity m_VolatileIdentity;
  std::uint64_t m_nMainGeneration = 0;
  std::uint64_t m_nVolatileGeneration = 0;
  std::uint64_t m_nWrites = 0;
  std::map<std::string, sqlite3_stmt*> m_Statements;
};

SKRConnection& Connection() {
  // Never destroyed: handles may be closed by static destructors of the host.
  static SKRConnection* connection = new SKRConnection;
  return *connection;
}

const char* Schema(std::int64_t id) {
  return IsVolatile(id) ? "vol" : "main";
}

// One transaction: rolled back unless committed. Its statements are
// prepared once (compiling BEGIN and COMMIT anew would cost more than a
// small query).
class SKRTransaction {
public:
  SKRTransaction(SKRConnection& connection, bool write) : m_Connection(connection) {
    m_nResult = Run(write ? "BEGIN IMMEDIATE" : "BEGIN");
  }
  ~SKRTransaction() {
    if (m_nResult == SQLITE_OK)
      Run("ROLLBACK");
  }
  long Begun() const { return Status(m_nResult); }
  long Commit() {
    const int result = Run("COMMIT");
    if (result == SQLITE_OK) {
      m_nResult = SQLITE_DONE;
      m_Connection.CountWrite();
    }
    return Status(result);
  }

private:
  int Run(const char* sql) {
    sqlite3_stmt* statement = m_Connection.Statement(sql);
    if (statement == nullptr)
      return SQLITE_ERROR;
    const int result = sqlite3_step(statement);
    sqlite3_reset(statement);
    return result == SQLITE_DONE ? SQLITE_OK : result;
  }

  SKRConnection& m_Connection;
  int m_nResult;
};

// A call's view of a handle: the key id, whether it may change the key, and
// where its enumeration cursors live.
struct SKRKeyRef {
  std::int64_t m_nId = 0;
  bool m_bWritable = false;
  SKREnumCursor* m_pValues = nullptr;
  SKREnumCursor* m_pKeys = nullptr;
};

long Resolve(SKRConnection& connection, HKEY key, SKRKeyRef& ref) {
  const auto raw = reinterpret_cast<std::uintptr_t>(key);
  if (raw >= 0x80000000u && raw < 0x80000000u + std::uintptr_t(kRootCount)) {
    const auto index = std::size_t(raw - 0x80000000u);
    ref = {std::int64_t(index) + 1, true, &connection.m_RootCursors[2 * index],
           &connection.m_RootCursors[2 * index + 1]};
    return KRERROR_SUCCESS;
  }
  if (key == nullptr || connection.m_Handles.count(key) == 0)
    return KRERROR_INVALID_HANDLE;
  if (key->m_nGeneration != connection.Generation(key->m_nId))
    return KRERROR_INVALID_HANDLE;
  ref = {key->m_nId, key->m_bWritable, &key->m_Values, &key->m_Keys};
  return KRERROR_SUCCESS;
}

// Inside a transaction: whether the key still exists (a deleted key's
// handle is invalid).
long CheckExists(SKRConnection& connection, std::int64_t id) {
  sqlite3_stmt* statement = connection.Statement(std::string("SELECT 1 FROM ") + Schema(id) + ".keys WHERE id = ?1");
  if (statement == nullptr)
    return KRERROR_ACCESS_DENIED;
  sqlite3_bind_int64(statement, 1, id);
  const int result = sqlite3_step(statement);
  sqlite3_reset(statement);
  return result == SQLITE_ROW ? KRERROR_SUCCESS : result == SQLITE_DONE ? KRERROR_INVALID_HANDLE : Status(result);
}

// Binds a key id to ?1 and a name or fold to ?2 (kept alive by the caller
// until the statement is reset).
void Bind(sqlite3_stmt* statement, std::int64_t id, const SKRBytes& bytes) {
  sqlite3_bind_int64(statement, 1, id);
  sqlite3_bind_blob(statement, 2, bytes.data(), int(bytes.size()), SQLITE_STATIC);
}

// The child of `parent` named `part`: its id, 0 when there is none, -1 on
// failure.
std::int64_t FindChild(SKRConnection& connection, std::int64_t parent, const SKRBytes& fold) {
  const char* sql = IsVolatile(parent) ? "SELECT id FROM vol.keys WHERE parent = ?1 AND fold = ?2"
                                       : "SELECT id FROM main.keys WHERE parent = ?1 AND fold = ?2 UNION ALL "
                                         "SELECT id FROM vol.keys WHERE parent = ?1 AND fold = ?2";
  sqlite3_stmt* statement = connection.Statement(sql);
  if (statement == nullptr)
    return -1;
  Bind(statement, parent, fold);
  const int result = sqlite3_step(statement);
  const std::int64_t id = result == SQLITE_ROW ? sqlite3_column_int64(statement, 0) : result == SQLITE_DONE ? 0 : -1;
  sqlite3_reset(statement);
  return id;
}

// Follows `parts` below `id`; KRERROR_FILE_NOT_FOUND when one is missing.
long Walk(SKRConnection& connection, std::int64_t& id, const std::vector<std::wstring>& parts) {
  for (const std::wstring& part : parts) {
    const std::int64_t child = FindChild(connection, id, FoldBytes(part.data(), part.size()));
    if (child < 0)
      return KRERROR_ACCESS_DENIED;
    if (child == 0)
      return KRERROR_FILE_NOT_FOUND;
    id = child;
  }
  return KRERROR_SUCCESS;
}

std::int64_t InsertKey(SKRConnection& connection, std::int64_t parent, bool inVolatile, const std::wstring& name) {
  sqlite3_stmt* statement =
      connection.Statement(std::string("INSERT INTO ") + (inVolatile ? "vol" : "main") +
                           ".keys(parent, name, fold) VALUES(?1, ?2, ?3)");
  if (statement == nullptr)
    return -1;
  const SKRBytes bytes = NameBytes(name.data(), name.size());
  const SKRBytes fold = FoldBytes(name.data(), name.size());
  Bind(statement, parent, bytes);
  sqlite3_bind_blob(statement, 3, fold.data(), int(fold.size()), SQLITE_STATIC);
  const int result = sqlite3_step(statement);
  sqlite3_reset(statement);
  return result == SQLITE_DONE ? sqlite3_last_insert_rowid(connection.Database()) : -1;
}

std::size_t ValueNameLength(const wchar_t* name) {
  return name == nullptr ? 0 : std::wcslen(name);
}

// Copies a stored name into the caller's buffer (`*length` characters with
// the terminator on entry, the name's length on return).
long CopyName(const void* bytes, int byteCount, wchar_t* name, std::uint32_t* length) {
  const auto characters = std::size_t(byteCount > 0 ? byteCount : 0) / sizeof(wchar_t);
  const bool fits = characters < *length;
  if (fits) {
    if (characters > 0)
      std::memcpy(name, bytes, characters * sizeof(wchar_t));
    name[characters] = L'\0';
  }
  *length = std::uint32_t(characters);
  return fits ? KRERROR_SUCCESS : KRERROR_MORE_DATA;
}

// Copies value data; MORE_DATA (nothing copied) when the buffer is short.
long CopyData(sqlite3_stmt* statement, int column, std::uint8_t* data, std::uint32_t* size) {
  if (data == nullptr) {
    if (size != nullptr)
      *size = std::uint32_t(sqlite3_column_bytes(statement, column));
    return KRERROR_SUCCESS;
  }
  const void* bytes = sqlite3_column_blob(statement, column);
  const auto count = std::uint32_t(sqlite3_column_bytes(statement, column));
  const bool fits = count <= *size;
  if (fits && count > 0)
    std::memcpy(data, bytes, count);
  *size = count;
  return fits ? KRERROR_SUCCESS : KRERROR_MORE_DATA;
}

// Moves `cursor` to item `index` of an ordered listing: from where it stands
// when nothing changed since, otherwise from the start. `next` steps to the
// item after the cursor's position; false at the end.
template <class Next>
long Seek(SKRConnection& connection, SKREnumCursor& cursor, std::uint32_t index, Next next) {
  std::array<std::int64_t, 3> stamp{};
  if (!connection.Stamp(stamp))
    return KRERROR_ACCESS_DENIED;
  if (cursor.m_Stamp != stamp || cursor.m_nIndex > std::int64_t(index)) {
    cursor = SKREnumCursor();
    cursor.m_Stamp = stamp;
  }
  while (cursor.m_nIndex < std::int64_t(index)) {
    const long status = next(cursor);
    if (status != KRERROR_SUCCESS) {
      cursor = SKREnumCursor();
      return status;
    }
    ++cursor.m_nIndex;
  }
  return KRERROR_SUCCESS;
}


// How a call uses its key: reading in one statement (no transaction),
// reading in a transaction, or changing the store (a write transaction),
// with or without the right to change the key's values.
enum class EKRCall { Statement, Read, Write, WriteValues };

// Runs `body(connection, ref, transaction)` for the key behind `key` with
// the store open, the process-wide lock held and, unless kind is
// Statement, a transaction begun in which the key exists.
template <class Body>
long WithKey(HKEY key, EKRCall kind, Body body) {
  SKRConnection& connection = Connection();
  std::lock_guard<std::mutex> lock(connection.m_Mutex);
  long status = connection.Ensure();
  SKRKeyRef ref;
  if (status == KRERROR_SUCCESS)
    status = Resolve(connection, key, ref);
  if (status != KRERROR_SUCCESS)
    return status;
  if (kind == EKRCall::WriteValues && !ref.m_bWritable)
    return KRERROR_ACCESS_DENIED;
  if (kind == EKRCall::Statement)
    return body(connection, ref, static_cast<SKRTransaction*>(nullptr));
  SKRTransaction transaction(connection, kind != EKRCall::Read);
  if ((status = transaction.Begun()) != KRERROR_SUCCESS || (status = CheckExists(connection, ref.m_nId)))
    return status;
  return body(connection, ref, &transaction);
}

// Opens, or with `create` creates, `subKey` below `key`.
long OpenKey(HKEY key, const wchar_t* subKey, std::uint32_t access, bool create, std::uint32_t options, HKEY* result,
             std::uint32_t* disposition) {
  if (result == nullptr)
    return KRERROR_INVALID_PARAMETER;
  *result = nullptr;
  std::vector<std::wstring> parts;
  if (!SplitPath(subKey, parts) || (create && (options & ~KRREG_OPTION_VOLATILE) != 0))
    return KRERROR_INVALID_PARAMETER;
  return WithKey(key, create ? EKRCall::Write : EKRCall::Read,
                 [&](SKRConnection& connection, const SKRKeyRef& ref, SKRTransaction* transaction) -> long {
    long status = KRERROR_SUCCESS;
    std::int64_t id = ref.m_nId;
    bool created = false;
    for (const std::wstring& part : parts) {
      const std::int64_t child = FindChild(connection, id, FoldBytes(part.data(), part.size()));
      if (child < 0)
        return KRERROR_ACCESS_DENIED;
      if (child > 0) {
        id = child;
        continue;
      }
      if (!create)
        return KRERROR_FILE_NOT_FOUND;
      const bool inVolatile = IsVolatile(id) || (options & KRREG_OPTION_VOLATILE) != 0;
      if (IsVolatile(id) && (options & KRREG_OPTION_VOLATILE) == 0)
        return KRERROR_CHILD_MUST_BE_VOLATILE;
      if ((id = InsertKey(connection, id, inVolatile, part)) < 0)
        return KRERROR_ACCESS_DENIED;
      created = true;
    }
    if (created && (status = transaction->Commit()) != KRERROR_SUCCESS)
      return status;
    auto* handle = new SKRRegKey;
    handle->m_nId = id;
    handle->m_nGeneration = connection.Generation(id);
    handle->m_bWritable = (access & kWriteAccess) != 0;
    connection.m_Handles.insert(handle);
    *result = handle;
    if (disposition != nullptr)
      *disposition = created ? KRREG_CREATED_NEW_KEY : KRREG_OPENED_EXISTING_KEY;
    return KRERROR_SUCCESS;
  });
}

}  // namespace

long KRRegOpenKeyEx(HKEY key, const wchar_t* subKey, std::uint32_t, std::uint32_t access, HKEY* result) {
  return OpenKey(key, subKey, access, false, 0, result, nullptr);
}

long KRRegCreateKeyEx(HKEY key, const wchar_t* subKey, std::uint32_t options, std::uint32_t access, HKEY* result,
                      std::uint32_t* disposition) {
  return OpenKey(key, subKey, access, true, options, result, disposition);
}

long KRRegQueryInfoKey(HKEY key, std::uint32_t* subKeys, std::uint32_t* maxSubKeyLength,
                                 std::uint32_t* values, std::uint32_t* maxValueNameLength,
                                 std::uint32_t* maxValueLength) {
  return WithKey(key, EKRCall::Read,
                 [&](SKRConnection& connection, const SKRKeyRef& ref, SKRTransaction*) -> long {
    const std::string keys = "SELECT count(*), coalesce(max(length(name)), 0), 0 FROM %s.keys WHERE parent = ?1";
    const std::string vals = std::string("SELECT count(*), coalesce(max(length(name)), 0), "
                                         "coalesce(max(length(data)), 0) FROM ") +
                             Schema(ref.m_nId) + ".vals WHERE key = ?1";
    std::int64_t totals[2][3] = {};
    const std::string sqls[3] = {std::string(keys).replace(keys.find("%s"), 2, "main"),
                                 std::string(keys).replace(keys.find("%s"), 2, "vol"), vals};
    for (int i = 0; i < 3; ++i) {
      sqlite3_stmt* statement = connection.Statement(sqls[i]);
      if (statement == nullptr)
        return KRERROR_ACCESS_DENIED;
      sqlite3_bind_int64(statement, 1, ref.m_nId);
      if (sqlite3_step(statement) != SQLITE_ROW) {
        sqlite3_reset(statement);
        return KRERROR_ACCESS_DENIED;
      }
      std::int64_t* row = totals[i == 2 ? 1 : 0];
      row[0] += sqlite3_column_int64(statement, 0);
      row[1] = std::max<std::int64_t>(row[1], sqlite3_column_int64(statement, 1) / std::int64_t(sizeof(wchar_t)));
      row[2] = std::max<std::int64_t>(row[2], sqlite3_column_int64(statement, 2));
      sqlite3_reset(statement);
    }
    const auto out = [](std::uint32_t* target, std::int64_t value) {
      if (target != nullptr)
        *target = std::uint32_t(std::min<std::int64_t>(value, UINT32_MAX));
    };
    out(subKeys, totals[0][0]);
    out(maxSubKeyLength, totals[0][1]);
    out(values, totals[1][0]);
    out(maxValueNameLength, totals[1][1]);
    out(maxValueLength, totals[1][2]);
    return KRERROR_SUCCESS;
  });
}

long KRRegQueryValueEx(HKEY key, const wchar_t* name, std::uint32_t* type, std::uint8_t* data,
                                  std::uint32_t* size) {
  if (data != nullptr && size == nullptr)
    return KRERROR_INVALID_PARAMETER;
  const std::size_t nameLength = ValueNameLength(name);
  if (nameLength > SKRRegistryStore::kMaxValueNameLength)
    return KRERROR_FILE_NOT_FOUND;
  return WithKey(key, EKRCall::Statement,
                 [&](SKRConnection& connection, const SKRKeyRef& ref, SKRTransaction*) -> long {
    long status = KRERROR_SUCCESS;
    // One statement, so no explicit transaction: the key is looked for only
    // when the value is missing (a deleted key has no values left).
    // Without a buffer only the size is asked: length() leaves the data unread.
    sqlite3_stmt* statement = connection.Statement(std::string("SELECT type, ") +
                                                   (data != nullptr ? "data" : "length(data)") + " FROM " +
                                                   Schema(ref.m_nId) + ".vals WHERE key = ?1 AND fold = ?2");
    if (statement == nullptr)
      return KRERROR_ACCESS_DENIED;
    const SKRBytes fold = FoldBytes(name != nullptr ? name : L"", nameLength);
    Bind(statement, ref.m_nId, fold);
    const int result = sqlite3_step(statement);
    if (result == SQLITE_ROW) {
      if (type != nullptr)
        *type = std::uint32_t(sqlite3_column_int64(statement, 0));
      if (data != nullptr)
        status = CopyData(statement, 1, data, size);
      else if (size != nullptr)
        *size = std::uint32_t(sqlite3_column_int64(statement, 1));
      sqlite3_reset(statement);
      return status;
    }
    sqlite3_reset(statement);
    if (result != SQLITE_DONE)
      return Status(result);
    status = CheckExists(connection, ref.m_nId);
    return status == KRERROR_SUCCESS ? KRERROR_FILE_NOT_FOUND : status;
  });
}

long KRRegSetValueEx(HKEY key, const wchar_t* name, std::uint32_t type, const std::uint8_t* data,
                                std::uint32_t size) {
  const std::size_t nameLength = ValueNameLength(name);
  if (nameLength > SKRRegistryStore::kMaxValueNameLength || size > KRREG_MAX_VALUE_SIZE ||
      (data == nullptr && size > 0))
    return KRERROR_INVALID_PARAMETER;
  return WithKey(key, EKRCall::WriteValues,
                 [&](SKRConnection& connection, const SKRKeyRef& ref, SKRTransaction* transaction) -> long {
    // A new value goes after the last; a replaced one keeps its place (and the
    // case of its first name).
    const std::string schema = Schema(ref.m_nId);
    sqlite3_stmt* statement = connection.Statement(
        "INSERT INTO " + schema + ".vals(key, seq, name, fold, type, data) VALUES(?1, "
        "(SELECT coalesce(max(seq), 0) + 1 FROM " + schema + ".vals WHERE key = ?1), ?2, ?3, ?4, ?5) "
        "ON CONFLICT(key, fold) DO UPDATE SET type = excluded.type, data = excluded.data");
    if (statement == nullptr)
      return KRERROR_ACCESS_DENIED;
    const wchar_t* text = name != nullptr ? name : L"";
    const SKRBytes bytes = NameBytes(text, nameLength);
    const SKRBytes fold = FoldBytes(text, nameLength);
    Bind(statement, ref.m_nId, bytes);
    sqlite3_bind_blob(statement, 3, fold.data(), int(fold.size()), SQLITE_STATIC);
    sqlite3_bind_int64(statement, 4, type);
    sqlite3_bind_blob(statement, 5, size > 0 ? static_cast<const void*>(data) : "", int(size), SQLITE_STATIC);
    const int result = sqlite3_step(statement);
    sqlite3_reset(statement);
    if (result != SQLITE_DONE)
      return Status(result);
    return transaction->Commit();
  });
}

long KRRegEnumValue(HKEY key, std::uint32_t index, wchar_t* name, std::uint32_t* nameLength,
                                 std::uint32_t* type, std::uint8_t* data, std::uint32_t* size) {
  if (name == nullptr || nameLength == nullptr || (data != nullptr && size == nullptr))
    return KRERROR_INVALID_PARAMETER;
  return WithKey(key, EKRCall::Read,
                 [&](SKRConnection& connection, const SKRKeyRef& ref, SKRTransaction*) -> long {
    long status = KRERROR_SUCCESS;
    sqlite3_stmt* statement =
        connection.Statement(std::string("SELECT seq, name, type, data FROM ") + Schema(ref.m_nId) +
                             ".vals WHERE key = ?1 AND seq > ?2 ORDER BY seq LIMIT 1");
    if (statement == nullptr)
      return KRERROR_ACCESS_DENIED;
    status = Seek(connection, *ref.m_pValues, index, [&](SKREnumCursor& cursor) {
      sqlite3_reset(statement);
      sqlite3_bind_int64(statement, 1, ref.m_nId);
      sqlite3_bind_int64(statement, 2, cursor.m_nSeq);
      const int result = sqlite3_step(statement);
      if (result == SQLITE_ROW) {
        cursor.m_nSeq = sqlite3_column_int64(statement, 0);
        return KRERROR_SUCCESS;
      }
      return result == SQLITE_DONE ? KRERROR_NO_MORE_ITEMS : Status(result);
  });
  if (status == KRERROR_SUCCESS) {
    // The statement still stands on the item the cursor reached; when the
    // cursor was already there, fetch it again.
    if (sqlite3_stmt_busy(statement) == 0 || sqlite3_column_int64(statement, 0) != ref.m_pValues->m_nSeq) {
      sqlite3_reset(statement);
      sqlite3_bind_int64(statement, 1, ref.m_nId);
      sqlite3_bind_int64(statement, 2, ref.m_pValues->m_nSeq - 1);
      if (sqlite3_step(statement) != SQLITE_ROW || sqlite3_column_int64(statement, 0) != ref.m_pValues->m_nSeq) {
        sqlite3_reset(statement);
        *ref.m_pValues = SKREnumCursor();
        return KRERROR_ACCESS_DENIED;
      }
    }
    status = CopyName(sqlite3_column_blob(statement, 1), sqlite3_column_bytes(statement, 1), name, nameLength);
    if (type != nullptr)
      *type = std::uint32_t(sqlite3_column_int64(statement, 2));
    if (status == KRERROR_SUCCESS)
      status = CopyData(statement, 3, data, size);
    else if (size != nullptr)
      *size = std::uint32_t(sqlite3_column_bytes(statement, 3));
  }
  sqlite3_reset(statement);
  return status;
  });
}

long KRRegEnumKeyEx(HKEY key, std::uint32_t index, wchar_t* name, std::uint32_t* nameLength) {
  if (name == nullptr || nameLength == nullptr)
    return KRERROR_INVALID_PARAMETER;
  return WithKey(key, EKRCall::Read,
                 [&](SKRConnection& connection, const SKRKeyRef& ref, SKRTransaction*) -> long {
    long status = KRERROR_SUCCESS;
    // The next child after a fold, from either store: the smaller of the two.
    SKRBytes foundName;
    const auto next = [&](SKREnumCursor& cursor) {
      bool found = false;
      SKRBytes best;
      for (const char* schema : {"main", "vol"}) {
        if (IsVolatile(ref.m_nId) && schema[0] == 'm')
          continue;
        sqlite3_stmt* statement = connection.Statement(std::string("SELECT fold, name FROM ") + schema +
                                                       ".keys WHERE parent = ?1 AND fold > ?2 ORDER BY fold LIMIT 1");
        if (statement == nullptr)
          return KRERROR_ACCESS_DENIED;
        Bind(statement, ref.m_nId, cursor.m_Fold);
        const int result = sqlite3_step(statement);
        if (result == SQLITE_ROW) {
          SKRBytes fold(static_cast<const char*>(sqlite3_column_blob(statement, 0)),
                        std::size_t(sqlite3_column_bytes(statement, 0)));
          if (!found || fold < best) {
            best.swap(fold);
            foundName.assign(static_cast<const char*>(sqlite3_column_blob(statement, 1)),
                             std::size_t(sqlite3_column_bytes(statement, 1)));
            found = true;
          }
        }
        sqlite3_reset(statement);
        if (result != SQLITE_ROW && result != SQLITE_DONE)
          return Status(result);
      }
      if (!found)
        return KRERROR_NO_MORE_ITEMS;
      cursor.m_Fold.swap(best);
      return KRERROR_SUCCESS;
    };
    SKREnumCursor& cursor = *ref.m_pKeys;
    status = Seek(connection, cursor, index, next);
    if (status != KRERROR_SUCCESS)
      return status;
    if (foundName.empty()) {
      // The cursor already stood on the item: look its name up by its fold.
      for (const char* schema : {"main", "vol"}) {
        sqlite3_stmt* statement = connection.Statement(std::string("SELECT name FROM ") + schema +
                                                       ".keys WHERE parent = ?1 AND fold = ?2");
        if (statement == nullptr)
          return KRERROR_ACCESS_DENIED;
        Bind(statement, ref.m_nId, cursor.m_Fold);
        if (sqlite3_step(statement) == SQLITE_ROW)
          foundName.assign(static_cast<const char*>(sqlite3_column_blob(statement, 0)),
                           std::size_t(sqlite3_column_bytes(statement, 0)));
        sqlite3_reset(statement);
        if (!foundName.empty())
          break;
      }
      if (foundName.empty())
        return KRERROR_ACCESS_DENIED;
    }
    return CopyName(foundName.data(), int(foundName.size()), name, nameLength);
  });
}

long KRRegDeleteValue(HKEY key, const wchar_t* name) {
  const std::size_t nameLength = ValueNameLength(name);
  if (nameLength > SKRRegistryStore::kMaxValueNameLength)
    return KRERROR_FILE_NOT_FOUND;
  return WithKey(key, EKRCall::WriteValues,
                 [&](SKRConnection& connection, const SKRKeyRef& ref, SKRTransaction* transaction) -> long {
    sqlite3_stmt* statement =
        connection.Statement(std::string("DELETE FROM ") + Schema(ref.m_nId) + ".vals WHERE key = ?1 AND fold = ?2");
    if (statement == nullptr)
      return KRERROR_ACCESS_DENIED;
    const SKRBytes fold = FoldBytes(name != nullptr ? name : L"", nameLength);
    Bind(statement, ref.m_nId, fold);
    const int result = sqlite3_step(statement);
    sqlite3_reset(statement);
    if (result != SQLITE_DONE)
      return Status(result);
    if (sqlite3_changes(connection.Database()) == 0)
      return KRERROR_FILE_NOT_FOUND;
    return transaction->Commit();
  });
}

long KRRegDeleteKey(HKEY key, const wchar_t* subKey) {
  std::vector<std::wstring> parts;
  if (subKey == nullptr || subKey[0] == L'\0' || !SplitPath(subKey, parts))
    return KRERROR_INVALID_PARAMETER;
  return WithKey(key, EKRCall::Write,
                 [&](SKRConnection& connection, const SKRKeyRef& ref, SKRTransaction* transaction) -> long {
    long status = KRERROR_SUCCESS;
    std::int64_t id = ref.m_nId;
    if ((status = Walk(connection, id, parts)) != KRERROR_SUCCESS)
      return status;
    // The subtree's ids; UNION (not UNION ALL) ends even on a damaged store
    // whose parent links form a loop.
    sqlite3_stmt* statement = connection.Statement(
        "WITH RECURSIVE tree(id) AS (SELECT ?1 UNION SELECT k.id FROM (SELECT id, parent FROM main.keys UNION ALL "
        "SELECT id, parent FROM vol.keys) AS k JOIN tree ON k.parent = tree.id) SELECT id FROM tree");
    if (statement == nullptr)
      return KRERROR_ACCESS_DENIED;
    sqlite3_bind_int64(statement, 1, id);
    std::vector<std::int64_t> ids;
    int result;
    while ((result = sqlite3_step(statement)) == SQLITE_ROW)
      ids.push_back(sqlite3_column_int64(statement, 0));
    sqlite3_reset(statement);
    if (result != SQLITE_DONE)
      return Status(result);
    for (const std::int64_t doomed : ids) {
      if (doomed <= kRootCount)
        continue;
      for (const char* sql : {"DELETE FROM %s.vals WHERE key = ?1", "DELETE FROM %s.keys WHERE id = ?1"}) {
        std::string text = sql;
        text.replace(text.find("%s"), 2, Schema(doomed));
        sqlite3_stmt* deletion = connection.Statement(text);
        if (deletion == nullptr)
          return KRERROR_ACCESS_DENIED;
        sqlite3_bind_int64(deletion, 1, doomed);
        result = sqlite3_step(deletion);
        sqlite3_reset(deletion);
        if (result != SQLITE_DONE)
          return Status(result);
      }
    }
    return transaction->Commit();
  });
}

long KRRegCloseKey(HKEY key) {
  const auto raw = reinterpret_cast<std::uintptr_t>(key);
  if (raw >= 0x80000000u && raw < 0x80000000u + std::uintptr_t(kRootCount))
    return KRERROR_SUCCESS;
  SKRConnection& connection = Connection();
  std::lock_guard<std::mutex> lock(connection.m_Mutex);
  if (key == nullptr || connection.m_Handles.erase(key) == 0)
    return KRERROR_INVALID_HANDLE;
  delete key;
  return KRERROR_SUCCESS;
}

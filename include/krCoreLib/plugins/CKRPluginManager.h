// CKRPluginManager: finds, loads, offers and releases plug-ins.
//
// Plug-in modules are shared objects with the extension ".plg" that export
// the unmangled function "GetPluginType" (CKRPlugin.h). For each module the
// manager loads it, claims the types the module brought into a repository
// of its own (CKRTypeSystem::Initialize), creates one plug-in object from
// the exported type and offers it to every registered socket. A module
// that cannot be made into a plug-in is represented by an error plug-in
// (CKRPluginError) whose configuration's description says why: the
// loader's own text when the module cannot be loaded or lacks the export,
// "Internal Plugin Error" when the export yields no type, "Couldn't Load
// Plugin" when the type yields no plug-in. A path already loaded (letters
// compared without case) is skipped; a plug-in whose ID another loaded
// plug-in has is discarded with its module. Nothing throws.
//
// A module's static initialisation runs while it is loaded, and one that
// throws or crashes would take the host with it: a file is therefore first
// loaded in a short-lived child process (a folder's new files all in one),
// and refused with an error plug-in when that child does not come back in
// good order. The verdict is kept per file (device, inode, size, time), so
// loading an unchanged file again costs no further process.
//
// A module stays loaded while its plug-in lives. Before it is unloaded,
// its plug-in is taken out of every socket and released, and the
// repository of its types is released (so that the type system never keeps
// types or instances of unloaded code). The host claims its own types
// (CKRTypeSystem::Initialize) before it loads plug-ins; types registered
// and not yet claimed when a module is loaded are claimed with the
// module's.
//
// A process-wide singleton with a static interface; the work is done by
// protected virtual operations that a derived manager may override. Used
// from the user-interface thread only; nothing is locked.
#pragma once

#include <krCoreLib/objectmodel/CKRObjPtrList.h>
#include <krCoreLib/plugins/CKRPlugin.h>
#include <krCoreLib/plugins/CKRPluginCmd.h>
#include <krCoreLib/plugins/CKRPluginSocket.h>

#include <vector>

class KRCORELIB_API CKRPluginManager {
public:
  // One loaded module or failed load.
  struct PluginRecord {
    void* m_hModule = nullptr;     // null for an error plug-in
    CKRPlugin* m_pPlugin = nullptr;  // not owned by the record
    CKRString m_Path;              // as passed to the loader
    CKRGuid m_RepositoryID;        // the repository of the module's types
  };

  // The number the first registered command gets.
  static constexpr unsigned FirstCmdID = 2345;

  // Loads every entry of `folder` whose name ends in ".plg" (letters as
  // written: the file system's names are case-sensitive), in the order the
  // file system lists them, then updates every socket once. A missing or unreadable
  // folder loads nothing and updates nothing.
  static void LoadPlugins(CKRString folder);
  // Loads one module (see above); the sockets are offered the plug-in but
  // not updated.
  static void LoadPlugin(CKRString path);
  // Takes the plug-in out of every socket, releases it and unloads its
  // module. Null and plug-ins the manager does not hold are ignored.
  static void ReleasePlugin(CKRPlugin* plugin);
  // Releases every plug-in, then unloads every module.
  static void ReleaseAllPlugins();
  // Adds the socket (once), offers it every plug-in and updates it.
  static void RegisterSocket(CKRPluginSocket* socket);
  // Takes the socket off the list; it keeps the plug-ins it has (until they
  // are released: the manager takes a plug-in out of former sockets too).
  static void UnregisterSocket(CKRPluginSocket* socket);
  // Forgets every socket, as UnregisterSocket; releases nothing.
  static void UnregisterAllSockets();
  static void UpdateAllSockets();
  // The plug-ins (error plug-ins included) and the sockets, in load and
  // registration order. An iterator stays usable until the list changes.
  static CKRObjPtrList<CKRPlugin>::Iterator GetPluginIterator();
  static CKRObjPtrList<CKRPluginSocket>::Iterator GetSocketIterator();
  // Gives the command the next command number (2345 at start, or the
  // number set with SetNextCmdID; one more for each command). Null is
  // ignored.
  static void RegisterCmd(CKRPluginCmd* cmd);
  static void SetNextCmdID(unsigned id);
  static IKRPluginResource* GetResourceInterface();
  // Stores the host's interface for the plug-ins; not owned.
  static void SetResourceInterface(IKRPluginResource* resource);
  // Forgets the sockets, releases every plug-in and destroys the manager; a
  // later call starts a new, empty one.
  static void Release();

  // The records, in load order (for inspection).
  const std::vector<PluginRecord>& GetRecords() const { return m_PluginRecords; }
  // The manager, created on first use.
  static CKRPluginManager* GetManager() { return GetInstance(); }

protected:
  CKRPluginManager() = default;
  CKRPluginManager(const CKRPluginManager&) = delete;
  CKRPluginManager& operator=(const CKRPluginManager&) = delete;
  virtual ~CKRPluginManager();

  static CKRPluginManager* GetInstance();

  virtual CKRObjPtrList<CKRPlugin>::Iterator _GetPluginIterator();
  virtual CKRObjPtrList<CKRPluginSocket>::Iterator _GetSocketIterator();
  virtual void _UpdateAllSockets();
  virtual void _LoadPlugins(CKRString folder);
  virtual void _LoadPlugin(CKRString path);
  virtual void _ReleasePlugin(CKRPlugin* plugin);
  virtual void _ReleaseAllPlugins();
  virtual void _RegisterSocket(CKRPluginSocket* socket);
  virtual void _UnregisterSocket(CKRPluginSocket* socket);
  virtual void _UnregisterAllSockets();
  virtual void _Release();
  // True when a record has this path (letters compared without case).
  virtual bool _ContainsPluginRecord(CKRString path);
  // True when a recorded plug-in's configuration has the plug-in ID of
  // `plugin`'s configuration.
  virtual bool _ContainsPluginRecord(CKRPlugin* plugin);
  virtual void _RegisterCmd(CKRPluginCmd* cmd);
  virtual IKRPluginResource* _GetResourceInterface();
  virtual void _SetResourceInterface(IKRPluginResource* resource);

  // An error plug-in whose description is `text`, or null when even that
  // cannot be made.
  virtual CKRPlugin* MakeErrorPlugin(const CKRString& text);
  // Records the plug-in, lists it and offers it to every socket.
  void AddRecord(void* module, CKRPlugin* plugin, const CKRString& path, CKRGuid repositoryID);
  // Takes the plug-in out of every socket, registered or former.
  void DetachFromSockets(CKRPlugin* plugin);
  // Notes a socket that leaves the list still holding plug-ins.
  void RememberFormerSocket(CKRPluginSocket* socket);
  // Releases the repository of a module's types, then unloads the module.
  static void UnloadModule(void* module, CKRGuid repositoryID);

  std::vector<PluginRecord> m_PluginRecords;
  CKRObjPtrList<CKRPlugin> m_Plugins;
  CKRObjPtrList<CKRPluginSocket> m_Sockets;
  IKRPluginResource* m_pResourceInterface = nullptr;
  unsigned m_NextCmdID = FirstCmdID;
  // Sockets unregistered while they may hold plug-ins: they keep the
  // plug-ins they registered, and are detached from a plug-in before it is
  // released like the registered ones. A released socket leaves both lists.
  std::vector<CKRPluginSocket*> m_FormerSockets;

  static CKRPluginManager* m_pInstance;

private:
  // A socket being released leaves the manager without creating one.
  friend class CKRPluginSocket;
  static void ForgetSocket(CKRPluginSocket* socket);
};

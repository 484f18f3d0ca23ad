// Plug-in sockets: the places of the host into which plug-ins plug.
//
// The plug-in manager offers every loaded plug-in to every registered
// socket; a socket keeps the plug-ins that accepted it (registered) and the
// subset its last filter left (visible), both in registration order and
// without owning them. CKRPluginSocketCmd routes the host's command
// messages to the plug-ins' command targets; CKRPluginSocketMnu builds a
// pop-up menu of the plug-ins' menu commands. A socket is created through
// its type, joins the manager with RegisterWithManager and leaves it with
// CKRPluginManager::UnregisterSocket before it is released. Not
// synchronised: user-interface thread only.
#pragma once

#include <krCoreLib/objectmodel/CKRObjPtrList.h>
#include <krCoreLib/objectmodel/CKRObjectImpl.h>
#include <krCoreLib/platform/KRCmdTarget.h>
#include <krCoreLib/platform/KRMenu.h>

#include <krCoreLib/plugins/CKRPlugin.h>
#include <krCoreLib/plugins/CKRPluginCmd.h>

#include <utility>
#include <vector>

class KRCORELIB_API IKRPluginSocket {
public:
  // The socket's ID (the menu socket's own, the null GUID for the command
  // socket).
  virtual CKRGuid GetID() = 0;
  virtual void RegisterPlugin(CKRPlugin* plugin) = 0;
  virtual void UnregisterPlugin(CKRPlugin* plugin) = 0;
  virtual void ApplyFilter(CKRGuid filterID) = 0;
  // Brings the socket's presentation up to date with its visible plug-ins.
  virtual void Update() = 0;

protected:
  ~IKRPluginSocket() = default;
};

class KRCORELIB_API CKRPluginSocket : public CKRObjectImpl, public IKRPluginSocket {
  KR_DECLARE_OBJECT_TYPE(CKRPluginSocket, CKRObjectTypeImpl, "{ACC7F8CC-7F64-4249-A39F-6E541EC1A859}")

public:
  // Adds the plug-in to the registered and the visible plug-ins (once;
  // null is ignored).
  void RegisterPlugin(CKRPlugin* plugin) override;
  // Removes it from both; unknown plug-ins and null are ignored.
  void UnregisterPlugin(CKRPlugin* plugin) override;
  // Makes the visible plug-ins those registered ones, in registration
  // order, whose ShouldFilter(filterID) is 0 (error plug-ins never are).
  void ApplyFilter(CKRGuid filterID) override;
  // CKRPluginManager::RegisterSocket(this).
  virtual void RegisterWithManager();
  // Leaves the manager's socket list (a released socket is never asked
  // again); answers as the base.
  int OnBeforeRelease() override;

  CKRObjPtrList<CKRPlugin>& GetRegisteredPlugins() { return m_RegisteredPlugins; }
  CKRObjPtrList<CKRPlugin>& GetVisiblePlugins() { return m_VisiblePlugins; }

protected:
  CKRPluginSocket() = default;
  ~CKRPluginSocket() override = default;

  CKRObjPtrList<CKRPlugin> m_RegisteredPlugins;
  CKRObjPtrList<CKRPlugin> m_VisiblePlugins;
};

class KRCORELIB_API CKRPluginSocketCmd : public CKRPluginSocket {
  KR_DECLARE_OBJECT_TYPE(CKRPluginSocketCmd, CKRObjectTypeImpl, "{FF3DE6F8-B717-4A11-8B51-FD0295BC86E2}")

public:
  // The null GUID.
  CKRGuid GetID() override;
  // Registers the plug-in and, when it answers IID_IKRPluginSocketCmdRegistrant
  // or else IID_IKRPluginSocketCmdListener with a command target, records
  // the pair (plug-in, target) once.
  void RegisterPlugin(CKRPlugin* plugin) override;
  // Unregisters the plug-in and forgets its target.
  void UnregisterPlugin(CKRPlugin* plugin) override;
  // Nothing to bring up to date.
  void Update() override;

  // Asks each recorded target's OnCmdMsg in registration order: the first
  // nonzero answer, or 0.
  virtual int OnCmdMsg(unsigned nID, unsigned nCode, void* extra, SKRCmdHandlerInfo* handlerInfo);
  // The same with each target's OnCommand.
  virtual int OnCommand(CKRGuid id, CKRString argument, void* data);

protected:
  CKRPluginSocketCmd() = default;
  ~CKRPluginSocketCmd() override = default;

private:
  std::vector<std::pair<CKRPlugin*, CKRPluginCmdTarget*>> m_Targets;
};

class KRCORELIB_API CKRPluginSocketMnu : public CKRPluginSocket {
  KR_DECLARE_OBJECT_TYPE(CKRPluginSocketMnu, CKRObjectTypeImpl, "{0EE35AFC-6964-46D5-BE16-30A4DCEE79E0}")

public:
  // The socket ID given to Attach.
  CKRGuid GetID() override;
  // Places the socket's pop-up menu in `parent`: stores `socketID`; if
  // `parent` is the stored parent already nothing else happens. Otherwise
  // `parent` is stored and, when it is a valid menu, a new pop-up titled
  // `title` is appended to it and filled (Update); when that fails the
  // pop-up is destroyed and forgotten.
  virtual void Attach(HMENU parent, CKRString title, CKRGuid socketID);
  // Rebuilds the pop-up: removes its items, then for each visible plug-in
  // (a separator before every one but the first) appends a string item for
  // each of its menu commands (flag KR_PLUGINCMD_MENU), registering the
  // commands that have no command number yet. Nothing without a pop-up, or
  // when the pop-up has been destroyed with its parent.
  void Update() override;
  // Clears the menu handles; answers as the base.
  int OnInitialize() override;

  HMENU GetParentMenu() const { return m_hParentMenu; }
  HMENU GetPopupMenu() const { return m_hPopupMenu; }

protected:
  CKRPluginSocketMnu() = default;
  ~CKRPluginSocketMnu() override = default;

private:
  CKRGuid m_SocketID;
  HMENU m_hParentMenu = nullptr;
  HMENU m_hPopupMenu = nullptr;
};

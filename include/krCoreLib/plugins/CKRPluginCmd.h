// Plug-in commands: CKRPluginCmd (one command of a plug-in), the handler and
// socket interfaces around it, and CKRPluginCmdTarget, the command target
// through which a plug-in joins the host's command routing and menus.
//
// A plug-in that contributes commands owns a CKRPluginCmdTarget (or a class
// derived from it), adds its commands to it, and answers the plug-in
// sockets' interface requests with the target's views:
//   IID_IKRPluginSocketCmdRegistrant / IID_IKRPluginSocketCmdListener: the
//     command socket routes command messages to the target;
//   IID_IKRPluginSocketCmdSource: the menu socket lists its commands.
// Command routing goes socket, then targets in registration order, then
// commands in insertion order; the first nonzero answer wins. Not
// synchronised: commands are routed on the user-interface thread.
#pragma once

#include <krCoreLib/objectmodel/CKRGuid.h>
#include <krCoreLib/platform/KRCmdTarget.h>

#include <vector>

class CKRPluginCmdTarget;

KRCORELIB_LOCAL inline constexpr CKRGuid IID_IKRPluginSocketCmdRegistrant = CKRGuid::Literal("{C58A0CF1-9FC9-4E52-A1B5-E87884CD7B94}");
KRCORELIB_LOCAL inline constexpr CKRGuid IID_IKRPluginSocketCmdListener = CKRGuid::Literal("{B33FFDBF-3FF4-4E03-8D5D-BB0CD0CD8FA3}");
KRCORELIB_LOCAL inline constexpr CKRGuid IID_IKRPluginSocketCmdSource = CKRGuid::Literal("{E813232B-FB94-42C5-A1E1-714972CE72CA}");

// Receives the commands of plug-in commands (CKRPluginCmd::m_pHandler).
class KRCORELIB_API IKRPluginCmdHandler {
public:
  // Carries out the command `id` with an argument text and data of the
  // caller's choosing: nonzero when handled.
  virtual int OnCommand(CKRGuid id, CKRString argument, void* data) = 0;
  // Brings the command's user-interface state up to date through `update`
  // (which may be null): nonzero when handled.
  virtual int OnCommandUI(CKRGuid id, CKRCmdUI* update) = 0;

protected:
  ~IKRPluginCmdHandler() = default;
};

// Flag bit of CKRPluginCmd::m_Flags: the command is shown in plug-in menus.
KRCORELIB_LOCAL inline constexpr unsigned KR_PLUGINCMD_MENU = 0x1;
// The command number of a command not yet registered.
KRCORELIB_LOCAL inline constexpr unsigned KR_PLUGINCMD_NO_ID = 0xFFFFFFFFu;

// One command of a plug-in: a plain copyable value. The command number is
// given once, by CKRPluginManager::RegisterCmd (the menu socket registers
// menu commands when it first lists them), and stays with the object.
class KRCORELIB_API CKRPluginCmd {
public:
  CKRPluginCmd() = default;
  // `handler` is not owned; null leaves it to the target that adds the
  // command (CKRPluginCmdTarget::AddCmd).
  CKRPluginCmd(CKRGuid id, CKRString text, CKRString secondText, IKRPluginCmdHandler* handler, unsigned flags);

  // The command message `nID`/`nCode` (KRCmdTarget.h): 0 when `nID` is not
  // this command's number; otherwise 1, after the handler's OnCommand(ID,
  // "", null) for the code KR_CN_COMMAND (low 16 bits), its
  // OnCommandUI(ID, extra as CKRCmdUI) for KR_CN_UPDATE_COMMAND_UI, and
  // nothing for other codes or without a handler.
  int OnCmdMsg(unsigned nID, unsigned nCode, void* extra, SKRCmdHandlerInfo* handlerInfo);
  // Passes the command to the handler when `id` is this command's ID;
  // always 0, so that routing goes on to the next command.
  int OnCommand(CKRGuid id, CKRString argument, void* data);

  unsigned m_Flags = 0;
  unsigned m_CmdID = KR_PLUGINCMD_NO_ID;
  CKRGuid m_ID;
  CKRString m_Text;
  CKRString m_SecondText;
  IKRPluginCmdHandler* m_pHandler = nullptr;
};

// Routes command messages to a plug-in's command target (the command
// socket's view). Asked for by IID_IKRPluginSocketCmdListener.
class KRCORELIB_API IKRPluginSocketCmdListener {
public:
  virtual CKRPluginCmdTarget* GetCmdTarget() = 0;

protected:
  ~IKRPluginSocketCmdListener() = default;
};

// Lists a plug-in's commands (the menu socket's view). Asked for by
// IID_IKRPluginSocketCmdSource.
class KRCORELIB_API IKRPluginSocketCmdSource {
public:
  virtual int GetCmdCount() = 0;
  // The command at `index` (0 .. GetCmdCount() - 1), or null; it stays
  // valid until a command is added.
  virtual CKRPluginCmd* GetCmd(int index) = 0;

protected:
  ~IKRPluginSocketCmdSource() = default;
};

// Both views at once (IID_IKRPluginSocketCmdRegistrant); its first
// operation is the listener's GetCmdTarget.
class KRCORELIB_API IKRPluginSocketCmdRegistrant : public IKRPluginSocketCmdListener, public IKRPluginSocketCmdSource {
protected:
  ~IKRPluginSocketCmdRegistrant() = default;
};

class KRCORELIB_API CKRPluginCmdTarget : public CKRCmdTarget,
                                          public IKRPluginSocketCmdRegistrant,
                                          public IKRPluginCmdHandler {
public:
  CKRPluginCmdTarget() = default;
  // Not copied: the commands name the target as their handler.
  CKRPluginCmdTarget(const CKRPluginCmdTarget&) = delete;
  CKRPluginCmdTarget& operator=(const CKRPluginCmdTarget&) = delete;
  ~CKRPluginCmdTarget() override;

  CKRPluginCmdTarget* GetCmdTarget() override;
  int GetCmdCount() override;
  CKRPluginCmd* GetCmd(int index) override;
  // Appends the command; a command without handler gets this target as its
  // handler. Commands already handed out by GetCmd may move.
  virtual void AddCmd(CKRPluginCmd cmd);

  // The target's own routing first (its handler table); when that does not
  // handle the message: with `handlerInfo` the target names itself and
  // answers 1, otherwise each command is asked in order and the first
  // nonzero answer is returned (0 when none).
  int OnCmdMsg(unsigned nID, unsigned nCode, void* extra, SKRCmdHandlerInfo* handlerInfo) override;
  // The handler of the commands that name no other: a derived target
  // overrides both to carry its commands out. The defaults pass the call on
  // to the commands whose handler is another object (each answers 0) and
  // return 0; a call that comes back to the target while it is passing one
  // on returns 0 at once, so handlers that point at each other cannot loop.
  int OnCommand(CKRGuid id, CKRString argument, void* data) override;
  int OnCommandUI(CKRGuid id, CKRCmdUI* update) override;

private:
  std::vector<CKRPluginCmd> m_Cmds;
  bool m_bPassingOn = false;
};

// Command targets and command-update objects: the part of a windowing
// toolkit's command routing that the plug-in sockets sit on.
//
// A command message carries a command number (nID) and a code: KR_CN_COMMAND
// asks the target to carry the command out, KR_CN_UPDATE_COMMAND_UI asks it
// to bring the command's user-interface state up to date through a
// CKRCmdUI passed as the extra argument. A target's own routing (its
// message map) is a table of handlers entered by command number; derived
// targets extend the routing by overriding OnCmdMsg and asking the base
// first. Not synchronised: commands are routed on the user-interface thread.
#pragma once

#include <krCoreLib/core/CKRString.h>

#include <functional>
#include <map>

// Command codes (the low 16 bits of a code name it; the update request is
// the whole value 0xFFFFFFFF).
KRCORELIB_LOCAL inline constexpr unsigned KR_CN_COMMAND = 0x0;
KRCORELIB_LOCAL inline constexpr unsigned KR_CN_UPDATE_COMMAND_UI = 0xFFFFFFFFu;

class CKRCmdTarget;

// Filled in by a target that would handle a message, when the router only
// asks who would (the message is then not carried out).
struct SKRCmdHandlerInfo {
  CKRCmdTarget* m_pTarget = nullptr;
};

// The user-interface state of one command (menu item, button) that a
// handler brings up to date: enabled, check mark and text. A new object is
// enabled, unchecked and has no text; `m_nID` is the command number.
class KRCORELIB_API CKRCmdUI {
public:
  explicit CKRCmdUI(unsigned id = 0) : m_nID(id) {}
  virtual ~CKRCmdUI();

  virtual void Enable(bool on = true);
  // 0 unchecked, 1 checked, 2 indeterminate.
  virtual void SetCheck(int check = 1);
  virtual void SetText(const wchar_t* text);

  bool IsEnabled() const { return m_bEnabled; }
  int GetCheck() const { return m_nCheck; }
  const CKRString& GetText() const { return m_Text; }
  // True once any handler has set a state (the toolkit's "handled" mark).
  bool WasUpdated() const { return m_bUpdated; }

  unsigned m_nID;

private:
  bool m_bEnabled = true;
  int m_nCheck = 0;
  CKRString m_Text;
  bool m_bUpdated = false;
};

class KRCORELIB_API CKRCmdTarget {
public:
  using CommandHandler = std::function<void()>;
  using UpdateHandler = std::function<void(CKRCmdUI*)>;

  CKRCmdTarget() = default;
  CKRCmdTarget(const CKRCmdTarget&) = default;
  CKRCmdTarget& operator=(const CKRCmdTarget&) = default;
  virtual ~CKRCmdTarget();

  // The target's own routing. For a command number with an entry of the
  // code's kind (KR_CN_COMMAND: a command handler, KR_CN_UPDATE_COMMAND_UI:
  // an update handler, given `extra` as its CKRCmdUI, which may be null):
  // with `handlerInfo` the target only names itself there; otherwise the
  // handler runs. 1 in both cases, 0 when there is no such entry or the
  // code is another one.
  virtual int OnCmdMsg(unsigned nID, unsigned nCode, void* extra, SKRCmdHandlerInfo* handlerInfo);

  // Enters (or replaces) the handler of a command number; an empty handler
  // removes the entry.
  void SetCommandHandler(unsigned nID, CommandHandler handler);
  void SetUpdateHandler(unsigned nID, UpdateHandler handler);

private:
  std::map<unsigned, CommandHandler> m_CommandMap;
  std::map<unsigned, UpdateHandler> m_UpdateMap;
};

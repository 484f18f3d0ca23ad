// CKRMDIChildWnd: a document window as a host of tools.
//
// The window owns an indexed table of tools and a tool-event router, one
// tool of which is active: registered with the router (its adapter, under
// CKRObservation's type ID), so that it alone receives the tool and focus
// events the window raises. Activation asks the tool (OnSetActivated); a
// tool that refuses leaves the default tool (index 0) active, or none when
// the default tool refuses too. A switch made while the router delivers
// (from a tool's handler) takes effect when that delivery pass ends: events
// raised within the pass still reach the previous tool. The window releases
// its tools and router when it is destroyed; tools in the table must not be
// released by others.
// Not synchronised: the window and its tools live on one thread.
#pragma once

#include <krCoreLib/framework/CKRTool.h>
#include <krCoreLib/platform/KRWindowTypes.h>

#include <vector>

class KRCORELIB_API CKRMDIChildWnd : public CKRWnd {
public:
  explicit CKRMDIChildWnd(CKRString title = CKRString());
  ~CKRMDIChildWnd() override;

  // Appends a tool to the table (the window owns it from now on); its
  // index, or -1 for null or a tool already in the table.
  int AddTool(CKRTool* tool);
  CKRTool* GetTool(int index) const;
  int GetToolCount() const;

  // 0 when the table is not empty, otherwise -1.
  virtual int GetDefaultToolID();
  // Activates the tool at `index`: 1 when it accepts. 0 for an index
  // outside the table or without a tool (the active tool stays). A tool that
  // refuses is deactivated again and the default tool is activated instead
  // (its result is returned), unless `index` is the default; then 0.
  virtual int SetActiveTool(int index);
  // SetActiveTool(GetDefaultToolID()); 0, and no tool active, without tools.
  virtual int SetDefaultTool();
  // The index of the active tool; -1 while no tool is active.
  virtual int GetActiveToolID();
  CKRTool* GetActiveTool() const { return m_pActiveTool; }

  CKRToolEventRouter* GetRouter() const { return m_pRouter; }
  // Raises an event on the router (the router releases an auto-release
  // event after delivering it).
  void RaiseEvent(CKRObservation* event);

private:
  // The active tool stops: told, and taken off the router.
  void Deactivate();

  std::vector<CKRTool*> m_Tools;
  CKRToolEventRouter* m_pRouter = nullptr;  // owned
  CKRTool* m_pActiveTool = nullptr;
  int m_ActiveToolID = -1;
};

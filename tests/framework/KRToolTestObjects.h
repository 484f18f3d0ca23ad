// Tools, views and models for the framework tests.
#pragma once

#include <krCoreLib/framework/CKRModel.h>
#include <krCoreLib/framework/CKRTool.h>
#include <krCoreLib/geometry/CKRBoundT.h>
#include <krCoreLib/ui/CKRMDIChildWnd.h>

#include <functional>
#include <sstream>
#include <string>
#include <vector>

// Writes each handler call with its arguments to a shared log, prefixed
// with its name: "t0:down 7 8 9 -10 1.5 2.5 3.5 1". Refuses activation when
// told to.
class CKRTestTool : public CKRTool {
  KR_DECLARE_SERIAL_TYPE(CKRTestTool, CKRSerialObjectTypeImpl, "{6A000000-0000-4000-8000-0000000001A1}")

public:
  std::string m_Name = "tool";
  std::vector<std::string>* m_pLog = nullptr;
  int m_Refuse = 0;
  int m_Updates = 0;
  // Runs after each handler logged.
  std::function<void()> m_Hook;

  void OnUpdate(CKRObservation* observation) override;
  int OnSetActivated(CKRWnd* window, int activate) override;
  void OnMouseDown(int button, unsigned int flags, CKRScreenPoint point, const WorldPoint& world) override;
  void OnMouseMove(int button, unsigned int flags, CKRScreenPoint point, const WorldPoint& world) override;
  void OnMouseUp(int button, unsigned int flags, CKRScreenPoint point, const WorldPoint& world) override;
  void OnMouseWheel(short delta, unsigned int flags, CKRScreenPoint point, const WorldPoint& world) override;
  void OnMouseLeave() override;
  void OnKeyDown(unsigned int key, unsigned int flags, int third, int fourth) override;
  void OnKeyUp(unsigned int key, unsigned int flags, int third, int fourth) override;
  void OnPaint(CKRDeviceContext context, int value, CKRScreenSize size, const PaintBound& bound, double scale) override;
  void OnFocusChanged(bool gained, CKRWnd* window) override;

private:
  template <class... T>
  void Write(const char* handler, const T&... arguments) {
    std::ostringstream text;
    text << m_Name << ':' << handler;
    ((text << ' ' << arguments), ...);
    if (m_pLog != nullptr)
      m_pLog->push_back(text.str());
    if (m_Hook)
      m_Hook();
  }
};

class CKRTestView : public CKRView {
  KR_DECLARE_OBJECT_TYPE(CKRTestView, CKRObjectTypeImpl, "{6A000000-0000-4000-8000-0000000001B1}")

public:
  std::vector<std::string>* m_pLog = nullptr;
  std::string m_Name;
  void OnUpdate(CKRObservation* observation) override;
};

// CKRTool: an interactive tool of a document window, a storable object that
// receives tool and focus events through an observer adapter.
//
// The tool creates its adapter when it is initialised (also when it is
// loaded from a store) and releases it with itself; the host registers the
// adapter (GetObserver) with its router while the tool is active. Events
// reach OnUpdate, which dispatches tool events by kind (see CKRToolEvent.h)
// and focus events to OnFocusChanged; all handlers do nothing until a
// concrete tool overrides them. The type's display name is "Tool", its
// description "A Tool". Not synchronised.
#pragma once

#include <krCoreLib/framework/CKRToolEvent.h>
#include <krCoreLib/math/CKRPoint4T.h>
#include <krCoreLib/serialization/CKRSerialObject.h>

template <int N, class Real, class Other>
class CKRBoundT;
template <class Real, class Other>
class CKRBound2T;

class KRCORELIB_API CKRTool : public CKRSerialObject, public IKRObservationListener {
  KR_DECLARE_SERIAL_TYPE(CKRTool, CKRSerialObjectTypeImpl, "{45AE9A00-017B-4CEF-8CE5-FD6802B90C83}")

public:
  using WorldPoint = CKRPoint4T<float, double>;
  using PaintBound = CKRBound2T<float, double>;

  // After the base: creates the adapter and listens through it.
  int OnInitialize() override;
  // Releases the adapter, then answers as the base.
  int OnBeforeRelease() override;
  // Tool events to ProcessToolEvent, focus events to OnFocusChanged; other
  // observations are ignored.
  void OnUpdate(CKRObservation* observation) override;

  using IKRSerializableAdaptor::OnBeforeSave;
  virtual void OnBeforeSave();
  // Calls the handler of the event's kind.
  virtual void ProcessToolEvent(CKRToolEvent* event);
  // With `activate` nonzero remembers the window. 0 accepts; nonzero
  // refuses the activation.
  virtual int OnSetActivated(CKRWnd* window, int activate);
  // The adapter the host registers with its router.
  virtual CKRObserver* GetObserver();
  virtual void OnMouseDown(int button, unsigned int flags, CKRScreenPoint point, const WorldPoint& world);
  virtual void OnMouseMove(int button, unsigned int flags, CKRScreenPoint point, const WorldPoint& world);
  virtual void OnMouseUp(int button, unsigned int flags, CKRScreenPoint point, const WorldPoint& world);
  virtual void OnMouseWheel(short delta, unsigned int flags, CKRScreenPoint point, const WorldPoint& world);
  virtual void OnMouseLeave();
  virtual void OnKeyDown(unsigned int key, unsigned int flags, int third, int fourth);
  virtual void OnKeyUp(unsigned int key, unsigned int flags, int third, int fourth);
  virtual void OnPaint(CKRDeviceContext context, int value, CKRScreenSize size, const PaintBound& bound, double scale);
  virtual void OnFocusChanged(bool gained, CKRWnd* window);

  // The window the tool was last activated in (not owned).
  CKRWnd* GetWindow() const { return m_pWindow; }

protected:
  CKRTool() = default;
  ~CKRTool() override = default;

private:
  CKRObserverAdapter* m_pAdapter = nullptr;  // owned
  CKRWnd* m_pWindow = nullptr;
};

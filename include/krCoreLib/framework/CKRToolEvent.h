// CKRToolEvent, CKRFocusEvent and CKRToolEventRouter: user input as
// observations.
//
// A host window fills a tool event (its kind and the fields the kind uses)
// or a focus event and raises it on its router, an observable with which
// only the active tool is registered; the tool dispatches a tool event by
// kind to one handler (CKRTool::ProcessToolEvent):
//
//   kind  handler        first       second   x, y (position)   wheel   world
//   0     OnMouseDown    button      flags    point             -       x, y, z
//   1     OnMouseMove    button      flags    point             -       x, y, z
//   2     OnMouseUp      button      flags    point             -       x, y, z
//   3     OnKeyDown      key         flags    third, fourth     -       -
//   4     OnKeyUp        key         flags    third, fourth     -       -
//   5     OnPaint        device ctx  int      size cx, cy       -       -
//   6     OnMouseWheel   -           flags    point             delta   -
//   8     OnMouseLeave   -           -        -                 -       -
//   other kinds (7 among them) are ignored.
//
// The meaning of the first and second parameters of pointer and key events
// is the host's; the tool passes them through.
#pragma once

#include <krCoreLib/framework/CKRObservable.h>
#include <krCoreLib/platform/KRWindowTypes.h>

#include <cstdint>

class KRCORELIB_API CKRToolEvent : public CKRObservation {
  KR_DECLARE_OBJECT_TYPE(CKRToolEvent, CKRObjectTypeImpl, "{2693E4BF-CD4A-4D2F-9722-3CD885AF66AC}")

public:
  enum EKind : std::int32_t {
    KIND_MOUSE_DOWN = 0,
    KIND_MOUSE_MOVE = 1,
    KIND_MOUSE_UP = 2,
    KIND_KEY_DOWN = 3,
    KIND_KEY_UP = 4,
    KIND_PAINT = 5,
    KIND_MOUSE_WHEEL = 6,
    KIND_IGNORED = 7,
    KIND_MOUSE_LEAVE = 8,
  };

  std::int32_t m_FirstParameter = 0;
  std::uint32_t m_SecondParameter = 0;
  std::int32_t m_PositionX = 0;
  std::int32_t m_PositionY = 0;
  std::int16_t m_WheelDelta = 0;
  double m_WorldX = 0;
  double m_WorldY = 0;
  double m_WorldZ = 0;
  std::int32_t m_Kind = KIND_IGNORED;

protected:
  CKRToolEvent() = default;
  ~CKRToolEvent() override = default;
};

class KRCORELIB_API CKRFocusEvent : public CKRObservation {
  KR_DECLARE_OBJECT_TYPE(CKRFocusEvent, CKRObjectTypeImpl, "{66D6E4CF-D167-4B40-89F0-8467A4961A4B}")

public:
  bool m_Gained = false;
  CKRWnd* m_pWindow = nullptr;  // not owned

protected:
  CKRFocusEvent() = default;
  ~CKRFocusEvent() override = default;
};

// The observable a host raises tool and focus events on.
class KRCORELIB_API CKRToolEventRouter : public CKRObservable {
  KR_DECLARE_OBJECT_TYPE(CKRToolEventRouter, CKRObjectTypeImpl, "{89C55D8F-1380-41E3-8A0C-245E1E4778D5}")

protected:
  CKRToolEventRouter() = default;
  ~CKRToolEventRouter() override = default;
};

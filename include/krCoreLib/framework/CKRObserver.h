// CKRObserver, IKRObservationListener and CKRObserverAdapter: the receiving
// side of observations.
//
// An observer hears the observations of every observable it is registered
// with (CKRObservable::AddObserver) through OnUpdate. An observer that is
// released while still registered is forgotten by those observables at
// once, also in the middle of a delivery pass, so it is never called again;
// a class that overrides OnBeforeRelease must call the base's. Removing an
// observer (RemoveObserver) during a pass keeps it hearing the rest of the
// pass; releasing it there is safe all the same.
//
// Classes that cannot derive from CKRObserver (tools) implement
// IKRObservationListener and are attached to a CKRObserverAdapter. Not
// synchronised: observers are used from one thread.
#pragma once

#include <krCoreLib/objectmodel/CKRObjectImpl.h>

#include <vector>

class CKRObservable;
class CKRObservation;

class KRCORELIB_API IKRObservationListener {
public:
  virtual void OnUpdate(CKRObservation* observation) = 0;

protected:
  ~IKRObservationListener() = default;
};

class KRCORELIB_API CKRObserver : public CKRObjectImpl {
  KR_DECLARE_OBJECT_TYPE(CKRObserver, CKRObjectTypeImpl, "{A3E1639E-0C4D-4A7E-B48C-990F2D031F4E}")

public:
  // Called for every delivered observation.
  virtual void OnUpdate(CKRObservation* observation) = 0;

  // Makes every observable this observer is registered with forget it;
  // allows the release.
  int OnBeforeRelease() override;

protected:
  CKRObserver() = default;
  // Forgotten by the observables that still know it.
  ~CKRObserver() override;

private:
  friend class CKRObservable;
  void ForgetAllObservables();

  // The observables that registered this observer (not owned).
  std::vector<CKRObservable*> m_Observables;
};

class KRCORELIB_API CKRObserverAdapter : public CKRObserver {
  KR_DECLARE_OBJECT_TYPE(CKRObserverAdapter, CKRObjectTypeImpl, "{D8D3E17D-9A46-4602-B39B-C4FD95399463}")

public:
  // Forgets the listener, then answers as the base.
  int OnBeforeRelease() override;
  // The listener's OnUpdate; nothing without a listener.
  void OnUpdate(CKRObservation* observation) override;
  // Not owned; null detaches.
  virtual void SetListener(IKRObservationListener* listener);

protected:
  CKRObserverAdapter() = default;
  ~CKRObserverAdapter() override = default;

private:
  IKRObservationListener* m_pListener = nullptr;
};

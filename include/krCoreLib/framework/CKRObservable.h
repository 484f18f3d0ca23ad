// CKRObservable: keeps, for each type of observation, an ordered list of
// observers, and delivers observations to them.
//
// NotifyObservers queues the observation and, unless a delivery pass is
// running, delivers the queue in order: each observation goes to the
// observers registered under its own type, then under each ancestor type up
// to CKRObservation, in registration order within a type; an auto-release
// observation is released after it has reached them all. Delivery is never
// re-entrant: an observation raised by an observer waits in the queue and
// is delivered later in the same pass. Additions and removals during a pass
// take effect when it ends, under the observation type the call named.
//
// The observable keeps plain pointers and never releases an observer; an
// observer released while registered is forgotten at once (CKRObserver).
// The caller must not release the observable, or an observation it has
// handed over, while a pass delivers it. Registering or removing an
// observer is a logarithmic search; delivering an observation allocates
// nothing. Not synchronised: the lock is against re-entrance on the one
// thread that uses the observable.
#pragma once

#include <krCoreLib/framework/CKRObservation.h>
#include <krCoreLib/framework/CKRObserver.h>
#include <krCoreLib/objectmodel/CKRObjPtrList.h>

#include <map>
#include <unordered_map>
#include <utility>
#include <vector>

class KRCORELIB_API CKRObservable : public CKRObjectImpl {
  KR_DECLARE_OBJECT_TYPE(CKRObservable, CKRObjectTypeImpl, "{D265DD01-767A-4ACB-BCF6-02720CB234E1}")

public:
  // Unlocked.
  int OnInitialize() override;

  // Queues `observation` (null and one already queued are ignored) and,
  // unless a pass runs, delivers the queue.
  virtual void NotifyObservers(CKRObservation* observation);
  // 0 for null and for an observer whose instance ID is registered under
  // `observationTypeID` already (which also cancels its pending removal
  // there); otherwise 1: registered now, or when the running pass ends.
  virtual int AddObserver(CKRObserver* observer, CKRGuid observationTypeID);
  // The observer registered under `observationTypeID` with instance ID
  // `observerID`, or null.
  virtual CKRObserver* GetObserver(CKRGuid observerID, CKRGuid observationTypeID);
  // 1 (also when nothing is registered under the ID): removed now, or when
  // the running pass ends.
  virtual int RemoveObserver(CKRObserver* observer, CKRGuid observationTypeID);

protected:
  CKRObservable() = default;
  // Drops the registrations without notifying anyone; observations still
  // queued are released when they auto-release.
  ~CKRObservable() override;

  // Nonzero holds deliveries and registration changes; 0 applies the
  // pending additions, then the pending removals.
  void SetObserversLocked(int locked);

private:
  friend class CKRObserver;

  struct SKRRegistration {
    CKRObjPtrList<CKRObserver> m_Observers;
    std::unordered_map<CKRGuid, CKRObserver*> m_ByID;
  };
  using SKRPending = std::pair<CKRObserver*, CKRGuid>;

  void Register(SKRRegistration& registration, CKRObserver* observer);
  // Takes `observer` (registered with `observerID`) out of one list, or
  // out of every list (dropping lists that become empty).
  void Unregister(SKRRegistration& registration, CKRObserver* observer, CKRGuid observerID);
  void UnregisterEverywhere(CKRObserver* observer, CKRGuid observerID);
  // The released observer is forgotten everywhere (during a pass it is
  // skipped and taken out when the pass ends).
  void ForgetObserver(CKRObserver* observer);
  void Deliver(CKRObservation* observation);

  int m_ObserversLocked = 0;
  CKRObjPtrList<CKRObservation> m_Queue;
  std::map<CKRGuid, SKRRegistration> m_Registrations;
  std::vector<SKRPending> m_PendingAdditions;
  std::vector<SKRPending> m_PendingRemovals;
  // Observers released during the running pass, with their IDs.
  std::vector<SKRPending> m_Released;
  // Every observer that knows this observable (registered or pending), so
  // that each side can forget the other when it ends.
  std::unordered_map<CKRObserver*, bool> m_Attached;
};

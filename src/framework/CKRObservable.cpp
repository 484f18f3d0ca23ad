#include <krCoreLib/framework/CKRObservable.h>

#include <algorithm>

KR_IMPLEMENT_ABSTRACT_OBJECT_TYPE(CKRObservable, CKRObjectImpl)

namespace {

template <class T>
void EraseAll(std::vector<T>& list, const T& value) {
  list.erase(std::remove(list.begin(), list.end(), value), list.end());
}

template <class T>
void AppendOnce(std::vector<T>& list, const T& value) {
  if (std::find(list.begin(), list.end(), value) == list.end())
    list.push_back(value);
}

}  // namespace

CKRObservable::~CKRObservable() {
  for (const auto& [observer, attached] : m_Attached)
    EraseAll(observer->m_Observables, this);
  // Observations still queued (a derived class held the lock) belong to
  // the observable when they auto-release.
  while (m_Queue.GetCount() > 0) {
    CKRObservation* first = *m_Queue.begin();
    m_Queue.Remove(first);
    if (first->CanAutoRelease() != 0)
      first->Release();
  }
}

int CKRObservable::OnInitialize() {
  m_ObserversLocked = 0;
  return 1;
}

void CKRObservable::Register(SKRRegistration& registration, CKRObserver* observer) {
  registration.m_Observers.Add(observer);
  registration.m_ByID.try_emplace(observer->GetInstanceID(), observer);
}

void CKRObservable::Unregister(SKRRegistration& registration, CKRObserver* observer, CKRGuid observerID) {
  // Only the pointer value is used: a released observer may be gone.
  if (registration.m_Observers.Remove(observer) == nullptr)
    return;
  const auto at = registration.m_ByID.find(observerID);
  if (at != registration.m_ByID.end() && at->second == observer)
    registration.m_ByID.erase(at);
}

void CKRObservable::UnregisterEverywhere(CKRObserver* observer, CKRGuid observerID) {
  for (auto at = m_Registrations.begin(); at != m_Registrations.end();) {
    Unregister(at->second, observer, observerID);
    at = at->second.m_Observers.GetCount() == 0 ? m_Registrations.erase(at) : std::next(at);
  }
}

int CKRObservable::AddObserver(CKRObserver* observer, CKRGuid observationTypeID) {
  if (observer == nullptr)
    return 0;
  SKRRegistration& registration = m_Registrations[observationTypeID];
  if (registration.m_ByID.count(observer->GetInstanceID()) != 0) {
    EraseAll(m_PendingRemovals, SKRPending(observer, observationTypeID));
    return 0;
  }
  if (m_Attached.try_emplace(observer, true).second)
    AppendOnce(observer->m_Observables, this);
  if (m_ObserversLocked != 0)
    AppendOnce(m_PendingAdditions, SKRPending(observer, observationTypeID));
  else
    Register(registration, observer);
  return 1;
}

CKRObserver* CKRObservable::GetObserver(CKRGuid observerID, CKRGuid observationTypeID) {
  const auto at = m_Registrations.find(observationTypeID);
  if (at == m_Registrations.end())
    return nullptr;
  const auto found = at->second.m_ByID.find(observerID);
  return found == at->second.m_ByID.end() ? nullptr : found->second;
}

int CKRObservable::RemoveObserver(CKRObserver* observer, CKRGuid observationTypeID) {
  const auto at = m_Registrations.find(observationTypeID);
  if (at == m_Registrations.end())
    return 1;
  if (m_ObserversLocked != 0) {
    if (observer != nullptr)
      AppendOnce(m_PendingRemovals, SKRPending(observer, observationTypeID));
  } else if (observer != nullptr) {
    Unregister(at->second, observer, observer->GetInstanceID());
  }
  if (at->second.m_Observers.GetCount() == 0)
    m_Registrations.erase(at);
  return 1;
}

void CKRObservable::SetObserversLocked(int locked) {
  m_ObserversLocked = locked;
  if (locked != 0)
    return;
  // Released during the pass: out of every list now that no pass walks them.
  std::vector<SKRPending> released;
  released.swap(m_Released);
  for (const auto& [observer, observerID] : released)
    UnregisterEverywhere(observer, observerID);
  // Each under the observation type its call named.
  std::vector<SKRPending> additions;
  additions.swap(m_PendingAdditions);
  for (const auto& [observer, typeID] : additions)
    AddObserver(observer, typeID);
  std::vector<SKRPending> removals;
  removals.swap(m_PendingRemovals);
  for (const auto& [observer, typeID] : removals)
    RemoveObserver(observer, typeID);
}

void CKRObservable::ForgetObserver(CKRObserver* observer) {
  m_Attached.erase(observer);
  m_PendingAdditions.erase(std::remove_if(m_PendingAdditions.begin(), m_PendingAdditions.end(),
                                          [&](const SKRPending& entry) { return entry.first == observer; }),
                           m_PendingAdditions.end());
  m_PendingRemovals.erase(std::remove_if(m_PendingRemovals.begin(), m_PendingRemovals.end(),
                                         [&](const SKRPending& entry) { return entry.first == observer; }),
                          m_PendingRemovals.end());
  // Still alive here (it is being released): its ID is taken now.
  const CKRGuid observerID = observer->GetInstanceID();
  if (m_ObserversLocked != 0) {
    // A pass may be walking the lists: skipped from now on, taken out when
    // the pass ends.
    AppendOnce(m_Released, SKRPending(observer, observerID));
    return;
  }
  UnregisterEverywhere(observer, observerID);
}

void CKRObservable::Deliver(CKRObservation* observation) {
  for (IKRObjectType* type = observation->GetType(); type != nullptr; type = type->GetParentType()) {
    const CKRGuid typeID = type->GetID();
    if (const auto at = m_Registrations.find(typeID); at != m_Registrations.end())
      // The list does not change during the pass; released observers are
      // skipped.
      for (CKRObserver* observer : at->second.m_Observers)
        if (m_Released.empty() || std::none_of(m_Released.begin(), m_Released.end(),
                                               [&](const SKRPending& entry) { return entry.first == observer; }))
          observer->OnUpdate(observation);
    if (typeID == CKRObservation::TypeID)
      break;
  }
}

void CKRObservable::NotifyObservers(CKRObservation* observation) {
  if (observation != nullptr)
    m_Queue.Add(observation);
  if (m_ObserversLocked != 0)
    return;
  m_ObserversLocked = 1;
  while (m_Queue.GetCount() > 0) {
    CKRObservation* first = *m_Queue.begin();
    m_Queue.Remove(first);
    Deliver(first);
    if (first->CanAutoRelease() != 0)
      first->Release();
  }
  SetObserversLocked(0);
}

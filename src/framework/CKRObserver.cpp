#include <krCoreLib/framework/CKRObserver.h>

#include <krCoreLib/framework/CKRObservable.h>

KR_IMPLEMENT_ABSTRACT_OBJECT_TYPE(CKRObserver, CKRObjectImpl)
KR_IMPLEMENT_OBJECT_TYPE(CKRObserverAdapter, CKRObserver)

CKRObserver::~CKRObserver() {
  ForgetAllObservables();
}

void CKRObserver::ForgetAllObservables() {
  // Taken out first: each observable forgets this observer and its own
  // record of it.
  std::vector<CKRObservable*> observables;
  observables.swap(m_Observables);
  for (CKRObservable* observable : observables)
    observable->ForgetObserver(this);
}

int CKRObserver::OnBeforeRelease() {
  ForgetAllObservables();
  return 1;
}

int CKRObserverAdapter::OnBeforeRelease() {
  m_pListener = nullptr;
  return CKRObserver::OnBeforeRelease();
}

void CKRObserverAdapter::OnUpdate(CKRObservation* observation) {
  if (m_pListener != nullptr)
    m_pListener->OnUpdate(observation);
}

void CKRObserverAdapter::SetListener(IKRObservationListener* listener) {
  m_pListener = listener;
}

// Observables, observers and observations for the framework tests.
#pragma once

#include <krCoreLib/framework/CKRObservable.h>

#include <functional>
#include <string>
#include <vector>

// A new object of `type` as a T.
template <class T>
T* NewObject(IKRObjectType* type) {
  return dynamic_cast<T*>(type->CreateInstance(CKRGuid()));
}

// Observation types A (derived from CKRObservation) and B (derived from A).
class CKRTestObservationA : public CKRObservation {
  KR_DECLARE_OBJECT_TYPE(CKRTestObservationA, CKRObjectTypeImpl, "{6A000000-0000-4000-8000-0000000000A1}")
public:
  std::string m_Label;
};

class CKRTestObservationB : public CKRTestObservationA {
  KR_DECLARE_OBJECT_TYPE(CKRTestObservationB, CKRObjectTypeImpl, "{6A000000-0000-4000-8000-0000000000B1}")
};

class CKRTestObservable : public CKRObservable {
  KR_DECLARE_OBJECT_TYPE(CKRTestObservable, CKRObjectTypeImpl, "{6A000000-0000-4000-8000-0000000000C1}")
public:
  using CKRObservable::SetObserversLocked;
};

// Appends "<name>:<label>" to a shared log for each observation it hears,
// then runs its hook.
class CKRTestObserver : public CKRObserver {
  KR_DECLARE_OBJECT_TYPE(CKRTestObserver, CKRObjectTypeImpl, "{6A000000-0000-4000-8000-0000000000D1}")
public:
  std::string m_Name;
  std::vector<std::string>* m_pLog = nullptr;
  std::function<void(CKRObservation*)> m_Hook;
  static inline int s_Depth = 0;
  static inline int s_MaxDepth = 0;

  void OnUpdate(CKRObservation* observation) override {
    ++s_Depth;
    s_MaxDepth = std::max(s_MaxDepth, s_Depth);
    auto* labelled = dynamic_cast<CKRTestObservationA*>(observation);
    if (m_pLog != nullptr)
      m_pLog->push_back(m_Name + ":" + (labelled != nullptr ? labelled->m_Label : std::string("plain")));
    if (m_Hook)
      m_Hook(observation);
    --s_Depth;
  }
};

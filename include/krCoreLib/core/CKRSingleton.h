// CKRSingleton and CKRSingletonT: process-wide singletons released together.
//
// A singleton class derives from CKRSingletonT<Class, CKRSingleton> (or from
// CKRSingletonT over another singleton base) and declares
// `friend class CKRSingletonT<Class, CKRSingleton>;` when its constructor is
// not public. GetInstance() creates the instance on first use; every created
// singleton registers itself, and CKRSingleton::ReleaseAll(), called by the
// host at exit, releases all of them in the order they were created.
//
// Thread safety: GetInstance, ReleaseInstance and ReleaseAll may be called
// from any thread; a singleton that another thread is still using must not be
// released (releasing ends its life).
#pragma once

#include <krCoreLib/core/KRExport.h>

#include <atomic>
#include <mutex>

class KRCORELIB_API CKRSingleton {
public:
  // Releases every registered singleton, oldest first. Singletons created
  // while this runs are released too.
  static void ReleaseAll();

  // Number of registered (live) singletons.
  static int GetCount();

protected:
  CKRSingleton();
  CKRSingleton(const CKRSingleton&) = delete;
  CKRSingleton& operator=(const CKRSingleton&) = delete;
  virtual ~CKRSingleton();

  // The release slot: ends the singleton's life. The default deletes it.
  virtual void Release();

  // Serialises creation and release of all singletons. Recursive, so that a
  // singleton's constructor may create the singletons it depends on.
  static std::recursive_mutex& GetLock();
};

template <class TClass, class TBase = CKRSingleton>
class KRCORELIB_API CKRSingletonT : public TBase {
public:
  // The instance, created on first use.
  static TClass* GetInstance() {
    CKRSingletonT* instance = m_pInstance.load(std::memory_order_acquire);
    if (instance != nullptr)
      return static_cast<TClass*>(instance);
    std::lock_guard<std::recursive_mutex> guard(CKRSingleton::GetLock());
    instance = m_pInstance.load(std::memory_order_relaxed);
    if (instance == nullptr) {
      TClass* created = new TClass();
      m_pInstance.store(created, std::memory_order_release);
      return created;
    }
    return static_cast<TClass*>(instance);
  }

  // True when the instance exists; never creates it.
  static bool HasInstance() noexcept { return m_pInstance.load(std::memory_order_acquire) != nullptr; }

  // Releases the instance if it exists; a later GetInstance creates a new one.
  static void ReleaseInstance() {
    std::lock_guard<std::recursive_mutex> guard(CKRSingleton::GetLock());
    if (CKRSingletonT* instance = m_pInstance.load(std::memory_order_relaxed))
      instance->Release();
  }

protected:
  CKRSingletonT() = default;
  ~CKRSingletonT() override {
    // However the instance ends (ReleaseInstance, ReleaseAll or a derived
    // Release), the next GetInstance must not see it. The instance is kept
    // as this base so that no cast to TClass is needed here, where the
    // TClass part has already been destroyed.
    CKRSingletonT* self = this;
    m_pInstance.compare_exchange_strong(self, nullptr, std::memory_order_acq_rel);
  }

private:
  static inline std::atomic<CKRSingletonT*> m_pInstance{nullptr};
};

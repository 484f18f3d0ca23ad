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
// released (releasing ends its life). A singleton is taken out of the
// registry and out of GetInstance's reach under the singleton lock, but
// released after the lock is let go: its destructor may wait for threads
// that ask for singletons. The registry itself is never destroyed, so
// ReleaseAll is safe from any exit handler, however early it was registered.
//
// One instance per process, whichever modules ask: the instance slots live
// in the library, one per singleton class, found by the class's type name
// (typeid(TClass).name()). Each module only caches where its classes' slots
// are, in hidden variables. So a plug-in that defines a singleton of its own
// carries no process-wide unique symbol and can be unloaded (after releasing
// its singletons), and a singleton class whose GetInstance is compiled into
// several modules (one of the library's, say) still has one instance. A
// singleton class must therefore have a name of its own in the process: two
// classes of the same name in different modules (in anonymous namespaces,
// for example) would share one slot.
#pragma once

#include <krCoreLib/core/KRExport.h>

#include <atomic>
#include <mutex>
#include <typeinfo>

class KRCORELIB_API CKRSingleton {
public:
  // Releases every registered singleton, oldest first, each once. Singletons
  // created while this runs (by a release, or on another thread) are
  // released too.
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

  // Serialises creation of singletons and changes to the registry.
  // Recursive, so that a singleton's constructor may create the singletons
  // it depends on.
  static std::recursive_mutex& GetLock();

  // The instance slot of GetInstance.
  using Slot = std::atomic<CKRSingleton*>;
  // The process-wide slot of the singleton class named `typeName` (a type
  // name as given by std::type_info::name), created empty on first request
  // and never destroyed. Null `typeName`: null.
  static Slot* FindSlot(const char* typeName);
  // Makes `created` the instance of `slot` (under the lock).
  static void Publish(CKRSingleton* created, Slot& slot);
  // Takes the instance of `slot` out of the slot and the registry and
  // releases it outside the lock; nothing when the slot is empty.
  static void ReleaseSlot(Slot& slot);
  // The destructor's part: empties `slot` when it still holds this.
  void ClearSlot(Slot& slot) noexcept;

private:
  // Under the lock: out of the registry and out of its slot.
  void Detach();

  Slot* m_pSlot = nullptr;
};

template <class TClass, class TBase = CKRSingleton>
class KRCORELIB_API CKRSingletonT : public TBase {
public:
  // The instance, created on first use.
  static TClass* GetInstance() {
    CKRSingleton::Slot& slot = InstanceSlot();
    CKRSingleton* instance = slot.load(std::memory_order_acquire);
    if (instance != nullptr)
      return static_cast<TClass*>(instance);
    std::lock_guard<std::recursive_mutex> guard(CKRSingleton::GetLock());
    instance = slot.load(std::memory_order_relaxed);
    if (instance == nullptr) {
      TClass* created = new TClass();
      CKRSingleton::Publish(created, slot);
      return created;
    }
    return static_cast<TClass*>(instance);
  }

  // True when the instance exists; never creates it.
  static bool HasInstance() { return InstanceSlot().load(std::memory_order_acquire) != nullptr; }

  // Releases the instance if it exists; a later GetInstance creates a new one.
  static void ReleaseInstance() { CKRSingleton::ReleaseSlot(InstanceSlot()); }

protected:
  CKRSingletonT() = default;
  // However the instance ends (ReleaseInstance, ReleaseAll or a derived
  // Release, or a plain delete), the next GetInstance must not see it.
  ~CKRSingletonT() override { this->ClearSlot(InstanceSlot()); }

private:
  // The library's slot of TClass, looked up once per module. The cache is a
  // local of a hidden function, one per module: a static data member would
  // be a process-wide unique symbol (g++ ignores visibility attributes on
  // static data members of class templates) that pins a plug-in in memory.
  KRCORELIB_LOCAL static CKRSingleton::Slot& InstanceSlot() {
    static std::atomic<CKRSingleton::Slot*> s_pSlot{nullptr};
    CKRSingleton::Slot* slot = s_pSlot.load(std::memory_order_acquire);
    if (slot == nullptr) {
      slot = CKRSingleton::FindSlot(typeid(TClass).name());
      s_pSlot.store(slot, std::memory_order_release);
    }
    return *slot;
  }
};

#include <krCoreLib/core/CKRSingleton.h>

#include <algorithm>
#include <map>
#include <memory>
#include <string>
#include <vector>

namespace {

// The lock and the live singletons in creation order. Created on first use
// and never destroyed: a host may call ReleaseAll from an exit handler
// registered before the first singleton was created, which runs after every
// function-local static constructed later has been destroyed.
struct SKRSingletonRegistry {
  std::recursive_mutex m_Lock;
  std::vector<CKRSingleton*> m_Live;
  // The instance slots by singleton class name. A slot outlives the module
  // of its class: a module loaded again finds its empty slot.
  std::map<std::string, std::unique_ptr<std::atomic<CKRSingleton*>>, std::less<>> m_Slots;
};

SKRSingletonRegistry& Registry() {
  static auto* s_pRegistry = new SKRSingletonRegistry();
  return *s_pRegistry;
}

}  // namespace

std::recursive_mutex& CKRSingleton::GetLock() {
  return Registry().m_Lock;
}

CKRSingleton::CKRSingleton() {
  SKRSingletonRegistry& registry = Registry();
  std::lock_guard<std::recursive_mutex> guard(registry.m_Lock);
  registry.m_Live.push_back(this);
}

CKRSingleton::~CKRSingleton() {
  std::lock_guard<std::recursive_mutex> guard(GetLock());
  Detach();
}

void CKRSingleton::Detach() {
  auto& live = Registry().m_Live;
  live.erase(std::remove(live.begin(), live.end(), this), live.end());
  if (m_pSlot != nullptr)
    ClearSlot(*m_pSlot);
  m_pSlot = nullptr;
}

void CKRSingleton::ClearSlot(Slot& slot) noexcept {
  CKRSingleton* self = this;
  slot.compare_exchange_strong(self, nullptr, std::memory_order_acq_rel);
}

CKRSingleton::Slot* CKRSingleton::FindSlot(const char* typeName) {
  if (typeName == nullptr)
    return nullptr;
  SKRSingletonRegistry& registry = Registry();
  std::lock_guard<std::recursive_mutex> guard(registry.m_Lock);
  std::unique_ptr<Slot>& slot = registry.m_Slots[typeName];
  if (slot == nullptr)
    slot = std::make_unique<Slot>(nullptr);
  return slot.get();
}

void CKRSingleton::Publish(CKRSingleton* created, Slot& slot) {
  created->m_pSlot = &slot;
  slot.store(created, std::memory_order_release);
}

void CKRSingleton::ReleaseSlot(Slot& slot) {
  CKRSingleton* instance = nullptr;
  {
    std::lock_guard<std::recursive_mutex> guard(GetLock());
    instance = slot.load(std::memory_order_relaxed);
    if (instance == nullptr)
      return;
    instance->Detach();
  }
  instance->Release();
}

void CKRSingleton::Release() {
  delete this;
}

void CKRSingleton::ReleaseAll() {
  SKRSingletonRegistry& registry = Registry();
  for (;;) {
    // The oldest is taken out before it is released: a singleton created
    // meanwhile, even at the address of one just released, is a new entry.
    CKRSingleton* oldest = nullptr;
    {
      std::lock_guard<std::recursive_mutex> guard(registry.m_Lock);
      if (registry.m_Live.empty())
        return;
      oldest = registry.m_Live.front();
      oldest->Detach();
    }
    // Outside the lock: a destructor that waits for a thread asking for a
    // singleton must not wait for this thread's lock. A Release that does
    // not end the singleton's life leaves it out of the registry all the same.
    oldest->Release();
  }
}

int CKRSingleton::GetCount() {
  std::lock_guard<std::recursive_mutex> guard(GetLock());
  return static_cast<int>(Registry().m_Live.size());
}

#include <krCoreLib/core/CKRSingleton.h>

#include <algorithm>
#include <vector>

namespace {

// Live singletons in creation order.
std::vector<CKRSingleton*>& Registry() {
  static std::vector<CKRSingleton*> registry;
  return registry;
}

}  // namespace

std::recursive_mutex& CKRSingleton::GetLock() {
  static std::recursive_mutex lock;
  return lock;
}

CKRSingleton::CKRSingleton() {
  std::lock_guard<std::recursive_mutex> guard(GetLock());
  Registry().push_back(this);
}

CKRSingleton::~CKRSingleton() {
  std::lock_guard<std::recursive_mutex> guard(GetLock());
  auto& registry = Registry();
  registry.erase(std::remove(registry.begin(), registry.end(), this), registry.end());
}

void CKRSingleton::Release() {
  delete this;
}

void CKRSingleton::ReleaseAll() {
  std::lock_guard<std::recursive_mutex> guard(GetLock());
  auto& registry = Registry();
  // Each release unregisters its singleton (and may create or release
  // others), so always take the oldest one still registered.
  while (!registry.empty()) {
    CKRSingleton* oldest = registry.front();
    oldest->Release();
    // A Release that did not end the singleton's life must not stall the
    // sweep: the singleton leaves the registry all the same.
    if (!registry.empty() && registry.front() == oldest)
      registry.erase(registry.begin());
  }
}

int CKRSingleton::GetCount() {
  std::lock_guard<std::recursive_mutex> guard(GetLock());
  return static_cast<int>(Registry().size());
}

#include <krCoreLib/core/CKRDebugOutput.h>

#include <atomic>
#include <cstdarg>
#include <cstdio>
#include <mutex>

namespace {

struct SKRDebugChannel {
  std::mutex m_Lock;
  CKRDebugOutput::Handler m_pHandler = nullptr;
  void* m_pContext = nullptr;
  // Read without the lock so that disabled output costs one load.
  std::atomic<bool> m_Enabled{false};
};

SKRDebugChannel& Channel() {
  static SKRDebugChannel channel;
  return channel;
}

}  // namespace

CKRDebugOutput::Handler CKRDebugOutput::SetHandler(Handler handler, void* context) {
  SKRDebugChannel& channel = Channel();
  std::lock_guard<std::mutex> guard(channel.m_Lock);
  const Handler previous = channel.m_pHandler;
  channel.m_pHandler = handler;
  channel.m_pContext = context;
  channel.m_Enabled.store(handler != nullptr, std::memory_order_release);
  return previous;
}

bool CKRDebugOutput::IsEnabled() noexcept {
  return Channel().m_Enabled.load(std::memory_order_acquire);
}

void CKRDebugOutput::Write(const wchar_t* text) {
  if (text == nullptr || !IsEnabled())
    return;
  SKRDebugChannel& channel = Channel();
  std::lock_guard<std::mutex> guard(channel.m_Lock);
  if (channel.m_pHandler != nullptr)
    channel.m_pHandler(text, channel.m_pContext);
}

void CKRDebugOutput::Printf(const wchar_t* format, ...) {
  if (!IsEnabled())
    return;
  CKRString text;
  std::va_list arguments;
  va_start(arguments, format);
  text.FormatV(format, arguments);
  va_end(arguments);
  Write(text.GetString());
}

void CKRDebugOutput::StandardError(const wchar_t* text, void*) {
  const std::string narrow = CKRString::ToUtf8(text);
  std::fwrite(narrow.data(), 1, narrow.size(), stderr);
  std::fflush(stderr);
}

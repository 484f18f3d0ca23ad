#include <krCoreLib/platform/KRBStr.h>

#include <cstdint>
#include <cstdlib>
#include <cstring>
#include <cwchar>
#include <limits>

// Layout of one allocation: [uint32 byte count][padding][characters][NUL].
// The header is padded to the alignment of wchar_t so that the text that the
// BSTR points at is correctly aligned whatever the size of wchar_t.
namespace {

constexpr std::size_t kHeaderSize =
    (sizeof(std::uint32_t) + alignof(wchar_t) - 1) / alignof(wchar_t) * alignof(wchar_t);

unsigned char* HeaderOf(BSTR text) {
  return reinterpret_cast<unsigned char*>(text) - kHeaderSize;
}

}  // namespace

BSTR SysAllocString(const wchar_t* text) noexcept {
  if (text == nullptr)
    return nullptr;
  const std::size_t length = std::wcslen(text);
  if (length > std::numeric_limits<unsigned int>::max())
    return nullptr;
  return SysAllocStringLen(text, static_cast<unsigned int>(length));
}

BSTR SysAllocStringLen(const wchar_t* text, unsigned int length) noexcept {
  // The byte count must fit the 32-bit header.
  const std::uint64_t bytes = std::uint64_t(length) * sizeof(wchar_t);
  if (bytes > std::numeric_limits<std::uint32_t>::max())
    return nullptr;
  void* block = std::malloc(kHeaderSize + bytes + sizeof(wchar_t));
  if (block == nullptr)
    return nullptr;
  const std::uint32_t count = static_cast<std::uint32_t>(bytes);
  std::memcpy(block, &count, sizeof(count));
  BSTR result = reinterpret_cast<BSTR>(static_cast<unsigned char*>(block) + kHeaderSize);
  if (text != nullptr)
    std::memcpy(result, text, bytes);
  else
    std::memset(result, 0, bytes);
  result[length] = L'\0';
  return result;
}

void SysFreeString(BSTR text) noexcept {
  if (text != nullptr)
    std::free(HeaderOf(text));
}

unsigned int SysStringByteLen(BSTR text) noexcept {
  if (text == nullptr)
    return 0;
  std::uint32_t count;
  std::memcpy(&count, HeaderOf(text), sizeof(count));
  return count;
}

unsigned int SysStringLen(BSTR text) noexcept {
  return SysStringByteLen(text) / sizeof(wchar_t);
}

#include <krCoreLib/system/CKRSystem.h>

#include <krCoreLib/core/CKRString.h>

#include "KRNativePath.h"
#include "SKRFiles.h"

#include <algorithm>
#include <chrono>
#include <cstdarg>
#include <cstdint>
#include <cstring>
#include <cwchar>
#include <wchar.h>
#include <string>

namespace {

void SwapItem(unsigned char* item, std::size_t size) noexcept {
  std::reverse(item, item + size);
}

void SwapItems(unsigned char* items, std::size_t size, std::size_t count) noexcept {
  for (std::size_t i = 0; i < count; ++i)
    SwapItem(items + i * size, size);
}

std::size_t ReadFile(std::FILE* file, std::size_t size, std::size_t count, void* destination, bool swap) noexcept {
  if (file == nullptr || destination == nullptr || count == 0)
    return 0;
  const std::size_t items = std::fread(destination, size, count, file);
  if (swap)
    SwapItems(static_cast<unsigned char*>(destination), size, items);
  return items * size;
}

std::size_t ReadMemory(const void* source, std::size_t size, std::size_t count, void* destination,
                       bool swap) noexcept {
  if (source == nullptr || destination == nullptr || count == 0 || count > SIZE_MAX / size)
    return 0;
  std::memmove(destination, source, size * count);
  if (swap)
    SwapItems(static_cast<unsigned char*>(destination), size, count);
  return size * count;
}

std::size_t WriteFile(std::FILE* file, std::size_t size, std::size_t count, const void* source, bool swap) noexcept {
  if (file == nullptr || source == nullptr || count == 0)
    return 0;
  if (!swap)
    return std::fwrite(source, size, count, file) * size;
  // Swapped through a small buffer, leaving the source as it is.
  constexpr std::size_t kChunkBytes = 4096;
  unsigned char chunk[kChunkBytes];
  const auto* bytes = static_cast<const unsigned char*>(source);
  const std::size_t perChunk = kChunkBytes / size;
  std::size_t written = 0;
  while (written < count) {
    const std::size_t items = std::min(perChunk, count - written);
    std::memcpy(chunk, bytes + written * size, items * size);
    SwapItems(chunk, size, items);
    const std::size_t put = std::fwrite(chunk, size, items, file);
    written += put;
    if (put < items)
      break;
  }
  return written * size;
}

std::size_t WriteMemory(void* destination, std::size_t size, std::size_t count, const void* source,
                        bool swap) noexcept {
  // The same copy as a read, seen from the other side.
  return ReadMemory(source, size, count, destination, swap);
}

// Formats in the library's dialect; false when memory ran out.
bool FormatText(CKRString& text, const wchar_t* format, std::va_list arguments) noexcept {
  try {
    text.FormatV(format, arguments);
    return true;
  } catch (...) {
    return false;
  }
}

bool WriteWhole(const wchar_t* path, const void* data, std::size_t size, bool append) noexcept {
  if (data == nullptr || size < 1)
    return false;
  try {
    std::string native;
    return SKRNativePath::ToNative(path, native) && SKRFiles::WriteWholeFile(native.c_str(), data, size, append);
  } catch (...) {
    return false;
  }
}

// Empties a destination that has room for the terminator, as the bounded
// copies do on failure.
void EmptyOut(wchar_t* destination, std::size_t destinationSize) noexcept {
  if (destination != nullptr && destinationSize > 0)
    destination[0] = L'\0';
}

}  // namespace

void CKRSystem::SwapBytes(int size, void* item) noexcept {
  if (item != nullptr && size > 1)
    SwapItem(static_cast<unsigned char*>(item), std::size_t(size));
}

void CKRSystem::SwapBytes(int size, int count, void* items) noexcept {
  if (items != nullptr && size > 1 && count > 0)
    SwapItems(static_cast<unsigned char*>(items), std::size_t(size), std::size_t(count));
}

void CKRSystem::EndianCopy(int size, const void* source, void* destination) noexcept {
  EndianCopy(size, 1, source, destination);
}

void CKRSystem::EndianCopy(int size, int count, const void* source, void* destination) noexcept {
  if (source == nullptr || destination == nullptr || size < 1 || count < 1)
    return;
  ReadMemory(source, std::size_t(size), std::size_t(count), destination, size > 1);
}

// clang-format off
std::size_t CKRSystem::Read1(std::FILE* f, std::size_t n, void* d) noexcept { return ReadFile(f, 1, n, d, false); }
std::size_t CKRSystem::Read2le(std::FILE* f, std::size_t n, void* d) noexcept { return ReadFile(f, 2, n, d, false); }
std::size_t CKRSystem::Read4le(std::FILE* f, std::size_t n, void* d) noexcept { return ReadFile(f, 4, n, d, false); }
std::size_t CKRSystem::Read8le(std::FILE* f, std::size_t n, void* d) noexcept { return ReadFile(f, 8, n, d, false); }
std::size_t CKRSystem::Read2be(std::FILE* f, std::size_t n, void* d) noexcept { return ReadFile(f, 2, n, d, true); }
std::size_t CKRSystem::Read4be(std::FILE* f, std::size_t n, void* d) noexcept { return ReadFile(f, 4, n, d, true); }
std::size_t CKRSystem::Read8be(std::FILE* f, std::size_t n, void* d) noexcept { return ReadFile(f, 8, n, d, true); }
std::size_t CKRSystem::Read1(const void* s, std::size_t n, void* d) noexcept { return ReadMemory(s, 1, n, d, false); }
std::size_t CKRSystem::Read2le(const void* s, std::size_t n, void* d) noexcept { return ReadMemory(s, 2, n, d, false); }
std::size_t CKRSystem::Read4le(const void* s, std::size_t n, void* d) noexcept { return ReadMemory(s, 4, n, d, false); }
std::size_t CKRSystem::Read8le(const void* s, std::size_t n, void* d) noexcept { return ReadMemory(s, 8, n, d, false); }
std::size_t CKRSystem::Read2be(const void* s, std::size_t n, void* d) noexcept { return ReadMemory(s, 2, n, d, true); }
std::size_t CKRSystem::Read4be(const void* s, std::size_t n, void* d) noexcept { return ReadMemory(s, 4, n, d, true); }
std::size_t CKRSystem::Read8be(const void* s, std::size_t n, void* d) noexcept { return ReadMemory(s, 8, n, d, true); }

std::size_t CKRSystem::Write1(std::FILE* f, std::size_t n, const void* s) noexcept { return WriteFile(f, 1, n, s, false); }
std::size_t CKRSystem::Write2le(std::FILE* f, std::size_t n, const void* s) noexcept { return WriteFile(f, 2, n, s, false); }
std::size_t CKRSystem::Write4le(std::FILE* f, std::size_t n, const void* s) noexcept { return WriteFile(f, 4, n, s, false); }
std::size_t CKRSystem::Write8le(std::FILE* f, std::size_t n, const void* s) noexcept { return WriteFile(f, 8, n, s, false); }
std::size_t CKRSystem::Write2be(std::FILE* f, std::size_t n, const void* s) noexcept { return WriteFile(f, 2, n, s, true); }
std::size_t CKRSystem::Write4be(std::FILE* f, std::size_t n, const void* s) noexcept { return WriteFile(f, 4, n, s, true); }
std::size_t CKRSystem::Write8be(std::FILE* f, std::size_t n, const void* s) noexcept { return WriteFile(f, 8, n, s, true); }
std::size_t CKRSystem::Write1(void* d, std::size_t n, const void* s) noexcept { return WriteMemory(d, 1, n, s, false); }
std::size_t CKRSystem::Write2le(void* d, std::size_t n, const void* s) noexcept { return WriteMemory(d, 2, n, s, false); }
std::size_t CKRSystem::Write4le(void* d, std::size_t n, const void* s) noexcept { return WriteMemory(d, 4, n, s, false); }
std::size_t CKRSystem::Write8le(void* d, std::size_t n, const void* s) noexcept { return WriteMemory(d, 8, n, s, false); }
std::size_t CKRSystem::Write2be(void* d, std::size_t n, const void* s) noexcept { return WriteMemory(d, 2, n, s, true); }
std::size_t CKRSystem::Write4be(void* d, std::size_t n, const void* s) noexcept { return WriteMemory(d, 4, n, s, true); }
std::size_t CKRSystem::Write8be(void* d, std::size_t n, const void* s) noexcept { return WriteMemory(d, 8, n, s, true); }
// clang-format on

bool CKRSystem::Load(const wchar_t* path, unsigned char*& buffer, std::size_t& size) noexcept {
  buffer = nullptr;
  size = 0;
  try {
    std::string native;
    return SKRNativePath::ToNative(path, native) && SKRFiles::ReadWholeFile(native.c_str(), kMaxLoadSize, buffer, size);
  } catch (...) {
    return false;
  }
}

bool CKRSystem::Save(const wchar_t* path, const void* data, std::size_t size) noexcept {
  return WriteWhole(path, data, size, false);
}

bool CKRSystem::Append(const wchar_t* path, const void* data, std::size_t size) noexcept {
  return WriteWhole(path, data, size, true);
}

double CKRSystem::GetTime() noexcept {
  using namespace std::chrono;
  const steady_clock::time_point now = steady_clock::now();
  // Set by the first caller; a thread that read the clock just before it
  // would see a tiny negative time, hence the clamp.
  static const steady_clock::time_point s_Start = now;
  const auto elapsed = duration_cast<milliseconds>(now - s_Start).count();
  return elapsed > 0 ? double(elapsed) / 1000.0 : 0.0;
}

const wchar_t* CKRSystem::GetPath(const wchar_t* directory, const wchar_t* name) noexcept {
  // One buffer per thread: the result stays valid until the same thread
  // calls again, whatever other threads do.
  thread_local wchar_t t_Buffer[kPathBufferSize];
  const std::size_t directoryLength = directory != nullptr ? std::wcslen(directory) : 0;
  const std::size_t nameLength = name != nullptr ? std::wcslen(name) : 0;
  if (directoryLength + nameLength + 1 > kPathBufferSize)
    return nullptr;
  std::wmemcpy(t_Buffer, directory != nullptr ? directory : L"", directoryLength);
  std::wmemcpy(t_Buffer + directoryLength, name != nullptr ? name : L"", nameLength);
  t_Buffer[directoryLength + nameLength] = L'\0';
  return t_Buffer;
}

void* CKRSystem::Memcpy(void* destination, std::size_t destinationSize, const void* source,
                        std::size_t count) noexcept {
  if (count == 0)
    return destination;
  if (destination == nullptr || source == nullptr || count > destinationSize)
    return nullptr;
  std::memmove(destination, source, count);
  return destination;
}

wchar_t* CKRSystem::Strcpy(wchar_t* destination, std::size_t destinationSize, const wchar_t* source) noexcept {
  return Strncpy(destination, destinationSize, source, std::size_t(-1));
}

wchar_t* CKRSystem::Strcat(wchar_t* destination, std::size_t destinationSize, const wchar_t* source) noexcept {
  if (destination == nullptr || destinationSize == 0)
    return nullptr;
  const std::size_t used = ::wcsnlen(destination, destinationSize);
  if (source == nullptr || used == destinationSize) {
    EmptyOut(destination, destinationSize);
    return nullptr;
  }
  const std::size_t length = std::wcslen(source);
  if (length >= destinationSize - used) {
    EmptyOut(destination, destinationSize);
    return nullptr;
  }
  std::wmemmove(destination + used, source, length);
  destination[used + length] = L'\0';
  return destination;
}

wchar_t* CKRSystem::Strncpy(wchar_t* destination, std::size_t destinationSize, const wchar_t* source,
                            std::size_t count) noexcept {
  if (destination == nullptr || destinationSize == 0)
    return nullptr;
  if (source == nullptr) {
    EmptyOut(destination, destinationSize);
    return nullptr;
  }
  // Only as far as the room allows plus one, so that an unterminated source
  // is never read beyond what could be copied.
  const std::size_t length = ::wcsnlen(source, std::min(count, destinationSize));
  if (length >= destinationSize) {
    EmptyOut(destination, destinationSize);
    return nullptr;
  }
  std::wmemmove(destination, source, length);
  destination[length] = L'\0';
  return destination;
}

int CKRSystem::Sprintf(wchar_t* destination, std::size_t destinationSize, const wchar_t* format, ...) noexcept {
  if (destination == nullptr || destinationSize == 0)
    return -1;
  if (format == nullptr) {
    EmptyOut(destination, destinationSize);
    return -1;
  }
  CKRString text;
  std::va_list arguments;
  va_start(arguments, format);
  const bool formatted = FormatText(text, format, arguments);
  va_end(arguments);
  if (!formatted || text.size() >= destinationSize) {
    EmptyOut(destination, destinationSize);
    return -1;
  }
  std::wmemcpy(destination, text.GetString(), text.size() + 1);
  return text.GetLength();
}

wchar_t* CKRSystem::Strtok(wchar_t* text, const wchar_t* delimiters, wchar_t** context) noexcept {
  if (delimiters == nullptr || context == nullptr || (text == nullptr && *context == nullptr))
    return nullptr;
  return std::wcstok(text, delimiters, context);
}

std::FILE* CKRSystem::Fopen(const wchar_t* path, const wchar_t* mode) noexcept {
  if (mode == nullptr)
    return nullptr;
  try {
    std::string native;
    std::string narrowMode;
    for (const wchar_t* c = mode; *c != L'\0'; ++c) {
      if (*c > 0x7F)
        return nullptr;
      narrowMode += char(*c);
    }
    if (!SKRNativePath::ToNative(path, native))
      return nullptr;
    return SKRFiles::OpenStream(native.c_str(), narrowMode.c_str());
  } catch (...) {
    return nullptr;
  }
}

int CKRSystem::Fprintf(std::FILE* file, const wchar_t* format, ...) noexcept {
  if (file == nullptr || format == nullptr)
    return -1;
  CKRString text;
  std::va_list arguments;
  va_start(arguments, format);
  const bool formatted = FormatText(text, format, arguments);
  va_end(arguments);
  if (!formatted)
    return -1;
  try {
    const std::string bytes = text.ToUtf8();
    if (std::fwrite(bytes.data(), 1, bytes.size(), file) != bytes.size())
      return -1;
    return static_cast<int>(bytes.size());
  } catch (...) {
    return -1;
  }
}

int CKRSystem::Fclose(std::FILE* file) noexcept {
  if (file == nullptr)
    return -1;
  return std::fclose(file) == 0 ? 0 : -1;
}

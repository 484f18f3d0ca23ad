// CKRSystem: byte order, whole-file input and output, a seconds clock,
// bounded string and memory copies, and colour packing.
//
// All operations are static, report failure by their result (false, 0, null
// or -1 as each says) and never throw. Paths are wide texts; a path that is
// null, empty, longer than the system's limit (4095 bytes in UTF-8) or
// holds characters without a UTF-8 form (lone surrogates, values above
// U+10FFFF) names no file: operations on it fail. Thread safety: every
// operation may be called from any thread; GetPath's buffer belongs to the
// calling thread.
#pragma once

#include <krCoreLib/core/KRExport.h>

#include <cstddef>
#include <cstdint>
#include <cstdio>

class KRCORELIB_API CKRSystem {
public:
  // Largest file Load reads: files must fit in 32 bits, as for mapped
  // files; larger ones are refused before anything is allocated.
  static constexpr std::uint64_t kMaxLoadSize = 0xFFFFFFFFull;
  // Characters of GetPath's buffer, terminator included.
  static constexpr std::size_t kPathBufferSize = 1024;

  // Byte order of this machine: false (little-endian).
  static constexpr bool IsBigEndian() noexcept { return false; }

  // Reverses the order of the `size` bytes of one item; nothing for a null
  // item or a size below 2.
  static void SwapBytes(int size, void* item) noexcept;
  // The same for `count` consecutive items; nothing when count < 1.
  static void SwapBytes(int size, int count, void* items) noexcept;
  // Copy, then swap the copy; the source is not changed. The ranges may
  // overlap.
  static void EndianCopy(int size, const void* source, void* destination) noexcept;
  static void EndianCopy(int size, int count, const void* source, void* destination) noexcept;

  // Read `count` items of 1, 2, 4 or 8 bytes into `destination`, from a file
  // or from memory; the -be forms swap each item to this machine's order.
  // Return the number of bytes stored: count times the item size, or for a
  // file that ends early the whole items it held (only those are swapped).
  // Null pointers give 0.
  static std::size_t Read1(std::FILE* file, std::size_t count, void* destination) noexcept;
  static std::size_t Read2le(std::FILE* file, std::size_t count, void* destination) noexcept;
  static std::size_t Read4le(std::FILE* file, std::size_t count, void* destination) noexcept;
  static std::size_t Read8le(std::FILE* file, std::size_t count, void* destination) noexcept;
  static std::size_t Read2be(std::FILE* file, std::size_t count, void* destination) noexcept;
  static std::size_t Read4be(std::FILE* file, std::size_t count, void* destination) noexcept;
  static std::size_t Read8be(std::FILE* file, std::size_t count, void* destination) noexcept;
  static std::size_t Read1(const void* source, std::size_t count, void* destination) noexcept;
  static std::size_t Read2le(const void* source, std::size_t count, void* destination) noexcept;
  static std::size_t Read4le(const void* source, std::size_t count, void* destination) noexcept;
  static std::size_t Read8le(const void* source, std::size_t count, void* destination) noexcept;
  static std::size_t Read2be(const void* source, std::size_t count, void* destination) noexcept;
  static std::size_t Read4be(const void* source, std::size_t count, void* destination) noexcept;
  static std::size_t Read8be(const void* source, std::size_t count, void* destination) noexcept;

  // Write `count` items from `source` to a file or to memory; the -be forms
  // write each item with its bytes swapped and leave the source unchanged.
  // Return the number of bytes written (for a file, of the whole items
  // written before an error). Null pointers give 0.
  static std::size_t Write1(std::FILE* file, std::size_t count, const void* source) noexcept;
  static std::size_t Write2le(std::FILE* file, std::size_t count, const void* source) noexcept;
  static std::size_t Write4le(std::FILE* file, std::size_t count, const void* source) noexcept;
  static std::size_t Write8le(std::FILE* file, std::size_t count, const void* source) noexcept;
  static std::size_t Write2be(std::FILE* file, std::size_t count, const void* source) noexcept;
  static std::size_t Write4be(std::FILE* file, std::size_t count, const void* source) noexcept;
  static std::size_t Write8be(std::FILE* file, std::size_t count, const void* source) noexcept;
  static std::size_t Write1(void* destination, std::size_t count, const void* source) noexcept;
  static std::size_t Write2le(void* destination, std::size_t count, const void* source) noexcept;
  static std::size_t Write4le(void* destination, std::size_t count, const void* source) noexcept;
  static std::size_t Write8le(void* destination, std::size_t count, const void* source) noexcept;
  static std::size_t Write2be(void* destination, std::size_t count, const void* source) noexcept;
  static std::size_t Write4be(void* destination, std::size_t count, const void* source) noexcept;
  static std::size_t Write8be(void* destination, std::size_t count, const void* source) noexcept;

  // Reads the whole regular file at `path` into a new buffer that the
  // caller releases with delete[]. True only when every byte was read and
  // the file closed cleanly; an empty file gives true, size 0 and a valid
  // buffer. Directories, pipes, devices, files beyond kMaxLoadSize and
  // unreadable files give false. On any failure `buffer` is null and `size`
  // 0: no partial buffer is ever returned.
  static bool Load(const wchar_t* path, unsigned char*& buffer, std::size_t& size) noexcept;
  // Writes the bytes to the file, replacing its content (creating it when
  // missing). False for null data or a size of 0, and for anything but a
  // regular file: a directory, a pipe or device, or a dangling symbolic
  // link (no file is created through it). True when every byte was written
  // and the file closed cleanly.
  static bool Save(const wchar_t* path, const void* data, std::size_t size) noexcept;
  // As Save, appending to the file.
  static bool Append(const wchar_t* path, const void* data, std::size_t size) noexcept;

  // Seconds since the first call in this process, with millisecond
  // resolution; the first call returns 0. Never goes backwards.
  static double GetTime() noexcept;

  // `directory` followed by `name` (no separator is added; null counts as
  // empty) in a buffer of kPathBufferSize characters that belongs to the
  // calling thread and is overwritten by that thread's next call. Null when
  // the result with its terminator would not fit.
  static const wchar_t* GetPath(const wchar_t* directory, const wchar_t* name) noexcept;

  // Copies `count` bytes (the ranges may overlap) and returns destination;
  // null, copying nothing, when count exceeds destinationSize or a pointer
  // is null while count > 0.
  static void* Memcpy(void* destination, std::size_t destinationSize, const void* source,
                      std::size_t count) noexcept;

  // Bounded wide-string operations. `destinationSize` counts characters,
  // terminator included. Each returns destination, or null when the result
  // would not fit or an argument is invalid; then destination (when it has
  // room for one character) is left empty, never holding a cut text.
  static wchar_t* Strcpy(wchar_t* destination, std::size_t destinationSize, const wchar_t* source) noexcept;
  // Appends; destination must hold a terminated text within its size.
  static wchar_t* Strcat(wchar_t* destination, std::size_t destinationSize, const wchar_t* source) noexcept;
  // Copies at most `count` characters of source and a terminator.
  static wchar_t* Strncpy(wchar_t* destination, std::size_t destinationSize, const wchar_t* source,
                          std::size_t count) noexcept;
  // Formats in the library's printf dialect (CKRString::Format: "%s" takes
  // a wide text). Returns the number of characters written without the
  // terminator, or -1 (destination left empty) when it does not fit.
  static int Sprintf(wchar_t* destination, std::size_t destinationSize, const wchar_t* format, ...) noexcept;
  // Splits `text` at any of `delimiters`: pass the text on the first call,
  // null on the following ones; `context` keeps the position between
  // calls. Null when no token is left or an argument is invalid.
  static wchar_t* Strtok(wchar_t* text, const wchar_t* delimiters, wchar_t** context) noexcept;

  // Opens a file with a C mode ("rb", "wb", "ab", "r+b", ...); the stream
  // is close-on-exec, and opening a pipe never waits for its other end.
  // Null on failure. Close it with Fclose.
  static std::FILE* Fopen(const wchar_t* path, const wchar_t* mode) noexcept;
  // Writes formatted text (library dialect) as UTF-8. Returns the number of
  // bytes written, or -1 for a null file or format or a failed write.
  static int Fprintf(std::FILE* file, const wchar_t* format, ...) noexcept;
  // 0 when the stream closed cleanly, -1 otherwise (also for null).
  static int Fclose(std::FILE* file) noexcept;

  // Pack 8-bit channels into a 32-bit colour: red in the lowest byte, then
  // green, blue and (MakeRGBA) alpha in the highest.
  static constexpr std::uint32_t MakeRGB(std::uint8_t red, std::uint8_t green, std::uint8_t blue) noexcept {
    return std::uint32_t(red) | (std::uint32_t(green) << 8) | (std::uint32_t(blue) << 16);
  }
  static constexpr std::uint32_t MakeRGBA(std::uint8_t red, std::uint8_t green, std::uint8_t blue,
                                          std::uint8_t alpha) noexcept {
    return MakeRGB(red, green, blue) | (std::uint32_t(alpha) << 24);
  }
};

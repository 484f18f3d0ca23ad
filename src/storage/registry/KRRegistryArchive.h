// The binary layout of the collections the registry serializer stores as
// binary values: the platform class library's archive format for counted
// lists and strings (the bytes are documented in CKRRegistrySerializer.h).
//
// The reader is written for hostile bytes: every count and length is
// checked against the bytes that remain before anything is allocated, so a
// value of n bytes never makes more than about n elements, and a value that
// ends early or has bytes left over is refused as a whole.
#pragma once

#include <krCoreLib/core/CKRString.h>

#include <cstddef>
#include <cstdint>
#include <vector>

class CKRRegistryArchiveWriter {
public:
  void Byte(std::uint8_t value) { m_Bytes.push_back(value); }
  void Word(std::uint16_t value);
  void DWord(std::uint32_t value);
  // An element count: false (nothing written) above 32 bits.
  bool Count(std::size_t count);
  // The UTF-16 marker, the length in UTF-16 code units, the code units.
  // False (nothing written) for a text of more than 2^32 - 2 code units.
  bool String(const CKRString& text);

  const std::vector<std::uint8_t>& Bytes() const { return m_Bytes; }

private:
  std::vector<std::uint8_t> m_Bytes;
};

class CKRRegistryArchiveReader {
public:
  CKRRegistryArchiveReader(const std::uint8_t* data, std::size_t size) : m_pAt(data), m_pEnd(data + size) {}

  bool Byte(std::uint8_t& value);
  bool Word(std::uint16_t& value);
  bool DWord(std::uint32_t& value);
  // An element count, refused when the elements cannot fit in the bytes
  // that remain at `elementBytes` (at least 1) bytes each.
  bool Count(std::size_t& count, std::size_t elementBytes);
  // A string with or without the UTF-16 marker (without it, one byte per
  // character, read as Latin-1).
  bool String(CKRString& text);
  // True when every byte has been read.
  bool AtEnd() const { return m_pAt == m_pEnd; }

private:
  std::size_t Remaining() const { return static_cast<std::size_t>(m_pEnd - m_pAt); }

  const std::uint8_t* m_pAt;
  const std::uint8_t* m_pEnd;
};

// Whole values: a counted list of strings, bytes or numbers. Decoding
// fails (the output untouched) unless the bytes hold exactly one such list.
struct SKRRegistryArchive {
  static std::vector<std::uint8_t> EncodeStrings(const std::vector<CKRString>& strings, bool& ok);
  static bool DecodeStrings(const std::vector<std::uint8_t>& bytes, std::vector<CKRString>& strings);

  template <typename T>
  static std::vector<std::uint8_t> EncodeNumbers(const std::vector<T>& numbers, bool& ok) {
    CKRRegistryArchiveWriter writer;
    ok = writer.Count(numbers.size());
    for (std::size_t i = 0; ok && i < numbers.size(); ++i)
      Put(writer, numbers[i]);
    return ok ? writer.Bytes() : std::vector<std::uint8_t>();
  }
  template <typename T>
  static bool DecodeNumbers(const std::vector<std::uint8_t>& bytes, std::vector<T>& numbers) {
    CKRRegistryArchiveReader reader(bytes.data(), bytes.size());
    std::size_t count = 0;
    if (!reader.Count(count, sizeof(T)))
      return false;
    std::vector<T> read(count);
    for (T& each : read)
      if (!Get(reader, each))
        return false;
    if (!reader.AtEnd())
      return false;
    numbers.swap(read);
    return true;
  }

private:
  static void Put(CKRRegistryArchiveWriter& writer, std::uint8_t value) { writer.Byte(value); }
  static void Put(CKRRegistryArchiveWriter& writer, std::uint16_t value) { writer.Word(value); }
  static void Put(CKRRegistryArchiveWriter& writer, std::uint32_t value) { writer.DWord(value); }
  static bool Get(CKRRegistryArchiveReader& reader, std::uint8_t& value) { return reader.Byte(value); }
  static bool Get(CKRRegistryArchiveReader& reader, std::uint16_t& value) { return reader.Word(value); }
  static bool Get(CKRRegistryArchiveReader& reader, std::uint32_t& value) { return reader.DWord(value); }
};

#include "KRRegistryArchive.h"

#include "core/KRUtf16.h"

#include <limits>
#include <string>

namespace {

// Markers of the archive format: a count of 0xFFFF or more is written as
// this escape word and a 32-bit count; a length byte of 0xFF announces a
// 16-bit length, a length word of 0xFFFF a 32-bit one, and a length word of
// 0xFFFE (after the 0xFF byte) says that the characters are UTF-16.
constexpr std::uint16_t kCountEscape = 0xFFFF;
constexpr std::uint8_t kLengthEscape = 0xFF;
constexpr std::uint16_t kWideMarker = 0xFFFE;
constexpr std::uint16_t kLongLength = 0xFFFF;
constexpr std::uint32_t kLongestLength = 0xFFFFFFFE;  // 0xFFFFFFFF escapes to 64 bits, never written

}  // namespace

void CKRRegistryArchiveWriter::Word(std::uint16_t value) {
  Byte(static_cast<std::uint8_t>(value & 0xFF));
  Byte(static_cast<std::uint8_t>(value >> 8));
}

void CKRRegistryArchiveWriter::DWord(std::uint32_t value) {
  Word(static_cast<std::uint16_t>(value & 0xFFFF));
  Word(static_cast<std::uint16_t>(value >> 16));
}

bool CKRRegistryArchiveWriter::Count(std::size_t count) {
  if (count > std::numeric_limits<std::uint32_t>::max())
    return false;
  if (count < kCountEscape) {
    Word(static_cast<std::uint16_t>(count));
  } else {
    Word(kCountEscape);
    DWord(static_cast<std::uint32_t>(count));
  }
  return true;
}

bool CKRRegistryArchiveWriter::String(const CKRString& text) {
  std::u16string units;
  SKRUtf16::Encode(text.str(), units);
  if (units.size() > kLongestLength)
    return false;
  const auto length = static_cast<std::uint32_t>(units.size());
  Byte(kLengthEscape);
  Word(kWideMarker);
  if (length < kLengthEscape) {
    Byte(static_cast<std::uint8_t>(length));
  } else if (length < kWideMarker) {
    Byte(kLengthEscape);
    Word(static_cast<std::uint16_t>(length));
  } else {
    Byte(kLengthEscape);
    Word(kLongLength);
    DWord(length);
  }
  m_Bytes.reserve(m_Bytes.size() + 2 * units.size());
  for (char16_t unit : units)
    Word(static_cast<std::uint16_t>(unit));
  return true;
}

bool CKRRegistryArchiveReader::Byte(std::uint8_t& value) {
  if (Remaining() < 1)
    return false;
  value = *m_pAt++;
  return true;
}

bool CKRRegistryArchiveReader::Word(std::uint16_t& value) {
  if (Remaining() < 2)
    return false;
  value = static_cast<std::uint16_t>(m_pAt[0] | (m_pAt[1] << 8));
  m_pAt += 2;
  return true;
}

bool CKRRegistryArchiveReader::DWord(std::uint32_t& value) {
  std::uint16_t low = 0;
  std::uint16_t high = 0;
  if (Remaining() < 4 || !Word(low) || !Word(high))
    return false;
  value = static_cast<std::uint32_t>(low) | (static_cast<std::uint32_t>(high) << 16);
  return true;
}

bool CKRRegistryArchiveReader::Count(std::size_t& count, std::size_t elementBytes) {
  std::uint16_t shortCount = 0;
  if (!Word(shortCount))
    return false;
  std::uint32_t value = shortCount;
  // A 64-bit count (after a 32-bit escape) cannot describe a registry
  // value: refused with the rest.
  if (shortCount == kCountEscape && (!DWord(value) || value == std::numeric_limits<std::uint32_t>::max()))
    return false;
  if (elementBytes == 0 || value > Remaining() / elementBytes)
    return false;
  count = value;
  return true;
}

bool CKRRegistryArchiveReader::String(CKRString& text) {
  bool wide = false;
  std::uint32_t length = 0;
  for (;;) {
    std::uint8_t shortLength = 0;
    if (!Byte(shortLength))
      return false;
    if (shortLength < kLengthEscape) {
      length = shortLength;
      break;
    }
    std::uint16_t word = 0;
    if (!Word(word))
      return false;
    if (word == kWideMarker) {
      // The marker comes once, before the length.
      if (wide)
        return false;
      wide = true;
      continue;
    }
    if (word < kLongLength) {
      length = word;
      break;
    }
    if (!DWord(length) || length > kLongestLength)
      return false;
    break;
  }
  const std::size_t unitBytes = wide ? 2 : 1;
  if (length > Remaining() / unitBytes)
    return false;
  std::wstring decoded;
  if (wide) {
    std::u16string units(length, u'\0');
    for (char16_t& unit : units) {
      std::uint16_t word = 0;
      Word(word);
      unit = static_cast<char16_t>(word);
    }
    SKRUtf16::Decode(units, decoded);
  } else {
    decoded.assign(m_pAt, m_pAt + length);
    m_pAt += length;
  }
  text = CKRString(std::move(decoded));
  return true;
}

std::vector<std::uint8_t> SKRRegistryArchive::EncodeStrings(const std::vector<CKRString>& strings, bool& ok) {
  CKRRegistryArchiveWriter writer;
  ok = writer.Count(strings.size());
  for (std::size_t i = 0; ok && i < strings.size(); ++i)
    ok = writer.String(strings[i]);
  return ok ? writer.Bytes() : std::vector<std::uint8_t>();
}

bool SKRRegistryArchive::DecodeStrings(const std::vector<std::uint8_t>& bytes, std::vector<CKRString>& strings) {
  CKRRegistryArchiveReader reader(bytes.data(), bytes.size());
  std::size_t count = 0;
  // The shortest string is its length byte.
  if (!reader.Count(count, 1))
    return false;
  std::vector<CKRString> read;
  read.reserve(count);
  for (std::size_t i = 0; i < count; ++i) {
    CKRString text;
    if (!reader.String(text))
      return false;
    read.push_back(std::move(text));
  }
  if (!reader.AtEnd())
    return false;
  strings.swap(read);
  return true;
}

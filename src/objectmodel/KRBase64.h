// Base64 with the URL-and-filename-safe alphabet (RFC 4648, section 5),
// shared by the GUID text forms.
#pragma once

#include <cstddef>
#include <cstdint>

// Value of every ASCII character in the alphabet below, -1 for the others.
struct SKRBase64Values {
  signed char m_Values[128];
  constexpr SKRBase64Values(const char* alphabet) : m_Values{} {
    for (auto& value : m_Values)
      value = -1;
    for (int i = 0; i < 64; ++i)
      m_Values[static_cast<unsigned char>(alphabet[i])] = static_cast<signed char>(i);
  }
};

struct SKRBase64 {
  static constexpr char kAlphabet[] = "ABCDEFGHIJKLMNOPQRSTUVWXYZabcdefghijklmnopqrstuvwxyz0123456789-_";
  // Characters after which encoding breaks the line (MIME's line length).
  static constexpr std::size_t kLineLength = 76;

  // Value 0..63 of an alphabet character, or -1.
  template <class Char>
  static int ValueOf(Char character) {
    const auto code = static_cast<std::uint32_t>(character);
    if (code >= 128)
      return -1;
    static constexpr SKRBase64Values kValues(kAlphabet);
    return kValues.m_Values[code];
  }

  // Encodes `size` bytes, calling put(char) for every output character:
  // three bytes give four characters, a final group of one or two bytes is
  // padded with "=", and CR LF follows every kLineLength characters.
  template <class Put>
  static void Encode(const unsigned char* data, std::size_t size, Put put) {
    std::size_t column = 0;
    auto emit = [&](char character) {
      if (column == kLineLength) {
        put('\r');
        put('\n');
        column = 0;
      }
      put(character);
      ++column;
    };
    for (std::size_t i = 0; i < size; i += 3) {
      const std::size_t count = size - i < 3 ? size - i : 3;
      std::uint32_t group = std::uint32_t(data[i]) << 16;
      if (count > 1)
        group |= std::uint32_t(data[i + 1]) << 8;
      if (count > 2)
        group |= data[i + 2];
      emit(kAlphabet[(group >> 18) & 63]);
      emit(kAlphabet[(group >> 12) & 63]);
      emit(count > 1 ? kAlphabet[(group >> 6) & 63] : '=');
      emit(count > 2 ? kAlphabet[group & 63] : '=');
    }
  }

  // Decodes up to `length` characters, calling put(unsigned char) for every
  // byte. Characters outside the alphabet are skipped; "=" ends the text; a
  // trailing partial group yields its whole bytes (two characters one byte,
  // three characters two bytes).
  template <class Char, class Put>
  static void Decode(const Char* text, std::size_t length, Put put) {
    std::uint32_t group = 0;
    int count = 0;
    for (std::size_t i = 0; i < length && text[i] != Char('='); ++i) {
      const int value = ValueOf(text[i]);
      if (value < 0)
        continue;
      group = (group << 6) | std::uint32_t(value);
      if (++count == 4) {
        put(static_cast<unsigned char>(group >> 16));
        put(static_cast<unsigned char>(group >> 8));
        put(static_cast<unsigned char>(group));
        group = 0;
        count = 0;
      }
    }
    if (count >= 2) {
      group <<= 6 * (4 - count);
      put(static_cast<unsigned char>(group >> 16));
      if (count == 3)
        put(static_cast<unsigned char>(group >> 8));
    }
  }
};

#include "KRUtf8.h"

static_assert(sizeof(wchar_t) == 4, "wide strings hold UTF-32 on this platform");

namespace {

constexpr wchar_t kReplacement = 0xFFFD;

bool InRange(unsigned char byte, unsigned char low, unsigned char high) {
  return byte >= low && byte <= high;
}

}  // namespace

void SKRUtf8::Decode(std::string_view text, std::wstring& out) {
  out.reserve(out.size() + text.size());
  const auto* p = reinterpret_cast<const unsigned char*>(text.data());
  const auto* const end = p + text.size();
  while (p < end) {
    const unsigned char lead = *p;
    if (lead < 0x80) {
      out += wchar_t(lead);
      ++p;
      continue;
    }
    // Sequence length and the permitted range of the second byte, which
    // excludes overlong forms, surrogates and values above U+10FFFF.
    int trail = 0;
    unsigned char low = 0x80, high = 0xBF;
    char32_t value = 0;
    if (InRange(lead, 0xC2, 0xDF)) {
      trail = 1;
      value = lead & 0x1F;
    } else if (InRange(lead, 0xE0, 0xEF)) {
      trail = 2;
      value = lead & 0x0F;
      if (lead == 0xE0)
        low = 0xA0;
      else if (lead == 0xED)
        high = 0x9F;
    } else if (InRange(lead, 0xF0, 0xF4)) {
      trail = 3;
      value = lead & 0x07;
      if (lead == 0xF0)
        low = 0x90;
      else if (lead == 0xF4)
        high = 0x8F;
    } else {
      out += kReplacement;
      ++p;
      continue;
    }
    ++p;
    bool complete = true;
    for (int i = 0; i < trail; ++i, low = 0x80, high = 0xBF) {
      if (p == end || !InRange(*p, low, high)) {
        complete = false;
        break;
      }
      value = (value << 6) | (*p++ & 0x3F);
    }
    out += complete ? wchar_t(value) : kReplacement;
  }
}

void SKRUtf8::Encode(std::wstring_view text, std::string& out) {
  out.reserve(out.size() + text.size());
  for (const wchar_t character : text) {
    char32_t value = static_cast<char32_t>(character);
    if ((value >= 0xD800 && value <= 0xDFFF) || value > 0x10FFFF)
      value = kReplacement;
    if (value < 0x80) {
      out += char(value);
    } else if (value < 0x800) {
      out += char(0xC0 | (value >> 6));
      out += char(0x80 | (value & 0x3F));
    } else if (value < 0x10000) {
      out += char(0xE0 | (value >> 12));
      out += char(0x80 | ((value >> 6) & 0x3F));
      out += char(0x80 | (value & 0x3F));
    } else {
      out += char(0xF0 | (value >> 18));
      out += char(0x80 | ((value >> 12) & 0x3F));
      out += char(0x80 | ((value >> 6) & 0x3F));
      out += char(0x80 | (value & 0x3F));
    }
  }
}

#include <krCoreLib/units/CKRTokenizer.h>

#include <cwchar>
#include <string>

CKRTokenizer::CKRTokenizer(const CKRString& text, const CKRString& delimiters)
    : m_Text(text), m_Delimiters(delimiters) {}

void CKRTokenizer::SetString(const CKRString& text) {
  m_Text = text;
  m_Position = 0;
}

void CKRTokenizer::SetDelimiters(const CKRString& delimiters) {
  m_Delimiters = delimiters;
}

bool CKRTokenizer::IsDelimiter(wchar_t character) const {
  return m_Delimiters.str().find(character) != std::wstring::npos;
}

bool CKRTokenizer::Next(CKRString& token) {
  token.Empty();
  const std::wstring& text = m_Text.str();
  const std::size_t position = std::size_t(m_Position);
  if (position >= text.size())
    return false;
  if (IsDelimiter(text[position])) {
    ++m_Position;
    return true;
  }
  std::size_t end = position;
  while (end < text.size() && !IsDelimiter(text[end]))
    ++end;
  token = CKRString(text.substr(position, end - position));
  m_Position = int(end < text.size() ? end + 1 : end);
  return true;
}

CKRString CKRTokenizer::Tail() const {
  return m_Text.Mid(m_Position);
}

CKRString CKRUrlEncode::Encode(const CKRString& text) {
  static constexpr wchar_t kHex[] = L"0123456789ABCDEF";
  std::wstring out;
  out.reserve(text.size());
  auto escape = [&](unsigned byte) {
    out += L'%';
    out += kHex[(byte >> 4) & 15];
    out += kHex[byte & 15];
  };
  for (const wchar_t character : text.str()) {
    const auto code = static_cast<std::uint32_t>(character);
    if (code <= 0xFF && CKRString::IsAlnum(character)) {
      out += character;
    } else if (CKRString::IsSpace(character)) {
      out += L'+';
    } else if (code <= 0xFF) {
      escape(code);
    } else {
      for (const char byte : CKRString::ToUtf8(&character, 1))
        escape(static_cast<unsigned char>(byte));
    }
  }
  return CKRString(std::move(out));
}

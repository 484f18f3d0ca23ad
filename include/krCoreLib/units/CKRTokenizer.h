// CKRTokenizer and CKRUrlEncode: splitting texts at delimiter characters,
// and encoding texts for URLs.
#pragma once

#include <krCoreLib/core/CKRString.h>

// Splits a text into fields at any of the delimiter characters. Consecutive
// delimiters give empty fields: "1,,3" gives "1", "" and "3". A tokenizer
// holds its own copy of the text; distinct tokenizers may be used on
// different threads.
class KRCORELIB_API CKRTokenizer {
public:
  CKRTokenizer() = default;
  CKRTokenizer(const CKRString& text, const CKRString& delimiters);

  // A new text, read from its start.
  void SetString(const CKRString& text);
  void SetDelimiters(const CKRString& delimiters);

  // The next field: true with the field (possibly empty), or false with an
  // empty token at the end of the text.
  bool Next(CKRString& token);
  // The text from the current position to the end.
  CKRString Tail() const;

private:
  bool IsDelimiter(wchar_t character) const;

  CKRString m_Text;
  int m_Position = 0;
  CKRString m_Delimiters;
};

struct KRCORELIB_API CKRUrlEncode {
  // Letters and digits are copied, white space becomes "+", every other
  // character up to U+00FF becomes "%" and two upper-case hex digits of its
  // code, and a character beyond U+00FF becomes its UTF-8 bytes, each
  // written that way ("a b/c" gives "a+b%2Fc", "€" gives "%E2%82%AC").
  static CKRString Encode(const CKRString& text);
};

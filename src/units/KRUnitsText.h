// Helpers shared by the text forms of the engineering values.
#pragma once

#include <krCoreLib/core/CKRString.h>
#include <krCoreLib/units/CKRTokenizer.h>

#include <vector>

struct SKRUnitsText {
  // The comma-separated fields of a text trimmed of blanks at both ends;
  // empty fields are kept ("1,,3" has three fields).
  static std::vector<CKRString> SplitFields(const CKRString& text, const wchar_t* delimiters = L",") {
    CKRString trimmed = text;
    trimmed.Trim();
    CKRTokenizer tokenizer(trimmed, delimiters);
    std::vector<CKRString> fields;
    for (CKRString field; tokenizer.Next(field);)
      fields.push_back(field);
    return fields;
  }
};

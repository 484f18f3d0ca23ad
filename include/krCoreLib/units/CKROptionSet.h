// _Option and CKROptionSet: a list of selectable options, in insertion
// order. Text form: the options joined with "#", each "text,data,selected"
// ("a,1,1#b,2,0"). Texts containing "," or "#" do not survive the text form.
#pragma once

#include <krCoreLib/core/CKRString.h>

#include <cstddef>
#include <vector>

struct KRCORELIB_API _Option {
  CKRString m_Text;
  // An application value; the text form writes it as a 32-bit integer.
  void* m_pData = nullptr;
  bool m_Selected = false;

  // Equal when data, selected and text are.
  bool operator==(const _Option& other) const;
  // Ordered by text, then data, then selected.
  bool operator<(const _Option& other) const;
};

class KRCORELIB_API CKROptionSet {
public:
  void AddOption(const CKRString& text, void* data, bool selected);
  void ClearOptions();
  int Size() const { return static_cast<int>(m_Options.size()); }
  // The option at `index`, or null outside 0 to Size()-1.
  _Option* GetOption(int index);

  // Walks the options (from the first with `restart`): the next option, or
  // null at the end.
  _Option* GetNextOption(bool restart);
  // The same over the selected options only: false at the end.
  bool GetNextSelected(CKRString& text, void*& data, bool restart);

  void SelectAll(bool selected);
  void SortOptions();

  CKRString GetStringValue() const;
  // Replaces the options with those of the text: each "#"-separated part
  // "text,data,selected" adds an option (selected when the third field is
  // exactly "1"); parts of fewer than three fields add nothing. Returns 1.
  int SetValueFromString(const CKRString& text);

  // Equal when both hold equal options in the same order.
  bool operator==(const CKROptionSet& other) const { return m_Options == other.m_Options; }

private:
  std::vector<_Option> m_Options;
  std::size_t m_Position = 0;  // of GetNextOption and GetNextSelected
};

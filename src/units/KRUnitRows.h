// The rows of the unit table, shared by the evaluator and its accessors.
#pragma once

#include <atomic>

struct SKRUnitRow {
  const wchar_t* m_pName;
  std::atomic<double> m_Factor;
  // The base dimension index, or -1 when m_pDefinition gives the value.
  int m_Base;
  const wchar_t* m_pDefinition;
};

inline constexpr int kUnitRowCount = 129;

extern SKRUnitRow g_UnitRows[kUnitRowCount];

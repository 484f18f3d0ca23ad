// CKRBOOL: the result of archive operations, a truth value with an optional
// message text (empty unless given).
#pragma once

#include <krCoreLib/core/CKRString.h>

class KRCORELIB_API CKRBOOL {
public:
  CKRBOOL() = default;
  CKRBOOL(int value) : m_Value(value != 0) {}
  CKRBOOL(bool value) : m_Value(value) {}
  CKRBOOL(int value, CKRString message) : m_Value(value != 0), m_Message(std::move(message)) {}
  CKRBOOL(bool value, CKRString message) : m_Value(value), m_Message(std::move(message)) {}

  operator int() const { return m_Value ? 1 : 0; }
  operator bool() const { return m_Value; }
  CKRBOOL& operator=(bool value) {
    m_Value = value;
    return *this;
  }
  CKRBOOL& operator=(int value) {
    m_Value = value != 0;
    return *this;
  }
  // Values compare; messages do not.
  bool operator==(const CKRBOOL& other) const { return m_Value == other.m_Value; }
  bool operator==(bool value) const { return m_Value == value; }
  bool operator==(int value) const { return (m_Value ? 1 : 0) == value; }

  const CKRString& GetMessage() const { return m_Message; }
  void SetMessage(CKRString message) { m_Message = std::move(message); }

private:
  bool m_Value = false;
  CKRString m_Message;
};

// Number helpers shared by the library's text forms.
#pragma once

#include <limits>

struct SKRNumbers {
  // Rounds to single precision; values beyond its range become infinities
  // (as the hardware rounds them) instead of the undefined behaviour of a
  // plain conversion. NaN stays NaN.
  static float ToFloat(double value) {
    constexpr double kMax = std::numeric_limits<float>::max();
    if (value > kMax)
      return std::numeric_limits<float>::infinity();
    if (value < -kMax)
      return -std::numeric_limits<float>::infinity();
    return static_cast<float>(value);
  }
};

// The seed of a test program's random sweeps: random per run, printed once,
// and settable with the environment variable KR_TEST_SEED to replay a run.
#pragma once

#include <cstdio>
#include <cstdlib>
#include <random>

inline unsigned KRTestSeed() {
  static const unsigned seed = [] {
    const char* text = std::getenv("KR_TEST_SEED");
    const unsigned value = text != nullptr ? unsigned(std::strtoul(text, nullptr, 10)) : std::random_device()();
    std::printf("random sweeps: KR_TEST_SEED=%u\n", value);
    return value;
  }();
  return seed;
}

#include <krCoreLib/core/CKRDebugOutput.h>

#include <gtest/gtest.h>

#include <algorithm>
#include <atomic>
#include <cstdint>
#include <cstdio>
#include <latch>
#include <string>
#include <thread>
#include <unistd.h>
#include <vector>

namespace {

using Texts = std::vector<std::wstring>;

struct SRecorder {
  Texts texts;
  // Handlers currently running; the channel promises one text at a time.
  std::atomic<int> inside{0};
  std::atomic<bool> overlapped{false};
};

void Record(const wchar_t* text, void* context) {
  auto* recorder = static_cast<SRecorder*>(context);
  if (recorder->inside.fetch_add(1) != 0)
    recorder->overlapped = true;
  recorder->texts.emplace_back(text);
  recorder->inside.fetch_sub(1);
}

}  // namespace

TEST(CKRDebugOutput, SetHandlerSwitchesOutputAndReturnsThePreviousHandler) {
  // No test leaves a handler installed, so this is the start-up state.
  EXPECT_FALSE(CKRDebugOutput::IsEnabled());
  SRecorder first, second;
  EXPECT_EQ(CKRDebugOutput::SetHandler(&Record, &first), nullptr);
  EXPECT_TRUE(CKRDebugOutput::IsEnabled());
  CKRDebugOutput::Write(L"Gr\u00FC\u00DFe \U0001D11E\n");
  CKRDebugOutput::Write(nullptr);
  // Printf formats in the library's dialect, however long the text.
  const std::wstring wide(2000, L'w');
  CKRDebugOutput::Printf(L"<%s|%hs|%I64d>", wide.c_str(), "n", std::int64_t(1) << 40);
  EXPECT_EQ(CKRDebugOutput::SetHandler(&Record, &second), &Record);
  CKRDebugOutput::Write(L"two");
  EXPECT_EQ(CKRDebugOutput::SetHandler(nullptr), &Record);
  EXPECT_FALSE(CKRDebugOutput::IsEnabled());
  CKRDebugOutput::Write(L"three");
  CKRDebugOutput::Printf(L"%s", L"four");

  EXPECT_EQ(first.texts, Texts({L"Gr\u00FC\u00DFe \U0001D11E\n", L"<" + wide + L"|n|1099511627776>"}));
  EXPECT_EQ(second.texts, Texts({L"two"}));
}

TEST(CKRDebugOutput, ConcurrentWritesArriveWholeOneAtATime) {
  constexpr int kThreads = 4, kTexts = 500;
  SRecorder recorder;
  CKRDebugOutput::SetHandler(&Record, &recorder);
  std::latch start(kThreads);
  {
    std::vector<std::jthread> threads;
    for (int t = 0; t < kThreads; ++t)
      threads.emplace_back([&start, t] {
        start.arrive_and_wait();
        for (int i = 0; i < kTexts; ++i)
          CKRDebugOutput::Printf(L"thread %d text %d", t, i);
      });
  }
  CKRDebugOutput::SetHandler(nullptr);
  EXPECT_FALSE(recorder.overlapped.load()) << "the handler ran for two texts at once";
  Texts expected;
  for (int t = 0; t < kThreads; ++t)
    for (int i = 0; i < kTexts; ++i)
      expected.push_back(CKRString::Formatted(L"thread %d text %d", t, i).str());
  Texts received = recorder.texts;
  std::sort(expected.begin(), expected.end());
  std::sort(received.begin(), received.end());
  EXPECT_EQ(received, expected);
}

TEST(CKRDebugOutput, StandardErrorWritesUtf8) {
  // Point the standard error descriptor at a temporary file for the call.
  std::FILE* capture = std::tmpfile();
  ASSERT_NE(capture, nullptr);
  std::fflush(stderr);
  const int saved = ::dup(STDERR_FILENO);
  ASSERT_GE(::dup2(::fileno(capture), STDERR_FILENO), 0);
  CKRDebugOutput::SetHandler(&CKRDebugOutput::StandardError);
  CKRDebugOutput::Write(L"Gr\u00FC\u00DFe \u20AC\n");
  CKRDebugOutput::SetHandler(nullptr);
  std::fflush(stderr);
  ::dup2(saved, STDERR_FILENO);
  ::close(saved);
  std::rewind(capture);
  char buffer[64] = {};
  const std::size_t length = std::fread(buffer, 1, sizeof buffer, capture);
  std::fclose(capture);
  EXPECT_EQ(std::string(buffer, length), "Gr\xC3\xBC\xC3\x9F" "e \xE2\x82\xAC\n");
}

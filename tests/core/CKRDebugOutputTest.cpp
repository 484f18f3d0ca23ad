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

struct SRecorder {
  std::vector<std::wstring> texts;
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

// A second handler, distinguishable from Record by its address.
void RecordTagged(const wchar_t* text, void* context) {
  static_cast<SRecorder*>(context)->texts.push_back(L"tagged:" + std::wstring(text));
}

// Installs a handler for the duration of a test and restores the previous
// one afterwards, whatever the test does in between.
class CHandlerScope {
public:
  explicit CHandlerScope(CKRDebugOutput::Handler handler, void* context = nullptr)
      : m_Previous(CKRDebugOutput::SetHandler(handler, context)) {}
  ~CHandlerScope() { CKRDebugOutput::SetHandler(m_Previous); }
  CHandlerScope(const CHandlerScope&) = delete;
  CHandlerScope& operator=(const CHandlerScope&) = delete;

private:
  CKRDebugOutput::Handler m_Previous;
};

using Texts = std::vector<std::wstring>;

}  // namespace

TEST(CKRDebugOutput, SetHandlerSwitchesOutputAndReturnsThePreviousHandler) {
  // No test leaves a handler installed, so this is the start-up state.
  EXPECT_FALSE(CKRDebugOutput::IsEnabled());

  CHandlerScope scope(nullptr);
  SRecorder first, second;
  EXPECT_EQ(CKRDebugOutput::SetHandler(&Record, &first), nullptr);
  EXPECT_TRUE(CKRDebugOutput::IsEnabled());
  CKRDebugOutput::Write(L"one");

  EXPECT_EQ(CKRDebugOutput::SetHandler(&RecordTagged, &second), &Record);
  CKRDebugOutput::Write(L"two");

  EXPECT_EQ(CKRDebugOutput::SetHandler(nullptr), &RecordTagged);
  EXPECT_FALSE(CKRDebugOutput::IsEnabled());
  CKRDebugOutput::Write(L"three");
  CKRDebugOutput::Printf(L"%s", L"four");

  EXPECT_EQ(first.texts, Texts({L"one"}));
  EXPECT_EQ(second.texts, Texts({L"tagged:two"}));
}

TEST(CKRDebugOutput, WriteHandsTextToTheHandler) {
  SRecorder recorder;
  CHandlerScope scope(&Record, &recorder);
  CKRDebugOutput::Write(L"Gr\u00FC\u00DFe \U0001D11E\n");
  CKRDebugOutput::Write(nullptr);
  CKRDebugOutput::Write(L"");
  EXPECT_EQ(recorder.texts, Texts({L"Gr\u00FC\u00DFe \U0001D11E\n", L""}));
}

TEST(CKRDebugOutput, PrintfFormatsInTheStringDialect) {
  SRecorder recorder;
  CHandlerScope scope(&Record, &recorder);
  CKRDebugOutput::Printf(L"Warning! %d instances of class %s were not released\n", 2, L"CKRShape");
  CKRDebugOutput::Printf(L"%hs=%c %I64d", "key", L'v', std::int64_t(1) << 40);
  const std::wstring wide(2000, L'w');
  CKRDebugOutput::Printf(L"<%s>", wide.c_str());
  EXPECT_EQ(recorder.texts, Texts({L"Warning! 2 instances of class CKRShape were not released\n",
                                   L"key=v 1099511627776", L"<" + wide + L">"}));
}

TEST(CKRDebugOutput, ConcurrentWritesArriveWholeOneAtATime) {
  constexpr int kThreads = 4;
  constexpr int kTexts = 500;
  SRecorder recorder;
  CHandlerScope scope(&Record, &recorder);
  std::latch start(kThreads);
  {
    std::vector<std::jthread> threads;
    for (int t = 0; t < kThreads; ++t)
      threads.emplace_back([&start, t] {
        start.arrive_and_wait();
        for (int i = 0; i < kTexts; ++i) {
          if (i % 2 == 0)
            CKRDebugOutput::Printf(L"thread %d text %d", t, i);
          else
            CKRDebugOutput::Write(CKRString::Formatted(L"thread %d text %d", t, i).GetString());
        }
      });
  }
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
  ASSERT_GE(saved, 0);
  ASSERT_GE(::dup2(::fileno(capture), STDERR_FILENO), 0);
  {
    CHandlerScope scope(&CKRDebugOutput::StandardError);
    CKRDebugOutput::Write(L"Gr\u00FC\u00DFe \u20AC\n");
  }
  std::fflush(stderr);
  ::dup2(saved, STDERR_FILENO);
  ::close(saved);

  std::rewind(capture);
  std::string written;
  char buffer[256];
  for (std::size_t n; (n = std::fread(buffer, 1, sizeof buffer, capture)) > 0;)
    written.append(buffer, n);
  std::fclose(capture);
  EXPECT_EQ(written, "Gr\xC3\xBC\xC3\x9F" "e \xE2\x82\xAC\n");
}

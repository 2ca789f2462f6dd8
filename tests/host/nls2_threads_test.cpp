// One locale, used by many threads.

#include <gtest/gtest.h>

#include <thread>
#include <vector>

#include "tests/host/code_page.h"

namespace {

TEST(LocaleThreads, ConvertWithOneHandleAtTheSameTime) {
  const struct {
    int32_t id;
    std::string bytes;
  } kCases[] = {{NLS2_CP932, "\x93\xFA\x96\x7B"}, {NLS2_CP_EUCJP, "\xC6\xFC\xCB\xDC"}, {NLS2_CP_UTF8, "日本"}};
  for (const auto& each : kCases) {
    const Locale locale = byCodePage(each.id);
    std::vector<std::thread> threads;
    for (int i = 0; i < 4; ++i) {
      threads.emplace_back([&] {
        for (int round = 0; round < 300; ++round) {
          EXPECT_EQ(toUnits(locale.get(), each.bytes + "x"), (Units{u"\u65E5\u672Cx", 0}));
          EXPECT_EQ(fromUnits(locale.get(), u"\u65E5\u672C"), (Bytes{each.bytes, 0}));
          // Leaves a conversion in the middle of a character, which must not show in the next one.
          EXPECT_EQ(toUnits(locale.get(), each.bytes.substr(0, 1)).text.size(), 1u);
        }
      });
    }
    for (std::thread& thread : threads) thread.join();
  }
}

}  // namespace

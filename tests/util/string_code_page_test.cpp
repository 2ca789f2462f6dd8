// Which locale is asked for, and when. This program brings its own code-page service in place of the host's: one that
// records its calls and can be in any code page.
#include <gtest/gtest.h>

#include <algorithm>
#include <cstdlib>
#include <deque>
#include <string>
#include <vector>

#include "nls2.h"
#include "test_seam.h"
#include "util/string.h"

struct NLS2_Locale {
  int32_t codePage;
};

namespace {

struct Service {
  int32_t current = NLS2_CP_UTF8;  // 0: there is no locale
  std::vector<std::string> calls;
};

/// Handles live for ever: what is released, and what is not, shows in the calls.
NLS2_Locale* newLocale(int32_t codePage) {
  static std::deque<NLS2_Locale>& locales = *new std::deque<NLS2_Locale>;
  // cppcheck-suppress returnDanglingLifetime ; it lives in the queue
  return &locales.emplace_back(NLS2_Locale{codePage});
}

Service& service() {
  static Service& instance = *new Service;
  return instance;
}

void record(const std::string& call) {
  service().calls.push_back(call);
}

}  // namespace

NLS2_Locale* NLS2_GetLocale(uint32_t selector, int32_t codePage) {
  if (selector == NLS2_CURRENT_LOCALE) {
    record("get current");
    return service().current == 0 ? nullptr : newLocale(service().current);
  }
  record("get " + std::to_string(selector) + " " + std::to_string(codePage));
  return newLocale(codePage);
}

void NLS2_ReleaseLocale(NLS2_Locale* locale) {
  record("release " + std::to_string(locale->codePage));
}

int32_t NLS2_GetLocaleCodepageId(const NLS2_Locale* locale) {
  return locale->codePage;
}

uint32_t NLS2_toUTF16(NLS2_Locale*, const char* bytes, uint32_t byteCount, unsigned short* units, uint32_t unitCapacity,
                      int32_t* status) {
  record("to " + std::to_string(byteCount) + " " + std::to_string(unitCapacity));
  const uint32_t count = std::min(byteCount, unitCapacity);
  std::copy_n(bytes, count, units);
  *status = 0;
  return count;
}

uint32_t NLS2_fromUTF16(NLS2_Locale*, const unsigned short* units, uint32_t unitCount, char* bytes,
                        uint32_t byteCapacity, int32_t* status) {
  record("from " + std::to_string(unitCount) + " " + std::to_string(byteCapacity));
  const uint32_t count = std::min(unitCount, byteCapacity);
  std::transform(units, units + count, bytes, [](unsigned short unit) { return static_cast<char>(unit); });
  *status = 0;
  return count;
}

uint32_t NLS2_MaximumBytesPerUnit(const NLS2_Locale*) {
  return 1;
}

namespace {

using VMQ::String;
using Texts = std::vector<std::string>;

constexpr const char* BY_CODE_PAGE = "25690123";  // 0x0188000B

class StringCodePage : public testing::Test {
 protected:
  StringCodePage() { leaveNoLocale(); }
  ~StringCodePage() override { leaveNoLocale(); }

  /// As before the first conversion, but for the knowledge that there was one.
  void leaveNoLocale() {
    service().current = 0;
    String::initialize();
    service() = Service();
  }
  Texts initializeIn(int32_t codePage) {
    service().current = codePage;
    const TEST_TraceCapture trace;
    EXPECT_EQ(String::initialize(), codePage != 0);
    return trace.texts(RAS1_DETAIL);
  }
};

TEST_F(StringCodePage, CurrentLocaleIsTakenAsItIs) {
  EXPECT_EQ(initializeIn(NLS2_CP_LATIN1), (Texts{"codepage=819"}));
  EXPECT_EQ(service().calls, (Texts{"get current"}));
  EXPECT_EQ(VMQ::glbLocale->codePage, NLS2_CP_LATIN1);
}

// The handles of the locales that are replaced are never released: a leak of one, once.
TEST_F(StringCodePage, CodePage943IsReplacedBy932) {
  EXPECT_EQ(initializeIn(943), (Texts{"codepage=943", "codepage NLS2_CP943 detected, switching to NLS2_CP932"}));
  EXPECT_EQ(service().calls, (Texts{"get current", std::string("get ") + BY_CODE_PAGE + " 932"}));
  EXPECT_EQ(VMQ::glbLocale->codePage, 932);
}

TEST_F(StringCodePage, CodePage33722IsReplacedByUtf8) {
  EXPECT_EQ(initializeIn(33722), (Texts{"codepage=33722", "codepage 33722 detected, switching to 1208"}));
  EXPECT_EQ(service().calls, (Texts{"get current", std::string("get ") + BY_CODE_PAGE + " 1208"}));
  EXPECT_EQ(VMQ::glbLocale->codePage, 1208);
}

TEST_F(StringCodePage, LocaleBeforeIsReleased) {
  initializeIn(NLS2_CP_LATIN1);
  initializeIn(NLS2_CP_UTF8);
  EXPECT_EQ(service().calls, (Texts{"get current", "release 819", "get current"}));
}

TEST_F(StringCodePage, WithoutALocaleInitializeSaysSo) {
  EXPECT_EQ(initializeIn(0), (Texts{"codepage=0"}));
  EXPECT_EQ(VMQ::glbLocale, nullptr);
}

TEST_F(StringCodePage, NarrowTextIsConvertedWithItsTerminatorAndOneUnitForEachByte) {
  initializeIn(NLS2_CP_UTF8);
  service().calls.clear();
  const String text("abc");
  EXPECT_EQ(text.length(), 3u);
  EXPECT_NE(std::find(service().calls.begin(), service().calls.end(), "to 4 4"), service().calls.end());
}

TEST_F(StringCodePage, NarrowCopyHasOneByteForEachUnitAndTheTerminator) {
  initializeIn(NLS2_CP_UTF8);
  const String text("abc");
  service().calls.clear();
  EXPECT_STREQ(text.c_str().get(), "abc");
  EXPECT_NE(std::find(service().calls.begin(), service().calls.end(), "from 4 4"), service().calls.end());
}

/// Ends the process with 0 when all is as expected, else with the number of the step that was not.
[[noreturn]] void convertInAProcessThatHasConvertedNothing() {
  service() = Service();
  service().current = 0;
  if (VMQ::glbLocale != nullptr) std::_Exit(1);
  (void)String("a");  // finds no locale
  if (service().calls.front() != "get current" || VMQ::glbLocale != nullptr) std::_Exit(2);

  service().current = NLS2_CP_UTF8;
  service().calls.clear();
  const String text("b");  // looks for one again
  if (service().calls != Texts{"get current", "to 2 2"}) std::_Exit(3);

  service().calls.clear();
  (void)text.c_str();
  (void)String("c");
  std::_Exit(service().calls == Texts{"from 2 2", "to 2 2"} ? 0 : 4);  // and keeps it
}

[[noreturn]] void initializeBeforeTheFirstConversion() {
  String::initialize();
  service().calls.clear();
  (void)String("a");
  std::_Exit(service().calls == Texts{"release 1208", "get current", "to 2 2"} ? 0 : 1);
}

TEST(StringFirstConversionTest, MakesTheChoiceEvenWhenItWasMadeBefore) {
  GTEST_FLAG_SET(death_test_style, "threadsafe");
  EXPECT_EXIT(initializeBeforeTheFirstConversion(), testing::ExitedWithCode(0), "");
}

TEST(StringFirstConversionTest, ChoosesTheLocaleOnceAndAgainOnlyWhenThatFailed) {
  // Starts this program again, for this test alone.
  GTEST_FLAG_SET(death_test_style, "threadsafe");
  EXPECT_EXIT(convertInAProcessThatHasConvertedNothing(), testing::ExitedWithCode(0), "");
}

}  // namespace

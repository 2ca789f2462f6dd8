// Text and rows as JSON.

#include "apps/vmqd/json_text.h"

#include <gmock/gmock.h>

#include <cstring>
#include <random>
#include <string>

#include "apps/vmqd/json_rows.h"
#include "tests/support/json.h"

namespace vmqd {
namespace {

using namespace std::string_literals;

std::string asJson(const std::string& text) {
  std::string out;
  appendJsonString(out, text);
  return out;
}

struct Text {
  std::string text;
  std::string json;
};

const Text texts[] = {Text{"", R"("")"},                                             //
                      Text{"plain text", R"("plain text")"},                         //
                      Text{R"(a"b\c/)", R"("a\"b\\c/")"},                            //
                      Text{"a\nb\rc\td", R"("a\nb\rc\td")"},                         //
                      Text{"\x01\x1f\x7f", "\"\\u0001\\u001f\x7f\""},                //
                      Text{"a\0b"s, R"("a\u0000b")"},                                //
                      Text{"\u00e9\u20ac\U0001F600", "\"\u00e9\u20ac\U0001F600\""},  //
                      Text{"\xff", "\"\uFFFD\""},                                    //
                      Text{"a\x80z", "\"a\uFFFDz\""},                                //
                      Text{"cut \xe2\x82", "\"cut \uFFFD\uFFFD\""},                  //
                      Text{"\xc3(", "\"\uFFFD(\""}};

TEST(JsonTexts, AreEscaped) {
  for (const auto& each : texts) {
    EXPECT_EQ(each.json, asJson(each.text));
  }
}

struct Bytes {
  std::string bytes;
  size_t length;
};

const Bytes characters[] = {Bytes{"", 0},
                            Bytes{"a", 1},
                            Bytes{"\0"s, 1},  //
                            Bytes{"\xc2\x80", 2},
                            Bytes{"\xdf\xbf", 2},  //
                            Bytes{"\xe0\xa0\x80", 3},
                            Bytes{"\xed\x9f\xbf", 3},  //
                            Bytes{"\xef\xbf\xbf", 3},
                            Bytes{"\xf0\x90\x80\x80", 4},  //
                            Bytes{"\xf4\x8f\xbf\xbf", 4},  //
                            Bytes{"\x80", 0},
                            Bytes{"\xc0\x80", 0},
                            Bytes{"\xc1\xbf", 0},  // too long
                            Bytes{"\xe0\x9f\xbf", 0},
                            Bytes{"\xf0\x8f\xbf\xbf", 0},  //
                            Bytes{"\xed\xa0\x80", 0},      // a surrogate
                            Bytes{"\xf4\x90\x80\x80", 0},
                            Bytes{"\xf5\x80\x80\x80", 0},  // too high
                            Bytes{"\xfe", 0},
                            Bytes{"\xc3", 0},
                            Bytes{"\xe2\x82", 0},  // cut
                            Bytes{"\xf0\x9f\x98", 0},
                            Bytes{"\xc3\x28", 0},
                            Bytes{"\xe2\x82\x28", 0}};

TEST(Utf8Characters, AreToldFromOtherBytes) {
  for (const auto& each : characters) {
    EXPECT_EQ(each.length, utf8CharacterBytes(each.bytes)) << ::testing::PrintToString(each.bytes);
  }
}

TEST(JsonText, IsValidWhateverTheBytesAre) {
  const unsigned seed = std::random_device{}();
  SCOPED_TRACE(seed);
  std::mt19937 random(seed);
  for (int round = 0; round < 2000; ++round) {
    std::string text(random() % 40, '\0');
    for (char& c : text) c = static_cast<char>(random() % 3 == 0 ? random() % 128 : random() % 256);
    const nlohmann::json read = parsedJson(asJson(text));
    if (isUtf8(text)) {
      EXPECT_EQ(text, read.get<std::string>());
    }
  }
}

TEST(JsonNumbers, AreDecimal) {
  std::string out;
  for (const long long number : {0LL, -1LL, 2147483647LL, -2147483648LL, 9223372036854775807LL}) {
    appendJsonNumber(out, number);
    out += ' ';
  }
  EXPECT_EQ("0 -1 2147483647 -2147483648 9223372036854775807 ", out);
}

vmqhost::TableDescription twoColumns() {
  return {
      "APP", "TWO", {{"TEXT", {"text", 0, 20, COLUMN_CHARACTER}}, {"NUMBER", {"number", 20, 4, COLUMN_INTEGER}}}, 24};
}

std::string rowAsJson(const std::string& text, int32_t number) {
  std::string row = text;
  row.append(reinterpret_cast<const char*>(&number), sizeof number);
  std::string out;
  JsonRowWriter(twoColumns()).append(out, row.data());
  return out;
}

TEST(JsonRows, HaveEveryColumn) {
  EXPECT_EQ(R"({"TEXT":"some \"text\"","NUMBER":-5})", rowAsJson("some \"text\"         ", -5));
}

TEST(JsonRows, LoseThePaddingOnly) {
  EXPECT_EQ(R"({"TEXT":"","NUMBER":0})", rowAsJson(std::string(20, ' '), 0));
  EXPECT_EQ(R"({"TEXT":"","NUMBER":0})", rowAsJson(std::string(20, '\0'), 0));
  EXPECT_EQ(R"({"TEXT":"  a","NUMBER":0})", rowAsJson("  a \0 \0\0\0\0\0\0\0\0\0\0\0\0\0"s, 0));
  EXPECT_EQ(R"({"TEXT":"a b","NUMBER":0})", rowAsJson("a b" + std::string(17, ' '), 0));
  EXPECT_EQ(R"({"TEXT":"12345678901234567890","NUMBER":0})", rowAsJson("12345678901234567890", 0));
}

TEST(JsonRows, OfATableWithoutColumnsAreEmptyObjects) {
  std::string out;
  JsonRowWriter({"APP", "NONE", {}, 0}).append(out, "");
  EXPECT_EQ("{}", out);
}

TEST(PaddingOfAColumn, IsFoundAtEveryLength) {
  for (size_t width = 0; width < 40; ++width) {
    for (size_t length = 0; length <= width; ++length) {
      const std::string text(length, 'x');
      EXPECT_EQ(length, unpaddedBytes((text + std::string(width - length, ' ')).data(), width));
      EXPECT_EQ(length, unpaddedBytes((text + std::string(width - length, '\0')).data(), width));
    }
  }
}

}  // namespace
}  // namespace vmqd

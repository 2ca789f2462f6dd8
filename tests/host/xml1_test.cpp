// The push parser: what its handlers hear, and how it fails.

#include "xml1.h"

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <cstring>
#include <stdexcept>
#include <string>
#include <vector>

#include "tests/support/temporary_directory.h"

namespace {

using testing::ElementsAre;

/// A parser that writes down what it tells.
class Parser {
 public:
  explicit Parser(const char* encoding = nullptr) : parser_(XML1_ParserCreate(encoding)) {
    XML1_SetUserData(parser_, this);
    XML1_SetElementHandler(parser_, onStart, onEnd);
    XML1_SetCharacterDataHandler(parser_, onCharacters);
  }
  ~Parser() { XML1_ParserFree(parser_); }
  Parser(const Parser&) = delete;
  Parser& operator=(const Parser&) = delete;

  int parse(const std::string& text, bool final = true) {
    const int length = static_cast<int>(text.size());
    void* const buffer = XML1_GetBuffer(parser_, length);
    EXPECT_NE(buffer, nullptr);
    std::memcpy(buffer, text.data(), text.size());
    return XML1_ParseBuffer(parser_, length, final);
  }

  /// "<name key=value", ">name" and texts, with neighbouring texts joined.
  std::vector<std::string> events;
  /// The event at which the handler throws.
  std::string throw_at;

  [[nodiscard]] XML1_Parser* get() const { return parser_; }
  [[nodiscard]] int error() const { return XML1_GetErrorCode(parser_); }

 private:
  void record(const std::string& event) {
    if (event == throw_at) throw std::runtime_error(event);
    events.push_back(event);
  }

  static void onStart(void* self, const char* name, const char** attributes) {
    std::string event = std::string("<") + name;
    for (; *attributes != nullptr; attributes += 2) event += std::string(" ") + attributes[0] + "=" + attributes[1];
    static_cast<Parser*>(self)->last_was_text_ = false;
    static_cast<Parser*>(self)->record(event);
  }
  static void onEnd(void* self, const char* name) {
    static_cast<Parser*>(self)->last_was_text_ = false;
    static_cast<Parser*>(self)->record(std::string(">") + name);
  }
  static void onCharacters(void* self, const char* characters, int length) {
    Parser& parser = *static_cast<Parser*>(self);
    const std::string text(characters, static_cast<size_t>(length));
    if (parser.last_was_text_) {
      parser.events.back() += text;
      return;
    }
    parser.record(text);
    parser.last_was_text_ = true;
  }

  XML1_Parser* const parser_;
  bool last_was_text_ = false;
};

std::string nested(int depth) {
  std::string text;
  for (int i = 0; i < depth; ++i) text += "<e>";
  for (int i = 0; i < depth; ++i) text += "</e>";
  return text;
}

TEST(XmlParser, TellsElementsAttributesAndTextInOrder) {
  Parser parser;
  EXPECT_EQ(parser.parse("<runas><agent code='ux' user=\"root\">x&amp;y</agent><i/></runas>"), 1);
  EXPECT_THAT(parser.events, ElementsAre("<runas", "<agent code=ux user=root", "x&y", ">agent", "<i", ">i", ">runas"));
  EXPECT_EQ(parser.error(), 0);
}

TEST(XmlParser, TakesADocumentInPiecesOfOneByte) {
  Parser parser;
  const std::string text = "<a b='1'>t\xC3\xA4xt<c/></a>";
  for (const char byte : text) EXPECT_EQ(parser.parse(std::string(1, byte), /*final=*/false), 1);
  EXPECT_EQ(parser.parse("", /*final=*/true), 1);
  EXPECT_THAT(parser.events, ElementsAre("<a b=1", "t\xC3\xA4xt", "<c", ">c", ">a"));
}

TEST(XmlParser, TellsTextsInUtf8WhateverTheDocumentsEncoding) {
  Parser declared;
  EXPECT_EQ(declared.parse("<?xml version='1.0' encoding='ISO-8859-1'?><a>\xE9</a>"), 1);
  EXPECT_THAT(declared.events, ElementsAre("<a", "\xC3\xA9", ">a"));
  Parser overridden("ISO-8859-1");
  EXPECT_EQ(overridden.parse("<?xml version='1.0' encoding='UTF-8'?><a>\xE9</a>"), 1);
  EXPECT_THAT(overridden.events, ElementsAre("<a", "\xC3\xA9", ">a"));
}

TEST(XmlParser, WorksWithoutHandlersAndUserData) {
  XML1_Parser* const parser = XML1_ParserCreate(nullptr);
  std::memcpy(XML1_GetBuffer(parser, 8), "<a>b</a>", 8);
  EXPECT_EQ(XML1_ParseBuffer(parser, 8, 1), 1);
  XML1_ParserFree(parser);
  XML1_ParserFree(nullptr);
}

struct MalformedCase {
  const char* text;
  const char* message;
  unsigned long line, column;
};

TEST(XmlParser, TellsWhatIsWrongAndWhere) {
  constexpr MalformedCase kCases[] = {
      {"", "no element found", 1, 0},
      {"<a>\n<b></a>", "mismatched tag", 2, 5},
      {"<a>", "no element found", 1, 3},
      {"<a/><b/>", "junk after document element", 1, 4},
      {"<a b='1' b='2'/>", "duplicate attribute", 1, 9},
      {"<a>&nobody;</a>", "undefined entity", 1, 3},
      {"<a>\xFF</a>", "not well-formed (invalid token)", 1, 3},
      {"<?xml version='1.0' encoding='x-nobody'?><a/>", "unknown encoding", 1, 30},
  };
  for (const MalformedCase& each : kCases) {
    SCOPED_TRACE(each.text);
    Parser parser;
    EXPECT_EQ(parser.parse(each.text), 0);
    EXPECT_STREQ(XML1_ErrorString(parser.error()), each.message);
    EXPECT_EQ(XML1_GetCurrentLineNumber(parser.get()), each.line);
    EXPECT_EQ(XML1_GetCurrentColumnNumber(parser.get()), each.column);
  }
}

TEST(XmlParser, FailsWithoutABuffer) {
  Parser parser;
  EXPECT_EQ(XML1_GetBuffer(parser.get(), -1), nullptr);
  EXPECT_EQ(XML1_ParseBuffer(parser.get(), 0, 1), 0);
  EXPECT_NE(parser.error(), 0);
}

TEST(XmlParser, HasNoTextForACodeThatItDoesNotKnow) {
  EXPECT_EQ(XML1_ErrorString(0), nullptr);
  EXPECT_EQ(XML1_ErrorString(9999), nullptr);
  EXPECT_EQ(XML1_ErrorString(-1), nullptr);
  EXPECT_STREQ(XML1_ErrorString(XML1_ERROR_TOO_DEEP), "elements nest too deep");
}

TEST(XmlParser, ThatIsNullDoesNothing) {
  XML1_SetUserData(nullptr, nullptr);
  XML1_SetElementHandler(nullptr, nullptr, nullptr);
  XML1_SetCharacterDataHandler(nullptr, nullptr);
  EXPECT_EQ(XML1_GetBuffer(nullptr, 10), nullptr);
  EXPECT_EQ(XML1_ParseBuffer(nullptr, 0, 1), 0);
  EXPECT_EQ(XML1_GetErrorCode(nullptr), 0);
  EXPECT_EQ(XML1_GetCurrentLineNumber(nullptr), 0u);
  EXPECT_EQ(XML1_GetCurrentColumnNumber(nullptr), 0u);
}

// ---- documents that are made to exhaust the machine ---------------------------------------------------------------

TEST(XmlParser, TakesElementsUpToTheGreatestDepth) {
  Parser parser;
  EXPECT_EQ(parser.parse(nested(XML1_MAXIMUM_DEPTH)), 1);
  EXPECT_EQ(parser.events.size(), 2u * XML1_MAXIMUM_DEPTH);
}

TEST(XmlParser, RefusesElementsThatNestDeeper) {
  Parser parser;
  EXPECT_EQ(parser.parse(nested(XML1_MAXIMUM_DEPTH + 1)), 0);
  EXPECT_EQ(parser.error(), XML1_ERROR_TOO_DEEP);
  EXPECT_EQ(parser.events.size(), size_t{XML1_MAXIMUM_DEPTH});
  EXPECT_EQ(XML1_GetCurrentColumnNumber(parser.get()), 3ul * XML1_MAXIMUM_DEPTH);
}

TEST(XmlParser, CountsDepthNotElements) {
  std::string text = "<r>";
  for (int i = 0; i < 10 * XML1_MAXIMUM_DEPTH; ++i) text += "<e></e><f/>";
  Parser parser;
  EXPECT_EQ(parser.parse(text + "</r>"), 1);
}

TEST(XmlParser, ExpandsHarmlessEntities) {
  Parser parser;
  EXPECT_EQ(parser.parse("<!DOCTYPE a [<!ENTITY name 'inst1'>]><a>&name;</a>"), 1);
  EXPECT_THAT(parser.events, ElementsAre("<a", "inst1", ">a"));
}

TEST(XmlParser, StopsEntitiesThatMultiply) {
  std::string text = "<!DOCTYPE a [<!ENTITY e0 'xxxxxxxxxx'>";
  for (int i = 1; i < 10; ++i) {
    text += "<!ENTITY e" + std::to_string(i) + " '";
    for (int k = 0; k < 10; ++k) text += "&e" + std::to_string(i - 1) + ";";
    text += "'>";
  }
  Parser parser;
  EXPECT_EQ(parser.parse(text + "]><a>&e9;</a>"), 0);
  EXPECT_STREQ(XML1_ErrorString(parser.error()),
               "limit on input amplification factor (from DTD and entities) breached");
}

TEST(XmlParser, StopsOneLongEntityThatIsUsedOften) {
  std::string text = "<!DOCTYPE a [<!ENTITY e '" + std::string(20000, 'x') + "'>]><a>";
  for (int i = 0; i < 2000; ++i) text += "&e;";
  Parser parser;
  EXPECT_EQ(parser.parse(text + "</a>"), 0);
  EXPECT_LT(parser.events.back().size(), size_t{2} << 20);
}

TEST(XmlParser, DoesNotReadExternalEntities) {
  const TemporaryDirectory folder;
  const std::string secret = folder.writeFile("secret", "secret");
  Parser parser;
  EXPECT_EQ(parser.parse("<!DOCTYPE a [<!ENTITY e SYSTEM '" + secret + "'>]><a>&e;</a>"), 1);
  EXPECT_THAT(parser.events, ElementsAre("<a", ">a"));
}

// ---- handlers that throw -----------------------------------------------------------------------------------------

TEST(XmlParser, EndsWithAFailureWhenAHandlerThrows) {
  const std::string text = "<a><b>text</b><c/></a>";
  const std::vector<std::string> events = {"<a", "<b", "text", ">b", "<c", ">c", ">a"};
  for (size_t i = 0; i < events.size(); ++i) {
    SCOPED_TRACE(events[i]);
    Parser parser;
    parser.throw_at = events[i];
    EXPECT_EQ(parser.parse(text), 0);
    EXPECT_STREQ(XML1_ErrorString(parser.error()), "parsing aborted");
    EXPECT_EQ(parser.events, std::vector<std::string>(events.begin(), events.begin() + static_cast<ptrdiff_t>(i)));
  }
}

TEST(XmlParser, StaysFailedAfterAHandlerThrew) {
  Parser parser;
  parser.throw_at = "<a";
  EXPECT_EQ(parser.parse("<a>", /*final=*/false), 0);
  XML1_GetBuffer(parser.get(), 4);
  EXPECT_EQ(XML1_ParseBuffer(parser.get(), 0, 1), 0);
  EXPECT_NE(parser.error(), 0);
}

}  // namespace

// A document object model over a host whose push parser accepts what the XML rules forbid, has no texts for its errors,
// or calls its handlers where nobody would: this program brings its own, which plays back a script of events.
#include <gtest/gtest.h>

#include <functional>
#include <string>

#include "test_seam.h"
#include "tests/support/failing_allocation.h"
#include "util/dom_parser.h"
#include "xml1.h"

struct XML1_Parser {
  XML1_StartElementHandler onStart = nullptr;
  XML1_EndElementHandler onEnd = nullptr;
  XML1_CharacterDataHandler onText = nullptr;
  void* userData = nullptr;
  char buffer[64] = {};
  int freed = 0;

  void start(const char* name) const {
    const char* none[] = {nullptr};
    onStart(userData, name, none);
  }
  void end(const char* name) const { onEnd(userData, name); }
  void text(const std::string& characters) const {
    onText(userData, characters.data(), static_cast<int>(characters.size()));
  }
};

namespace {

XML1_Parser hostParser;
std::function<int(const XML1_Parser&)> script;  // the events of one parse, and its result
const char* errorText = nullptr;

}  // namespace

XML1_Parser* XML1_ParserCreate(const char* encoding) {
  EXPECT_EQ(encoding, nullptr);
  hostParser = {};
  return &hostParser;
}
void XML1_ParserFree(XML1_Parser* parser) {
  ++parser->freed;
}
void XML1_SetUserData(XML1_Parser* parser, void* userData) {
  parser->userData = userData;
}
void XML1_SetElementHandler(XML1_Parser* parser, XML1_StartElementHandler start, XML1_EndElementHandler end) {
  parser->onStart = start;
  parser->onEnd = end;
}
void XML1_SetCharacterDataHandler(XML1_Parser* parser, XML1_CharacterDataHandler handler) {
  parser->onText = handler;
}
void* XML1_GetBuffer(XML1_Parser* parser, int length) {
  return length < static_cast<int>(sizeof parser->buffer) ? parser->buffer : nullptr;
}
int XML1_ParseBuffer(XML1_Parser* parser, int length, int isFinal) {
  EXPECT_EQ(std::string(parser->buffer, static_cast<size_t>(length)), "<xml>");
  EXPECT_EQ(isFinal, 1);
  return script(*parser);
}
int XML1_GetErrorCode(XML1_Parser*) {
  return 33;
}
const char* XML1_ErrorString(int) {
  return errorText;
}
unsigned long XML1_GetCurrentLineNumber(XML1_Parser*) {
  return 5;
}
unsigned long XML1_GetCurrentColumnNumber(XML1_Parser*) {
  return 7;
}

namespace {

using VMQ::DOMParser;

std::string textOf(const VMQ::DOMElement* element) {
  return VMQ::String(element->getElementText()).toNarrow();
}

class LenientPushParserTest : public testing::Test {
 protected:
  LenientPushParserTest() { errorText = nullptr; }
  ~LenientPushParserTest() override { script = nullptr; }

  DOMParser parser_{"<xml>"};
};

TEST_F(LenientPushParserTest, ElementLeftOpenIsIncomplete) {
  script = [](const XML1_Parser& host) {
    host.start("a");
    host.start("b");
    host.end("b");
    return 1;
  };
  EXPECT_FALSE(parser_.parse());
  EXPECT_STREQ(parser_.getErrorMessage(), "incomplete xml");
}

TEST_F(LenientPushParserTest, NoElementAtAllFailsWithoutAMessage) {
  script = [](const XML1_Parser&) { return 1; };
  EXPECT_FALSE(parser_.parse());
  EXPECT_EQ(parser_.getErrorMessage(), nullptr);
  EXPECT_EQ(parser_.getDocument(), nullptr);
}

TEST_F(LenientPushParserTest, ErrorWithoutATextIsNamedByItsNumber) {
  script = [](const XML1_Parser&) { return 0; };
  EXPECT_FALSE(parser_.parse());
  EXPECT_STREQ(parser_.getErrorMessage(), "Unknown error code: 33");
}

TEST_F(LenientPushParserTest, ErrorWithATextIsGivenWithItsPosition) {
  errorText = "what";
  script = [](const XML1_Parser&) { return 0; };
  EXPECT_FALSE(parser_.parse());
  EXPECT_STREQ(parser_.getErrorMessage(), "5:7: what\n");
}

TEST_F(LenientPushParserTest, EndlessErrorTextIsCut) {
  const std::string endless(100000, 'x');
  // cppcheck-suppress danglingLifetime ; the next test has its own
  errorText = endless.c_str();
  script = [](const XML1_Parser&) { return 0; };
  EXPECT_FALSE(parser_.parse());
  EXPECT_TRUE(std::string(parser_.getErrorMessage()).starts_with("5:7: xxx"));
}

TEST_F(LenientPushParserTest, ResultOtherThanOneIsAFailure) {
  script = [](const XML1_Parser& host) {
    host.start("a");
    host.end("a");
    return 2;
  };
  EXPECT_FALSE(parser_.parse());
}

TEST_F(LenientPushParserTest, EventsOutsideTheRootDoNoHarm) {
  script = [](const XML1_Parser& host) {
    host.end("none");
    host.text("x");
    host.start("a");
    host.end("a");
    host.start("second root");
    host.end("second root");
    return 1;
  };
  EXPECT_TRUE(parser_.parse());
  EXPECT_EQ(textOf(parser_.getDocument()), "x");
  EXPECT_EQ(parser_.getDocument()->getChildren()->getLength(), 0u);
}

TEST_F(LenientPushParserTest, CharactersNeedNoTerminator) {
  script = [](const XML1_Parser& host) {
    host.start("a");
    host.onText(host.userData, "xyz", 2);
    host.end("a");
    return 1;
  };
  EXPECT_TRUE(parser_.parse());
  EXPECT_EQ(textOf(parser_.getDocument()), "xy");
}

TEST_F(LenientPushParserTest, InputThatFindsNoBufferIsLeftToTheParser) {
  const DOMParser parser(std::string(100, 'x').c_str());
  EXPECT_EQ(std::string(hostParser.buffer), "");
}

TEST_F(LenientPushParserTest, PushParserIsFreedOnce) {
  { const DOMParser parser("<xml>"); }
  EXPECT_EQ(hostParser.freed, 1);
}

// Memory runs out in each handler in turn. Nothing may be thrown through the push parser, whose frames are C.
TEST_F(LenientPushParserTest, ExceptionInAHandlerEndsTheParseAndGoesNoFurther) {
  constexpr size_t large = 4000;
  const std::string long_text(large, 'x');
  const std::function<void(const XML1_Parser&)> handlers[] = {
      [&](const XML1_Parser& host) { host.start(long_text.c_str()); },
      [&](const XML1_Parser& host) { host.text(long_text); },
      [&](const XML1_Parser& host) { host.end("a"); },
  };
  for (const auto& handler : handlers) {
    DOMParser parser("<xml>");
    script = [&](const XML1_Parser& host) {
      host.start("a");
      host.text(long_text);
      const FailingAllocation failing(large);
      handler(host);
      EXPECT_TRUE(failing.happened());
      host.text("y");
      host.start("b");
      host.end("b");
      host.end("a");
      return 1;
    };
    const TEST_TraceCapture trace;
    EXPECT_FALSE(parser.parse());
    EXPECT_STREQ(parser.getErrorMessage(), "the document could not be built");
    EXPECT_TRUE(trace.hasPrefix(RAS1_ERROR, "Exception while "));
  }
}

}  // namespace

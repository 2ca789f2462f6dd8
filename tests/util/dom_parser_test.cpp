// From XML text to a tree.
#include "util/dom_parser.h"

#include <gtest/gtest.h>

#include <memory>
#include <random>
#include <string>

#include "test_seam.h"
#include "tests/support/scoped_locale.h"
#include "util/dom_attr.h"
#include "xml1.h"

using VMQ::DOMElement;
using VMQ::DOMParser;
using VMQ::String;

namespace {

std::string narrow(const unsigned short* text) {
  return text == nullptr ? "(null)" : String(text).toNarrow();
}

std::string dumpOf(const VMQ::DOMNode& node) {
  String out;
  node.dump(out);
  return out.toNarrow();
}

DOMElement* child(DOMElement* parent, unsigned index) {
  return static_cast<DOMElement*>(parent->getChildren()->item(index));
}

std::string nested(int levels) {
  std::string text;
  for (int i = 0; i < levels; ++i) text += "<a>";
  for (int i = 0; i < levels; ++i) text += "</a>";
  return text;
}

// ---- good documents ------------------------------------------------------------------------------------------------

TEST(DOMParserTest, DocumentBecomesATree) {
  DOMParser parser("<?xml version='1.0'?>\n<runas><agent x='1' y='2'/><agent/></runas>\n<!-- end -->");
  ASSERT_TRUE(parser.parse());
  EXPECT_EQ(parser.getErrorMessage(), nullptr);
  DOMElement* const root = parser.getDocument();
  EXPECT_EQ(root->getParent(), nullptr);
  EXPECT_EQ(child(root, 0)->getParent(), root);
  EXPECT_EQ(dumpOf(*root),
            "<runas >\n"
            "\t<agent x=\"1\" y=\"2\" >\n"
            "\t</agent>\n"
            "\t<agent >\n"
            "\t</agent>\n"
            "</runas>");
}

TEST(DOMParserTest, TextMayBeFreedOnceTheParserExists) {
  auto text = std::make_unique<std::string>("<a><b/></a>");
  DOMParser parser(text->c_str());
  text->assign(text->size(), 'x');
  text.reset();
  ASSERT_TRUE(parser.parse());
  EXPECT_EQ(dumpOf(*parser.getDocument()), "<a >\n\t<b >\n\t</b>\n</a>");
}

TEST(DOMParserTest, TextBelongsToTheNextEndTag) {
  DOMParser parser("<a>x<b>y</b>z</a>");
  ASSERT_TRUE(parser.parse());
  EXPECT_EQ(narrow(child(parser.getDocument(), 0)->getElementText()), "xy");
  EXPECT_EQ(narrow(parser.getDocument()->getElementText()), "z");
}

TEST(DOMParserTest, IndentationInFrontOfAChildIsPartOfItsText) {
  DOMParser parser("<a>\n\t<b>y</b>\n\t<c> </c>\n</a>");
  ASSERT_TRUE(parser.parse());
  EXPECT_EQ(narrow(child(parser.getDocument(), 0)->getElementText()), "\n\ty");
  EXPECT_EQ(narrow(child(parser.getDocument(), 1)->getElementText()), "\n\t ");
  EXPECT_EQ(narrow(parser.getDocument()->getElementText()), "\n");
}

TEST(DOMParserTest, TextOfAnAncestorGoesToItsFirstDescendantThatEnds) {
  DOMParser parser("<a>1<b>2<c>3</c>4</b>5</a>");
  ASSERT_TRUE(parser.parse());
  DOMElement* const b = child(parser.getDocument(), 0);
  EXPECT_EQ(narrow(child(b, 0)->getElementText()), "123");
  EXPECT_EQ(narrow(b->getElementText()), "4");
  EXPECT_EQ(narrow(parser.getDocument()->getElementText()), "5");
}

TEST(DOMParserTest, WhiteSpaceAloneIsText) {
  DOMParser parser("<a>  \n</a>");
  ASSERT_TRUE(parser.parse());
  EXPECT_EQ(narrow(parser.getDocument()->getElementText()), "  \n");
}

TEST(DOMParserTest, ElementWithoutTextHasAnEmptyOne) {
  DOMParser parser("<a/>");
  ASSERT_TRUE(parser.parse());
  EXPECT_EQ(narrow(parser.getDocument()->getElementText()), "");
}

TEST(DOMParserTest, EntitiesAndCharacterDataSectionsAreTheParsersWork) {
  DOMParser parser("<a b='&lt;&quot;'>&amp;x<![CDATA[<y>]]>&#65;</a>");
  ASSERT_TRUE(parser.parse());
  EXPECT_EQ(narrow(parser.getDocument()->getElementText()), "&x<y>A");
  EXPECT_EQ(narrow(parser.getDocument()->getAttribute("b")), "<\"");
}

TEST(DOMParserTest, LongTextInManyPiecesIsGatheredWhole) {
  std::string text;
  for (int i = 0; i < 5000; ++i) text += "line " + std::to_string(i) + "\n";
  DOMParser parser(("<a>" + text + "</a>").c_str());
  ASSERT_TRUE(parser.parse());
  EXPECT_EQ(narrow(parser.getDocument()->getElementText()), text);
}

// In the plain C locale of this test the bytes of the document's UTF-8 pass as single units.
TEST(DOMParserTest, BytesBeyondAsciiComeBackAsTheSameBytes) {
  DOMParser parser("<\xC3\xA9 x='\xE2\x82\xAC'>\xC3\xBC</\xC3\xA9>");
  ASSERT_TRUE(parser.parse());
  EXPECT_EQ(narrow(parser.getDocument()->getTagName()), "\xC3\xA9");
  EXPECT_EQ(narrow(parser.getDocument()->getAttribute("x")), "\xE2\x82\xAC");
  EXPECT_EQ(narrow(parser.getDocument()->getElementText()), "\xC3\xBC");
}

TEST(DOMParserTest, InAUtf8LocaleUnitsAreTheDocumentsCharacters) {
  const ScopedLocale utf8("C.UTF-8");
  DOMParser parser("<\xC3\xA9 x='\xE2\x82\xAC'>\xC3\xBC<b/></\xC3\xA9>");
  ASSERT_TRUE(parser.parse());
  DOMElement* const root = parser.getDocument();
  EXPECT_EQ(std::u16string(reinterpret_cast<const char16_t*>(root->getTagName())), u"\u00E9");
  EXPECT_EQ(std::u16string(reinterpret_cast<const char16_t*>(root->getAttribute("x"))), u"\u20AC");
  EXPECT_EQ(std::u16string(reinterpret_cast<const char16_t*>(child(root, 0)->getElementText())), u"\u00FC");
  EXPECT_EQ(root->getElementsByTagName("b")->getLength(), 1u);
}

TEST(DOMParserTest, DeclaredEncodingIsHeeded) {
  DOMParser parser("<?xml version='1.0' encoding='ISO-8859-1'?><a>\xFC</a>");
  ASSERT_TRUE(parser.parse());
  EXPECT_EQ(narrow(parser.getDocument()->getElementText()), "\xC3\xBC");  // the parser delivers UTF-8
}

TEST(DOMParserTest, DeepestTreeIsBuiltAndDestroyed) {
  DOMParser parser(nested(XML1_MAXIMUM_DEPTH).c_str());
  ASSERT_TRUE(parser.parse());
  int levels = 0;
  for (DOMElement* element = parser.getDocument(); element != nullptr; element = child(element, 0)) ++levels;
  EXPECT_EQ(levels, XML1_MAXIMUM_DEPTH);
}

TEST(DOMParserTest, ParserThatNeverParsedHasNothing) {
  const DOMParser parser("<a/>");
  EXPECT_EQ(parser.getDocument(), nullptr);
  EXPECT_EQ(parser.getErrorMessage(), nullptr);
}

// ---- failures ------------------------------------------------------------------------------------------------------

struct Malformed {
  const char* name;
  std::string text;
  std::string message;
};

class MalformedDocumentTest : public testing::TestWithParam<Malformed> {};

TEST_P(MalformedDocumentTest, FailsWithItsPosition) {
  DOMParser parser(GetParam().text.c_str());
  EXPECT_FALSE(parser.parse());
  ASSERT_NE(parser.getErrorMessage(), nullptr);
  EXPECT_EQ(std::string(parser.getErrorMessage()), GetParam().message);
}

INSTANTIATE_TEST_SUITE_P(
    All, MalformedDocumentTest,
    testing::Values(Malformed{"MismatchedTag", "<a>\n  <b></c></a>", "2:7: mismatched tag\n"},
                    Malformed{"OpenElement", "<a><b></b>", "1:10: no element found\n"},
                    Malformed{"OpenTag", "<a", "1:0: unclosed token\n"},
                    Malformed{"TwoRoots", "<a/>\n<b/>", "2:0: junk after document element\n"},
                    Malformed{"TextBehindTheRoot", "<a/>\nx", "2:0: junk after document element\n"},
                    Malformed{"NoElement", "<!-- nothing -->", "1:16: no element found\n"},
                    Malformed{"TextAlone", "text", "1:0: syntax error\n"},
                    Malformed{"BareAmpersand", "<a> & </a>", "1:5: not well-formed (invalid token)\n"},
                    Malformed{"UnknownEntity", "<a>&x;</a>", "1:3: undefined entity\n"},
                    Malformed{"RepeatedAttribute", "<a x='1' x='2'/>", "1:9: duplicate attribute\n"},
                    Malformed{"NotUtf8", "<a>\xFC</a>", "1:3: not well-formed (invalid token)\n"},
                    Malformed{"UnknownEncoding", "<?xml version='1.0' encoding='x-none'?><a/>",
                              "1:30: unknown encoding\n"}),
    [](const auto& test) { return std::string(test.param.name); });

TEST(DOMParserTest, EmptyTextFails) {
  DOMParser parser("");
  EXPECT_FALSE(parser.parse());
  EXPECT_EQ(parser.getDocument(), nullptr);
}

TEST(DOMParserTest, TooDeepTreeFails) {
  DOMParser parser(nested(XML1_MAXIMUM_DEPTH + 1).c_str());
  EXPECT_FALSE(parser.parse());
  ASSERT_NE(parser.getErrorMessage(), nullptr);
  EXPECT_TRUE(std::string(parser.getErrorMessage()).ends_with(": elements nest too deep\n"))
      << parser.getErrorMessage();
}

TEST(DOMParserTest, EntitiesThatGrowWithoutBoundFail) {
  std::string text = "<!DOCTYPE a [<!ENTITY e0 '" + std::string(100, 'x') + "'>";
  for (int i = 1; i < 10; ++i) {
    text += "<!ENTITY e" + std::to_string(i) + " '";
    for (int n = 0; n < 10; ++n) text += "&e" + std::to_string(i - 1) + ";";
    text += "'>";
  }
  DOMParser parser((text + "]><a>&e9;</a>").c_str());
  EXPECT_FALSE(parser.parse());
}

TEST(DOMParserTest, WithoutAPushParserParsingFails) {
  const TEST_FailCall failing("XML1_ParserCreate", 1, 0);
  DOMParser parser("<a/>");
  EXPECT_TRUE(failing.happened());
  EXPECT_FALSE(parser.parse());
  EXPECT_STREQ(parser.getErrorMessage(), "no parser");
  EXPECT_EQ(parser.getDocument(), nullptr);
}

TEST(DOMParserTest, WithoutABufferParsingFails) {
  const TEST_FailCall failing("XML1_GetBuffer", 1, 0);
  DOMParser parser("<a/>");
  EXPECT_TRUE(failing.happened());
  EXPECT_FALSE(parser.parse());
  EXPECT_NE(parser.getErrorMessage(), nullptr);
  EXPECT_EQ(parser.getDocument(), nullptr);
}

TEST(DOMParserTest, CodeWithoutATextIsNamedByItsNumber) {
  const TEST_FailCall failing("XML1_ParseBuffer", 1, 4711);
  DOMParser parser("<a/>");
  EXPECT_FALSE(parser.parse());
  EXPECT_STREQ(parser.getErrorMessage(), "Unknown error code: 4711");
}

TEST(DOMParserTest, DocumentCutAnywhereFails) {
  const std::string whole = "<a x='1'>text<b y=\"2\">&amp;</b><![CDATA[z]]><!-- c --></a>";
  for (size_t length = 0; length < whole.size(); ++length) {
    DOMParser parser(whole.substr(0, length).c_str());
    EXPECT_FALSE(parser.parse()) << length;
  }
}

// ---- any tree ------------------------------------------------------------------------------------------------------

// A dump is itself XML: parsed again, it must give the same dump.
TEST(DOMParserTest, RandomTreesSurviveTheRoundTrip) {
  const unsigned seed = std::random_device()();
  SCOPED_TRACE(seed);
  std::mt19937 random(seed);
  for (int round = 0; round < 30; ++round) {
    DOMElement root("root");
    std::vector<DOMElement*> elements{&root};
    for (unsigned n = random() % 60; n > 0; --n) {
      auto* const element = new DOMElement(("e" + std::to_string(random() % 5)).c_str());
      for (unsigned a = random() % 4; a > 0; --a) {
        element->setAttribute(("a" + std::to_string(a)).c_str(), std::to_string(random()).c_str());
      }
      elements[random() % elements.size()]->addChild(element);
      elements.push_back(element);
    }
    const std::string dump = dumpOf(root);
    DOMParser parser(dump.c_str());
    ASSERT_TRUE(parser.parse()) << dump;
    EXPECT_EQ(dumpOf(*parser.getDocument()), dump);
  }
}

}  // namespace

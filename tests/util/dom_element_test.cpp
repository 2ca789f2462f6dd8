// Elements and attributes, built by hand.
#include "util/dom_element.h"

#include <gtest/gtest.h>

#include <string>

#include "util/dom_attr.h"

using VMQ::DOMAttr;
using VMQ::DOMElement;
using VMQ::DOMNodeList;
using VMQ::String;

namespace {

constexpr const char* noText = nullptr;
constexpr const unsigned short* noUnits = nullptr;

std::string narrow(const unsigned short* text) {
  return text == nullptr ? "(null)" : String(text).toNarrow();
}

std::string dumpOf(const VMQ::DOMNode& node) {
  String out;
  node.dump(out);
  return out.toNarrow();
}

// ---- attributes ----------------------------------------------------------------------------------------------------

TEST(DOMAttrTest, KeepsNameAndValue) {
  const DOMAttr attribute("name", "value");
  EXPECT_EQ(narrow(attribute.getName()), "name");
  EXPECT_EQ(narrow(attribute.getValue()), "value");
  EXPECT_EQ(attribute.getNodeType(), 2);
}

TEST(DOMAttrTest, DumpsWithoutEscaping) {
  EXPECT_EQ(dumpOf(DOMAttr("name", "a<\"&")), "name=\"a<\"&\"");
}

TEST(DOMAttrTest, CopyHasTextsOfItsOwn) {
  auto original = std::make_unique<DOMAttr>("name", "");
  const DOMAttr copy(*original);
  EXPECT_NE(copy.getName(), original->getName());
  original.reset();
  EXPECT_EQ(narrow(copy.getName()), "name");
  EXPECT_EQ(narrow(copy.getValue()), "");
}

TEST(DOMAttrTest, NullTextsStayNull) {
  const DOMAttr attribute(noText, noText);
  const DOMAttr copy(attribute);
  EXPECT_EQ(copy.getName(), nullptr);
  EXPECT_EQ(copy.getValue(), nullptr);
  EXPECT_EQ(dumpOf(copy), "=\"\"");
}

// ---- elements ------------------------------------------------------------------------------------------------------

TEST(DOMElementTest, NewElementHasNothingButItsName) {
  DOMElement element("tag");
  EXPECT_EQ(element.getNodeType(), 1);
  EXPECT_EQ(narrow(element.getTagName()), "tag");
  EXPECT_EQ(element.getParent(), nullptr);
  EXPECT_EQ(element.getElementText(), nullptr);
  EXPECT_EQ(element.getAttributes()->getLength(), 0u);
  EXPECT_EQ(element.getChildren()->getLength(), 0u);
}

TEST(DOMElementTest, TextMayBeSetFromEitherFormAndReplaced) {
  DOMElement element("tag");
  element.setElementText("narrow");
  EXPECT_EQ(narrow(element.getElementText()), "narrow");
  element.setElementText(String("wide").getData());
  EXPECT_EQ(narrow(element.getElementText()), "wide");
  element.setElementText(element.getElementText());
  EXPECT_EQ(narrow(element.getElementText()), "wide");
  element.setElementText(noText);
  EXPECT_EQ(element.getElementText(), nullptr);
  element.setElementText(noUnits);
  EXPECT_EQ(element.getElementText(), nullptr);
}

TEST(DOMElementTest, AttributeIsFoundByItsExactName) {
  DOMElement element("tag");
  element.setAttribute("a", "1");
  element.setAttribute("ab", "2");
  EXPECT_EQ(narrow(element.getAttribute("a")), "1");
  EXPECT_EQ(narrow(element.getAttribute("ab")), "2");
  EXPECT_EQ(narrow(element.getAttribute(String("ab").getData())), "2");
  EXPECT_EQ(element.getAttribute("A"), nullptr);
  EXPECT_EQ(element.getAttribute(""), nullptr);
}

TEST(DOMElementTest, RepeatedAttributeIsKeptTwiceAndTheFirstIsFound) {
  DOMElement element("tag");
  element.setAttribute("a", "1");
  element.setAttribute("a", "2");
  EXPECT_EQ(element.getAttributes()->getLength(), 2u);
  EXPECT_EQ(narrow(element.getAttribute("a")), "1");
  EXPECT_EQ(dumpOf(element), "<tag a=\"1\" a=\"2\" >\n</tag>");
}

TEST(DOMElementTest, AttributeWithoutNameOrValueIsNotSet) {
  DOMElement element("tag");
  element.setAttribute(noText, "1");
  element.setAttribute("a", noText);
  EXPECT_EQ(element.getAttributes()->getLength(), 0u);
}

TEST(DOMElementTest, NullNamesFindNothing) {
  DOMElement element("tag");
  element.setAttribute("a", "1");
  EXPECT_EQ(element.getAttribute(noText), nullptr);
  EXPECT_EQ(element.getAttribute(noUnits), nullptr);
  EXPECT_EQ(element.getElementsByTagName(noText), nullptr);
  EXPECT_EQ(element.getElementsByTagName(noUnits), nullptr);
}

TEST(DOMElementTest, ChildGetsItsParent) {
  DOMElement parent("parent");
  auto* const child = new DOMElement("child");
  parent.addChild(child);
  parent.addChild(nullptr);
  EXPECT_EQ(child->getParent(), &parent);
  EXPECT_EQ(parent.getChildren()->getLength(), 1u);
  EXPECT_EQ(parent.getChildren()->item(0), child);
}

// a, b, a with an a inside b
class ElementsByTagNameTest : public testing::Test {
 protected:
  ElementsByTagNameTest() {
    for (DOMElement* const child : {first_, other_, second_}) root_.addChild(child);
    other_->addChild(new DOMElement("a"));
  }

  DOMElement root_{"root"};
  DOMElement* first_ = new DOMElement("a");
  DOMElement* other_ = new DOMElement("b");
  DOMElement* second_ = new DOMElement("a");
};

TEST_F(ElementsByTagNameTest, DirectChildrenAreFoundInOrder) {
  const DOMNodeList* const found = root_.getElementsByTagName("a");
  ASSERT_EQ(found->getLength(), 2u);
  EXPECT_EQ(found->item(0), first_);
  EXPECT_EQ(found->item(1), second_);
}

TEST_F(ElementsByTagNameTest, NameWithoutChildrenGivesAnEmptyList) {
  EXPECT_EQ(root_.getElementsByTagName("A")->getLength(), 0u);
  EXPECT_EQ(root_.getElementsByTagName("root")->getLength(), 0u);
}

TEST_F(ElementsByTagNameTest, SecondCallGivesTheSameList) {
  DOMNodeList* const list = root_.getElementsByTagName("a");
  EXPECT_EQ(root_.getElementsByTagName("a"), list);
  EXPECT_EQ(root_.getElementsByTagName(String("a").getData()), list);
  EXPECT_NE(root_.getElementsByTagName("b"), list);
}

TEST_F(ElementsByTagNameTest, ChildAddedLaterIsNotInTheListOfItsName) {
  (void)root_.getElementsByTagName("a");
  root_.addChild(new DOMElement("a"));
  root_.addChild(new DOMElement("c"));
  EXPECT_EQ(root_.getElementsByTagName("a")->getLength(), 2u);
  EXPECT_EQ(root_.getElementsByTagName("c")->getLength(), 1u);
}

TEST(DOMElementTest, CopyHasNameAndTextOnly) {
  auto parent = std::make_unique<DOMElement>("parent");
  auto* const original = new DOMElement("tag");
  parent->addChild(original);
  original->setElementText("text");
  original->setAttribute("a", "1");
  original->addChild(new DOMElement("child"));
  (void)original->getElementsByTagName("child");

  DOMElement copy(*original);
  parent.reset();
  EXPECT_EQ(narrow(copy.getTagName()), "tag");
  EXPECT_EQ(narrow(copy.getElementText()), "text");
  EXPECT_EQ(copy.getParent(), nullptr);
  EXPECT_EQ(copy.getAttributes()->getLength(), 0u);
  EXPECT_EQ(copy.getChildren()->getLength(), 0u);
  EXPECT_EQ(copy.getElementsByTagName("child")->getLength(), 0u);
}

TEST(DOMElementTest, CopyOfAnElementWithoutTextHasNone) {
  EXPECT_EQ(DOMElement(DOMElement("tag")).getElementText(), nullptr);
}

// ---- dump ----------------------------------------------------------------------------------------------------------

TEST(DOMElementTest, DumpIndentsChildrenByOneTabAndEndsWithoutALineFeed) {
  DOMElement root("runas");
  root.addChild(new DOMElement("agent"));
  EXPECT_EQ(dumpOf(root), "<runas >\n\t<agent >\n\t</agent>\n</runas>");
}

TEST(DOMElementTest, DumpShowsAttributesButNoText) {
  DOMElement root("a");
  root.setAttribute("x", "1");
  root.setAttribute("y", "2");
  root.setElementText("hidden");
  auto* const child = new DOMElement("b");
  child->setAttribute("z", "3");
  child->addChild(new DOMElement("c"));
  root.addChild(child);
  root.addChild(new DOMElement("d"));
  EXPECT_EQ(dumpOf(root),
            "<a x=\"1\" y=\"2\" >\n"
            "\t<b z=\"3\" >\n"
            "\t\t<c >\n"
            "\t\t</c>\n"
            "\t</b>\n"
            "\t<d >\n"
            "\t</d>\n"
            "</a>");
}

TEST(DOMElementTest, DumpMayBeginIndentedAndAppends) {
  DOMElement root("a");
  root.addChild(new DOMElement("b"));
  String out("before:");
  root.dump(String("  "), out);
  EXPECT_EQ(out.toNarrow(), "before:  <a >\n  \t<b >\n  \t</b>\n  </a>");
}

}  // namespace

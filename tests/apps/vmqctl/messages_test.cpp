#include "apps/vmqctl/messages.h"

#include <gtest/gtest.h>

#include <regex>

#include "apps/vmqctl/commands/result.h"
#include "tests/support/temporary_directory.h"

namespace {

using vmqctl::messages;

TEST(Messages, EveryIdFrom1001To1035IsThereInOrder) {
  ASSERT_EQ(messages.size(), 35U);
  for (std::size_t i = 0; i < messages.size(); ++i) {
    const std::size_t number = 1001 + i;
    EXPECT_EQ(messages[i].id, "VMQ" + std::to_string(number) + (number == 1035 ? "I" : "E"));
  }
}

TEST(Messages, EachTextIsOneSentence) {
  for (const vmqctl::Message& message : messages) {
    const std::string text(message.text);
    // A capital letter first, a period last and no other end of a sentence between them.
    EXPECT_TRUE(std::regex_match(text, std::regex("[A-Z][^\n]*[^.!?\\s]\\."))) << text;
    EXPECT_FALSE(std::regex_search(text, std::regex("[.!?] +[A-Z]"))) << text;
    EXPECT_GT(text.size(), 30U) << text;
  }
}

TEST(Messages, NoTextIsUsedTwice) {
  for (const vmqctl::Message& one : messages) {
    for (const vmqctl::Message& other : messages) EXPECT_TRUE(&one == &other || one.text != other.text) << one.id;
  }
}

TEST(Messages, AreFoundByTheirIdOnly) {
  EXPECT_EQ(vmqctl::findMessage("VMQ1035I"), &messages.back());
  for (const char* unknown : {"", "VMQ1000E", "VMQ1036E", "VMQ1035E", "vmq1001e"}) {
    EXPECT_EQ(vmqctl::findMessage(unknown), nullptr) << unknown;
  }
}

TEST(Messages, ReturnValuesHaveTheirIds) {
  EXPECT_EQ(vmqctl::messageIdOf(1001), "VMQ1001E");
  EXPECT_EQ(vmqctl::messageIdOf(1035), "VMQ1035I");
  for (const long none : {0L, 1000L, 1036L, -1L, -4294967296L + 1001}) EXPECT_EQ(vmqctl::messageIdOf(none), "") << none;
}

// One catalogue in two places: the rows of the page are those of the code, neither more nor fewer.
TEST(Messages, PageShowsTheSameCatalogue) {
  const std::string page = readWholeFile(VMQ_MESSAGES_PAGE);
  std::string expected;
  for (const vmqctl::Message& message : messages) {
    const std::string parameters = message.parameters.empty() ? "none" : std::string(message.parameters);
    expected += "| " + std::string(message.id) + " | " + std::string(message.text) + " | " + parameters + " |\n";
  }
  std::string found;
  const std::regex row("^\\| VMQ[^\n]*\n", std::regex::ECMAScript | std::regex::multiline);
  for (std::sregex_iterator at(page.begin(), page.end(), row), end; at != end; ++at) found += at->str();
  EXPECT_EQ(found, expected);
}

TEST(Explanation, SaysWhatTheMessageSays) {
  EXPECT_EQ(vmqctl::explanation({1003, "VMQ1003E", ""}),
            "VMQ1003E The request names no product; it has to give the product code in its column PRODUCT.");
}

TEST(Explanation, ShowsTheParametersBesideIt) {
  const std::string text = vmqctl::explanation({1034, "VMQ1034E", "ux"});
  EXPECT_EQ(text, "VMQ1034E " + vmqctl::messageText("VMQ1034E") + " (parameters: ux)");
}

TEST(Explanation, UnknownMessageIsNamed) {
  EXPECT_EQ(vmqctl::explanation({7, "VMQ9999E", "x"}),
            "VMQ9999E This message id is not in the catalogue. (parameters: x)");
}

TEST(Explanation, FailureWithoutAMessageNamesItsNumberAndWhatThatStandsFor) {
  EXPECT_EQ(vmqctl::explanation({1031, "", ""}),
            "Return value 1031 came without a message. It stands for: " + vmqctl::messageText("VMQ1031E"));
  EXPECT_EQ(vmqctl::explanation({-3, "", ""}), "Return value -3 came without a message.");
}

TEST(Explanation, SuccessNeedsNone) {
  EXPECT_EQ(vmqctl::explanation({0, "", ""}), "");
}

}  // namespace

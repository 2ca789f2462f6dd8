#include "apps/vmqctl/output.h"

#include <gtest/gtest.h>

namespace {

using vmqctl::Charset;
using vmqctl::Json;
using vmqctl::Layout;
using vmqctl::record;
using vmqctl::table;

class Output : public testing::Test {
 protected:
  static void SetUpTestSuite() { vmqctl::useUtf8Characters(); }
};

const std::vector<std::string> columns = {"COMMAND", "RETVAL", "PARM"};

TEST_F(Output, TableIsAlignedWithNumbersToTheRightAndNoBlanksAtLineEnds) {
  EXPECT_EQ(table(columns,
                  {{{"COMMAND", "START"}, {"RETVAL", 0}, {"PARM", ""}},
                   {{"COMMAND", "UNINSTALL"}, {"RETVAL", 1032}, {"PARM", "a b"}}},
                  {}),
            "COMMAND    RETVAL  PARM\n"
            "START           0\n"
            "UNINSTALL    1032  a b\n");
}

TEST_F(Output, TableWithoutRowsIsItsNames) {
  EXPECT_EQ(table(columns, {}, {}), "COMMAND  RETVAL  PARM\n");
}

TEST_F(Output, ColumnThatARowLacksIsEmptyAndOneThatNobodyAskedForIsLeftOut) {
  EXPECT_EQ(table({"A", "B"}, {{{"B", "b"}, {"C", "c"}}, {{"A", "a"}}}, {}),
            "A  B\n"
            "   b\n"
            "a\n");
}

TEST_F(Output, HostileCellStaysOneLineAndCannotDriveTheTerminal) {
  EXPECT_EQ(table({"A", "B"}, {{{"A", "x\x1b]0;title\a\ny"}, {"B", "z"}}}, {}),
            "A                     B\n"
            "x\\x1b]0;title\\x07\\ny  z\n");
}

TEST_F(Output, NameOfAColumnIsEscapedToo) {
  EXPECT_EQ(table({"A\n"}, {{{"A\n", 1}}}, {}), "A\\n\n  1\n");
}

TEST_F(Output, WideCharactersCountTwo) {
  EXPECT_EQ(table({"A", "B"}, {{{"A", "\xE6\x97\xA5"}, {"B", "b"}}, {{"A", "abc"}, {"B", "b"}}}, {}),
            "A    B\n"
            "\xE6\x97\xA5   b\n"
            "abc  b\n");
}

TEST_F(Output, AsciiTerminalGetsAsciiOnly) {
  EXPECT_EQ(table({"A"}, {{{"A", "\xC3\xBC"}}}, Layout{0, Charset::Ascii}), "A\n\\u{fc}\n");
}

TEST_F(Output, UnlimitedTableIsNeverCut) {
  const std::string value(3072, 'x');
  EXPECT_EQ(table({"CONTEXT"}, {{{"CONTEXT", value}}}, {}), "CONTEXT\n" + value + "\n");
}

TEST_F(Output, TableIsCutToItsWidthWhereItIsWidest) {
  const Json row = {{"COMMAND", "START"}, {"RETVAL", 0}, {"PARM", "a very long text that nobody reads"}};
  EXPECT_EQ(table(columns, {row}, Layout{33, Charset::Utf8}),
            "COMMAND  RETVAL  PARM\n"
            "START         0  a very long t...\n");
  EXPECT_EQ(table(columns, {row}, Layout{51, Charset::Utf8}),  // just fits
            "COMMAND  RETVAL  PARM\n"
            "START         0  a very long text that nobody reads\n");
}

TEST_F(Output, NumbersAndNamesAreNotCut) {
  // Eight columns for the text are the least; with one fewer, the rows are written below each other.
  const Json row = {{"NUMBER", 1234567890}, {"TEXT", "abcdefghijk"}};
  EXPECT_EQ(table({"NUMBER", "TEXT"}, {row}, Layout{20, Charset::Utf8}),
            "    NUMBER  TEXT\n"
            "1234567890  abcde...\n");
  EXPECT_EQ(table({"NUMBER", "TEXT"}, {row, row}, Layout{19, Charset::Utf8}),
            "NUMBER  1234567890\n"
            "TEXT    abcdefghijk\n"
            "\n"
            "NUMBER  1234567890\n"
            "TEXT    abcdefghijk\n");
}

TEST_F(Output, RecordGoesOnInTheNextLineWhenTheWidthIsLimited) {
  const Json object = {{"A", "0123456789abcdef"}, {"LONG", ""}, {"N", -5}, {"O", {{"x", 1}}}};
  EXPECT_EQ(record(object, Layout{16, Charset::Utf8}),
            "A     0123456789\n"
            "      abcdef\n"
            "LONG\n"
            "N     -5\n"
            "O     {\"x\":1}\n");
  EXPECT_EQ(record({{"A", "0123456789abcdef"}}, {}), "A  0123456789abcdef\n");
}

TEST_F(Output, LinesGoToAFileAsTheyAreAndToATerminalEscaped) {
  const std::string text = "A=1\r\n\n\x1b[2JB=\t\xC3\xBC\\";
  vmqctl::Stream stream;
  EXPECT_EQ(linesText(text, stream), text);
  stream.terminal = true;
  EXPECT_EQ(linesText(text, stream), "A=1\\r\n\n\\x1b[2JB=\\t\xC3\xBC\\\\");
  EXPECT_EQ(linesText("", stream), "");
  EXPECT_EQ(linesText("A\n", stream), "A\n");
}

TEST_F(Output, JsonKeepsTheOrderOfItsMembers) {
  const Json value = {{"b", 1}, {"a", "\xC3\xBC\x1b"}};
  vmqctl::Stream file;
  EXPECT_EQ(jsonText(value, /*oneLine=*/true, file), "{\"b\":1,\"a\":\"\xC3\xBC\\u001b\"}\n");
  EXPECT_EQ(jsonText(value, /*oneLine=*/false, file), "{\n  \"b\": 1,\n  \"a\": \"\xC3\xBC\\u001b\"\n}\n");
}

TEST_F(Output, JsonOnATerminalIsAscii) {
  vmqctl::Stream terminal;
  terminal.terminal = true;
  EXPECT_EQ(jsonText("\xC3\xBC\xC2\x9B\x1b", /*oneLine=*/true, terminal), "\"\\u00fc\\u009b\\u001b\"\n");
}

}  // namespace

#include "tasks/task_queue_elem.h"

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <clocale>
#include <cstring>
#include <stdexcept>
#include <string>

#include "mgmt/kagdyst.h"
#include "test_seam.h"
#include "tests/tasks/rows.h"

namespace {

using testing::ElementsAre;
using testing::IsEmpty;
using VMQ::String;

/// A column of so many bytes after it was filled, between two guard bytes that must stay.
std::string filled(unsigned long size, const std::string& text) {
  std::string bytes(size + 2, '#');
  TaskQueueElem::SetValueAndPad(bytes.data() + 1, size, text.c_str());
  EXPECT_EQ(bytes.front(), '#');
  EXPECT_EQ(bytes.back(), '#');
  return bytes.substr(1, size);
}

TaskQueueElem sampleRequest() {
  return TaskQueueElem("node7", "t1", "INSTALL", "ux", "./install.sh -q", "INSTANCE", "model.mdl", "a.sh,b.sh",
                       "062000", "inst1:node7:UX");
}

std::string rowOf(const TaskQueueElem& request) {
  return std::string(reinterpret_cast<const char*>(&request.row), sizeof request.row);
}

TEST(FilledColumn, ShorterTextIsPaddedWithBlanks) {
  EXPECT_EQ(filled(8, "abc"), "abc     ");
}

TEST(FilledColumn, EmptyTextGivesBlanksOnly) {
  EXPECT_EQ(filled(4, ""), "    ");
}

TEST(FilledColumn, TextOfExactlyTheWidthHasNoPaddingAndNoTrace) {
  TEST_TraceCapture trace;
  EXPECT_EQ(filled(4, "abcd"), "abcd");
  EXPECT_THAT(trace.texts(RAS1_ERROR), IsEmpty());
}

TEST(FilledColumn, LongerTextIsCutAndTraced) {
  TEST_TraceCapture trace;
  EXPECT_EQ(filled(4, "abcdef"), "abcd");
  EXPECT_THAT(trace.texts(RAS1_ERROR),
              ElementsAre("Result data \"abcdef\" was truncated to \"abcd\" because it exceeded the maximum size of 4 "
                          "characters"));
}

TEST(FilledColumn, CharacterAtTheEdgeIsCutAtTheByteWidth) {
  EXPECT_EQ(filled(4, "abc\xc3\xa9"), "abc\xc3");
}

TEST(Request, StartsEmptyWithARowOfZeroBytes) {
  const TaskQueueElem request;
  EXPECT_EQ(rowOf(request), std::string(4196, '\0'));
  for (const String* text : {&request.originnode, &request.transid, &request.command, &request.product,
                             &request.context, &request.optional, &request.daconfig, &request.dascript,
                             &request.version, &request.targetmsn, &request.retmsgid, &request.retmsgparm})
    EXPECT_EQ(text->length(), 0u);
}

TEST(Request, TakesItsTenParametersInOrder) {
  const TaskQueueElem request = sampleRequest();
  EXPECT_EQ(request.originnode, "node7");
  EXPECT_EQ(request.transid, "t1");
  EXPECT_EQ(request.command, "INSTALL");
  EXPECT_EQ(request.product, "ux");
  EXPECT_EQ(request.context, "./install.sh -q");
  EXPECT_EQ(request.optional, "INSTANCE");
  EXPECT_EQ(request.daconfig, "model.mdl");
  EXPECT_EQ(request.dascript, "a.sh,b.sh");
  EXPECT_EQ(request.version, "062000");
  EXPECT_EQ(request.targetmsn, "inst1:node7:UX");
  EXPECT_EQ(request.retmsgid, "");
  EXPECT_EQ(request.retmsgparm, "");
  EXPECT_EQ(rowOf(request), std::string(4196, '\0'));
}

TEST(Request, CopyHasEveryTextAndTheWholeRow) {
  TaskQueueElem request = sampleRequest();
  request.retmsgid = "VMQ1031E";
  request.retmsgparm = "./install.sh -q,2";
  request.ReturnStatus(1031);
  TaskQueueElem copy(request);
  EXPECT_EQ(rowOf(copy), rowOf(request));
  copy.row = {};
  copy.ReturnStatus(1031);  // from the copy's own texts
  EXPECT_EQ(rowOf(copy), rowOf(request));
}

TEST(Request, MovedElementKeepsItsTextsAndItsRow) {
  TaskQueueElem request = sampleRequest();
  request.ReturnStatus(0);
  const std::string row = rowOf(request);
  const TaskQueueElem moved(std::move(request));
  EXPECT_EQ(rowOf(moved), row);
  EXPECT_EQ(moved.context, "./install.sh -q");
}

TEST(ReturnedStatus, FillsTheAnswerRow) {
  TEST_TraceCapture trace;
  TaskQueueElem request = sampleRequest();
  request.retmsgid = "VMQ1031E";
  request.retmsgparm = "./install.sh -q,2";
  request.ReturnStatus(1031);
  const AnswerRow expected{.originnode = "node7",
                           .transid = "t1",
                           .command = "INSTALL",
                           .product = "ux",
                           .context = "./install.sh -q",
                           .optional = "INSTANCE",
                           .daconfig = "model.mdl",
                           .dascript = "a.sh,b.sh",
                           .retval = 1031,
                           .version = "062000",
                           .retmsgid = "VMQ1031E",
                           .retmsgparm = "./install.sh -q,2",
                           .targetmsn = "inst1:node7:UX"};
  EXPECT_EQ(rowOf(request), expected.bytes());
  EXPECT_TRUE(
      trace.has(RAS1_DETAIL, "Returning status return code [1031], message id [VMQ1031E] parms [./install.sh -q,2]"));
}

TEST(ReturnedStatus, ContextOf3073CharactersIsCutTo3072AndTraced) {
  TEST_TraceCapture trace;
  TaskQueueElem request;
  request.context = String(std::string(3073, 'c').c_str());
  request.ReturnStatus(0);
  EXPECT_EQ(std::string(request.row.context, 3072), std::string(3072, 'c'));
  EXPECT_EQ(std::string(request.row.optional, 32), std::string(32, ' '));
  EXPECT_TRUE(trace.has(RAS1_ERROR, "Result data \"" + std::string(3073, 'c') + "\" was truncated to \"" +
                                        std::string(3072, 'c') +
                                        "\" because it exceeded the maximum size of 3072 characters"));
}

TEST(ReturnedStatus, ContextOf3072CharactersFillsItsColumn) {
  TEST_TraceCapture trace;
  TaskQueueElem request;
  request.context = String(std::string(3072, 'c').c_str());
  request.ReturnStatus(0);
  EXPECT_EQ(std::string(request.row.context, 3072), std::string(3072, 'c'));
  EXPECT_THAT(trace.texts(RAS1_ERROR), IsEmpty());
}

/// Makes UTF-8 the code page of this process's texts while it lives.
class Utf8Texts {
 public:
  Utf8Texts() { choose("C.UTF-8"); }
  ~Utf8Texts() { choose("C"); }

 private:
  static void choose(const char* locale) {
    if (setlocale(LC_CTYPE, locale) == nullptr) throw std::runtime_error(locale);
    String::initialize();
  }
};

TEST(ReturnedStatus, TextThatTakesMoreBytesThanUnitsKeepsItsTail) {
  const Utf8Texts utf8;
  TaskQueueElem request;
  request.retmsgparm = "caf\xc3\xa9 \xc3\xa9t\xc3\xa9.mdl";
  ASSERT_EQ(request.retmsgparm.length(), 12u);
  request.ReturnStatus(0);
  const std::string expected = "caf\xc3\xa9 \xc3\xa9t\xc3\xa9.mdl";
  EXPECT_EQ(std::string(request.row.retmsgparm, expected.size()), expected);
}

TEST(AsynchronousStatus, SleepsOneSecondBeforeEachEvent) {
  TEST_RecordedSleeps sleeps;
  TaskQueueElem request = sampleRequest();
  request.returnAsyncStatus(0);
  EXPECT_THAT(sleeps.seconds(), ElementsAre(1u));
  request.returnAsyncStatus(0);
  EXPECT_THAT(sleeps.seconds(), ElementsAre(1u, 1u));
}

TEST(AsynchronousStatus, WithoutTheStatusTableItIsDropped) {
  ASSERT_EQ(vmq_kagdyst_static_manager, nullptr);
  TEST_RecordedSleeps sleeps;
  TEST_TraceCapture trace;
  TaskQueueElem request = sampleRequest();
  request.retmsgid = "VMQ1024E";
  request.retmsgparm = "some command";
  request.returnAsyncStatus(1024);
  EXPECT_TRUE(
      trace.has(RAS1_DETAIL, "Returning aysnc status return code [1024], message id [VMQ1024E] parms [some command]"));
  EXPECT_THAT(trace.texts(RAS1_ERROR), IsEmpty());
  // The answer row belongs to the synchronous answer.
  EXPECT_EQ(rowOf(request), std::string(4196, '\0'));
}

}  // namespace

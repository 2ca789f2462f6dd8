// Every call that a command makes of the system and of the host fails at its first, second, ... time, one in each run.
// Whatever fails, the command is answered once, reported once, with a code that is documented for it and a reason in
// the trace; nothing is left behind, and the next command works.

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <cstring>
#include <filesystem>
#include <memory>

#include "mgmt/rows.h"
#include "test_seam.h"
#include "tests/faults/faults.h"
#include "tests/faults/machine.h"
#include "tests/support/eventually.h"
#include "tests/support/nothing_left_behind.h"
#include "tests/support/temporary_directory.h"

namespace {

using vmqhost::OpenRequest;
using vmqhost::RowBuffer;

template <class Row>
std::vector<Row> takeRows(RowBuffer& buffer) {
  std::vector<Row> rows;
  for (RowBuffer::Item item; item = buffer.take(std::chrono::milliseconds(0)), item.kind == RowBuffer::Item::kRow;) {
    rows.emplace_back();
    std::memcpy(&rows.back(), item.row.data(), sizeof(Row));
  }
  return rows;
}

template <size_t Width>
std::string textOf(const char (&column)[Width]) {
  const std::string text(column, Width);
  return text.substr(0, text.find_last_not_of(' ') + 1);
}

class EveryFault : public testing::TestWithParam<CommandCase> {
 protected:
  EveryFault() : home_(runningComponent()) {}

  /// False when the command does not make so many calls of the function.
  bool commandSurvives(const FailingFunction& function, int nth);

 private:
  void ask(const RequestDetail& request);
  void awaitReports(const Fault& fault);
  void checkReports(const FailingFunction& function, bool failed);
  void checkOutcome(const FailingFunction& function, int code, const std::string& message_id);
  [[nodiscard]] bool isDone() const;
  [[nodiscard]] size_t reportsDue() const;
  [[nodiscard]] size_t reportsAtMost() const;
  [[nodiscard]] bool errorIsTraced() const { return !trace_.texts(RAS1_ERROR).empty(); }

  InstallationHome& home_;
  TEST_RecordedSleeps sleeps_;
  TEST_TraceCapture trace_;
  std::vector<vmq_kagreqt_data_t> answers_;
  std::vector<vmq_kagdyst_data_t> reports_;
  RowBuffer rows_{1000};    // of the request
  RowBuffer events_{1000};  // of the watcher
};

void EveryFault::ask(const RequestDetail& request) {
  std::unique_ptr<OpenRequest> opened = OpenRequest::open(request, rows_);
  if (opened != nullptr) (void)opened->sample();  // a row that is lost is seen below
  opened.reset();
  const SparedThread spared;
  answers_ = takeRows<vmq_kagreqt_data_t>(rows_);
}

/// How many events are due, by what has come until now.
size_t EveryFault::reportsDue() const {
  if (!GetParam().queued || answers_.empty() || answers_[0].retval != 0) return 0;
  return GetParam().reports_twice && !reports_.empty() && reports_[0].retval == 0 ? 2 : 1;
}

size_t EveryFault::reportsAtMost() const {
  return GetParam().queued ? (GetParam().reports_twice ? 2 : 1) : 0;
}

/// Until all are there, or the fault has struck and what comes still is in the hands of the next command.
void EveryFault::awaitReports(const Fault& fault) {
  const SparedThread spared;
  EXPECT_TRUE(eventually([&] {
    for (const auto& row : takeRows<vmq_kagdyst_data_t>(events_)) reports_.push_back(row);
    return reports_.size() >= reportsDue() || fault.happened();
  })) << "no event";
}

bool EveryFault::commandSurvives(const FailingFunction& function, int nth) {
  SCOPED_TRACE(testing::Message() << GetParam().name << ": " << function << " fails at call " << nth);
  prepareMachine(home_);
  trace_.clear();
  reports_.clear();
  const NothingLeftBehind nothing;
  const RequestDetail watch = query("KAGDYST");
  const auto watcher = OpenRequest::open(watch, events_);
  const RequestDetail request = query("KAGREQT", GetParam().request);
  const RequestDetail next = query("KAGREQT", commandThatOnlyEnds("next"));
  bool failed = false;
  {
    const Fault fault(function, nth);
    ask(request);
    awaitReports(fault);
    failed = fault.happened();
  }
  const bool was_answered = answers_.size() == 1;
  const bool was_lost =
      failed && answers_.empty() && (function.effect == FailingFunction::kLosesRows || errorIsTraced());
  EXPECT_TRUE(was_answered || was_lost) << answers_.size() << " answers";
  const auto answers = answers_;

  ask(next);
  EXPECT_EQ(answers_.size(), 1u) << "the next command was not answered";
  // Commands are carried out in order: before this event comes everything of the command before.
  EXPECT_TRUE(eventually([&] {
    for (const auto& row : takeRows<vmq_kagdyst_data_t>(events_)) reports_.push_back(row);
    return !reports_.empty() && textOf(reports_.back().transid) == "next";
  })) << "the next command was not reported";
  if (!reports_.empty()) {
    EXPECT_EQ(reports_.back().retval, 0);
    reports_.pop_back();
  }
  answers_ = answers;
  checkReports(function, failed);
  return failed;
}

void EveryFault::checkReports(const FailingFunction& function, bool failed) {
  if (failed && function.effect == FailingFunction::kLosesRows) {
    EXPECT_LE(reports_.size(), reportsAtMost());
    EXPECT_TRUE(reports_.size() >= reportsDue() || !function.call || errorIsTraced()) << "lost without a trace";
  } else {
    EXPECT_EQ(reports_.size(), reportsDue());
  }
  if (!reports_.empty()) {
    checkOutcome(function, reports_.back().retval, textOf(reports_.back().retmsgid));
  } else if (!GetParam().queued && !answers_.empty()) {
    checkOutcome(function, answers_[0].retval, textOf(answers_[0].retmsgid));
  }
}

void EveryFault::checkOutcome(const FailingFunction& function, int code, const std::string& message_id) {
  if (code == 0) {
    EXPECT_TRUE(message_id.empty() || GetParam().odd_ids.count(message_id) == 1) << message_id;
    const bool may_be_undone = GetParam().goes_on || function.effect == FailingFunction::kIsTraced;
    EXPECT_TRUE(isDone() || (may_be_undone && errorIsTraced())) << "not done, but reported as done";
    return;
  }
  EXPECT_THAT(GetParam().failures, testing::Contains(code));
  EXPECT_TRUE(errorIsTraced()) << "no reason for " << code;
  EXPECT_TRUE(message_id == "VMQ" + std::to_string(code) + "E" || GetParam().odd_ids.count(message_id) == 1)
      << message_id << " for " << code;
}

bool EveryFault::isDone() const {
  for (const auto& [name, text] : GetParam().leaves) {
    const std::string path = home_.path() + "/" + name;
    if (!std::filesystem::exists(path) || readWholeFile(path) != atHome(home_, text)) return false;
  }
  return GetParam().context.empty() || (!answers_.empty() && textOf(answers_[0].context) == GetParam().context);
}

TEST_P(EveryFault, IsAnsweredAndReportedOnceWithItsReason) {
  for (const FailingFunction& function : failingFunctions()) {
    int nth = 1;
    while (commandSurvives(function, nth) && !HasFailure()) ++nth;
  }
}

TEST_P(EveryFault, OfMemoryIsSurvived) {
  // Thousands of allocations: the first ones each, then ever fewer.
  int nth = 1;
  while (commandSurvives(kAllocation, nth) && !HasFailure()) nth += 1 + nth / 16;
  EXPECT_GT(nth, 20);
}

INSTANTIATE_TEST_SUITE_P(Commands, EveryFault, testing::ValuesIn(commandCases()),
                         [](const auto& tested) { return std::string(tested.param.name); });

}  // namespace

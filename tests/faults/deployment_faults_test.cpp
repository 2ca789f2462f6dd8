// Every call that a command makes of the system and of the host fails at its first, second, ... time, one in each run.
// Whatever fails, the command is answered once, reported once, with a code that is documented for it and a reason in
// the trace; nothing is left behind, and the next command works.

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <algorithm>
#include <cstring>
#include <filesystem>
#include <map>
#include <memory>
#include <optional>

#include "mgmt/rows.h"
#include "test_seam.h"
#include "tests/faults/faults.h"
#include "tests/faults/machine.h"
#include "tests/support/eventually.h"
#include "tests/support/nothing_left_behind.h"
#include "tests/support/scoped_variable.h"
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
  EveryFault() : home_(runningComponent()) {
    if (isTraced()) levels_.emplace("KBB_RAS1", "error");
  }

  /// How often the function was failed: at its first call, at its second, until it is not called so often.
  int failEachCallOf(const FailingFunction& function);
  /// False when the command does not make so many calls of the function.
  bool commandSurvives(const FailingFunction& function, int nth);
  [[nodiscard]] bool hasTold(const FailingFunction& function) const;

 private:
  void ask(const RequestDetail& request);
  void awaitReports(const Fault& fault);
  void checkAnswer(const FailingFunction& function, bool failed);
  void checkReports(const FailingFunction& function, bool failed);
  void checkOutcome(const FailingFunction& function, bool failed, int code, const std::string& message_id,
                    const std::string& parameter);
  [[nodiscard]] bool isDone() const;
  [[nodiscard]] bool mayLoseAnswer(const FailingFunction& function) const;
  [[nodiscard]] bool mayLoseReport(const FailingFunction& function) const;
  [[nodiscard]] size_t reportsDue() const;
  [[nodiscard]] size_t reportsAtMost() const;
  [[nodiscard]] bool errorIsTraced() const { return !trace_.texts(RAS1_ERROR).empty(); }
  [[nodiscard]] bool isTraced() const { return !GetParam().harmless.empty(); }

  InstallationHome& home_;
  std::optional<ScopedVariable> levels_;
  TEST_RecordedSleeps sleeps_;
  TEST_TraceCapture trace_;
  std::vector<vmq_kagreqt_data_t> answers_;
  std::vector<vmq_kagdyst_data_t> reports_;
  std::map<std::string, std::set<std::string>> told_;  // function that failed, error lines
  RowBuffer rows_{1000};                               // of the request
  RowBuffer events_{1000};                             // of the watcher
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
  if (isTraced()) prepareLogs(home_);
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
  EXPECT_TRUE(answers_.size() == 1 || (answers_.empty() && failed && mayLoseAnswer(function)))
      << answers_.size() << " answers";
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
  // Not before: the command may have gone on after its fault had struck.
  if (failed) {
    for (const std::string& line : trace_.texts(RAS1_ERROR)) told_[function.name].insert(line);
  }
  answers_ = answers;
  checkAnswer(function, failed);
  checkReports(function, failed);
  return failed;
}

bool EveryFault::mayLoseAnswer(const FailingFunction& function) const {
  if (function.effect == FailingFunction::kLosesRow) return true;
  return function.effect == FailingFunction::kThrows &&
         (trace_.hasPrefix(RAS1_ERROR, "Exception while creating a request: ") ||
          trace_.hasPrefix(RAS1_ERROR, "Exception while answering a request: "));
}

bool EveryFault::mayLoseReport(const FailingFunction& function) const {
  if (function.effect == FailingFunction::kLosesRow) return true;
  if (function.effect == FailingFunction::kLosesEvent)
    return trace_.hasPrefix(RAS1_ERROR, "Event of table KAGDYST is lost, ");
  return function.effect == FailingFunction::kThrows && trace_.hasPrefix(RAS1_ERROR, "Exception while ");
}

/// A queued command has been accepted, whatever comes of it.
void EveryFault::checkAnswer(const FailingFunction& function, bool failed) {
  if (answers_.empty()) return;
  const vmq_kagreqt_data_t& answer = answers_[0];
  EXPECT_EQ(textOf(answer.transid), "t1");
  if (GetParam().queued) {
    EXPECT_EQ(answer.retval, 0);
    EXPECT_EQ(textOf(answer.retmsgid), "");
    EXPECT_EQ(textOf(answer.retmsgparm), "");
  } else {
    checkOutcome(function, failed, answer.retval, textOf(answer.retmsgid), textOf(answer.retmsgparm));
  }
}

void EveryFault::checkReports(const FailingFunction& function, bool failed) {
  if (failed && mayLoseReport(function)) {
    EXPECT_LE(reports_.size(), reportsAtMost());
  } else {
    EXPECT_EQ(reports_.size(), reportsDue());
  }
  for (size_t index = 0; index < reports_.size(); ++index) {
    const vmq_kagdyst_data_t& report = reports_[index];
    EXPECT_EQ(textOf(report.transid), "t1");
    if (index + 1 == reports_.size()) {
      checkOutcome(function, failed, report.retval, textOf(report.retmsgid), textOf(report.retmsgparm));
    } else {
      EXPECT_EQ(report.retval, 0);
      EXPECT_EQ(textOf(report.retmsgid), "");
    }
  }
}

void EveryFault::checkOutcome(const FailingFunction& function, bool failed, int code, const std::string& message_id,
                              const std::string& parameter) {
  const CommandCase& tested = GetParam();
  const bool as_if_nothing_failed = !failed || isTraced();
  if (as_if_nothing_failed) {
    EXPECT_EQ(code, tested.code);
  }
  if (code == 0) {
    EXPECT_EQ(tested.code, 0) << "a failure is reported as a success";
    EXPECT_TRUE(message_id.empty() || tested.odd_ids.count(message_id) == 1) << message_id;
    const bool may_be_undone =
        !as_if_nothing_failed && (tested.goes_on || function.effect == FailingFunction::kIsTraced);
    EXPECT_TRUE(isDone() || (may_be_undone && errorIsTraced())) << "not done, but reported as done";
    return;
  }
  EXPECT_TRUE(code == tested.code || tested.failures.count(code) == 1) << code;
  EXPECT_TRUE(errorIsTraced() || (code == tested.code && isDone())) << "no reason for " << code;
  EXPECT_TRUE(message_id == "VMQ" + std::to_string(code) + "E" || tested.odd_ids.count(message_id) == 1)
      << message_id << " for " << code;
  EXPECT_TRUE(tested.parameters.empty() ||
              std::any_of(tested.parameters.begin(), tested.parameters.end(),
                          [&](const std::string& expected) { return parameter == atHome(home_, expected); }))
      << parameter;
  if (as_if_nothing_failed && tested.code != 0) {
    EXPECT_TRUE(isDone()) << parameter;
  }
}

/// As when nothing fails.
bool EveryFault::isDone() const {
  const CommandCase& tested = GetParam();
  for (const auto& [name, text] : tested.leaves) {
    const std::string path = home_.path() + "/" + name;
    if (!std::filesystem::exists(path) || readWholeFile(path) != atHome(home_, text)) return false;
  }
  if (isTraced() && !childHasTraced(home_)) return false;
  if (tested.parameter.empty() && tested.context.empty()) return true;
  return !answers_.empty() && textOf(answers_[0].context) == tested.context &&
         textOf(answers_[0].retmsgparm) == atHome(home_, tested.parameter);
}

/// Whether the trace has told, when the function failed, what it must.
bool EveryFault::hasTold(const FailingFunction& function) const {
  const auto due = GetParam().tells.find(function.name);
  if (due == GetParam().tells.end()) return true;
  const std::string beginning = atHome(home_, due->second);
  const auto told = told_.find(function.name);
  return told != told_.end() && std::any_of(told->second.begin(), told->second.end(),
                                            [&](const std::string& line) { return line.starts_with(beginning); });
}

int EveryFault::failEachCallOf(const FailingFunction& function) {
  // What depends on how fast a child is may be called in one run and not in the next.
  constexpr int kTries = 10;
  int failed = 0;
  for (int tried = 0; failed == 0 && tried < (GetParam().calls.count(function.name) == 1 ? kTries : 1); ++tried) {
    while (commandSurvives(function, failed + 1) && !HasFailure()) ++failed;
    if (HasFailure()) break;
  }
  return failed;
}

TEST_P(EveryFault, IsAnsweredAndReportedOnceWithItsReason) {
  for (const FailingFunction& function : failingFunctions()) {
    if (!GetParam().harmless.empty() && GetParam().harmless.count(function.name) == 0) continue;
    const int failed = failEachCallOf(function);
    if (HasFailure()) return;
    EXPECT_TRUE(failed > 0 || GetParam().calls.count(function.name) == 0) << function << " was never failed";
    EXPECT_TRUE(hasTold(function)) << "without the line that is due when " << function << " fails";
  }
}

class EveryLackOfMemory : public EveryFault {};

TEST_P(EveryLackOfMemory, IsSurvived) {
  // Thousands of allocations: the first ones each, then ever fewer.
  int nth = 1;
  while (commandSurvives(kAllocation, nth) && !HasFailure()) nth += 1 + nth / 16;
  EXPECT_GT(nth, GetParam().allocations);
}

TEST(Faults, EachFunctionIsCalledBySomeCommandOrTheTransfer) {
  std::set<std::string> called = callsOfTheTransfer();
  for (const CommandCase& command : commandCases()) called.insert(command.calls.begin(), command.calls.end());
  for (const FailingFunction& function : failingFunctions()) {
    EXPECT_EQ(called.erase(function.name), 1u) << function << " can never be seen to fail";
  }
  EXPECT_THAT(called, testing::IsEmpty()) << "not in the table of functions";
}

std::string nameOf(const testing::TestParamInfo<CommandCase>& tested) {
  return tested.param.name;
}

std::vector<CommandCase> casesThatAllocate() {
  std::vector<CommandCase> cases = commandCases();
  std::erase_if(cases, [](const CommandCase& each) { return each.allocations == 0; });
  return cases;
}

INSTANTIATE_TEST_SUITE_P(Commands, EveryFault, testing::ValuesIn(commandCases()), nameOf);
INSTANTIATE_TEST_SUITE_P(Commands, EveryLackOfMemory, testing::ValuesIn(casesThatAllocate()), nameOf);

}  // namespace

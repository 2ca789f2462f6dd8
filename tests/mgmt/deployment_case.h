#pragma once
// A whole request as a case: what is asked, what the machine holds, what is run and what comes back. In every text "~"
// stands for the installation home. Expected context and message parameter may be longer than their columns, which hold
// their beginning.

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <map>
#include <ostream>
#include <string>
#include <vector>

#include "test_seam.h"
#include "tests/mgmt/running_component.h"
#include "tests/tasks/rows.h"

struct DeploymentCase {
  const char* situation;
  std::vector<RequestDetail::Predicate> request;
  std::map<std::string, std::string> tools = {};  ///< path in the home, body of the shell script
  std::map<std::string, std::string> files = {};  ///< path in the home, text
  std::vector<std::string> commands = {};         ///< the command lines run, in order
  AnswerRow answer = {};
  std::vector<StatusEvent> events = {};
  std::map<std::string, std::string> leaves = {};  ///< files afterwards: path in the home, text
  std::vector<std::string> absent = {};            ///< paths in the home where nothing may be afterwards
  std::vector<std::string> errors = {};            ///< among the lines traced at the error level
};

inline std::ostream& operator<<(std::ostream& out, const DeploymentCase& deployment) {
  return out << deployment.situation;
}

/// Runs cases on the component of this process.
class DeploymentRun : public testing::TestWithParam<DeploymentCase> {
 protected:
  DeploymentRun();
  void run(const DeploymentCase& deployment);
  /// With the installation home in place of each "~".
  [[nodiscard]] std::string atHome(std::string text) const;

  InstallationHome& home;
  TEST_RecordedSleeps sleeps;
  TEST_TraceCapture trace;

 private:
  void expectNothingMore(StatusEvents& events);
};

/// A request with a transaction id.
std::vector<RequestDetail::Predicate> asked(const std::string& command,
                                            std::vector<RequestDetail::Predicate> parameters);

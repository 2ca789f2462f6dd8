#pragma once
// A machine on which every command works, and what each of them leaves there when it has worked.

#include <map>
#include <ostream>
#include <set>
#include <string>
#include <vector>

#include "tests/mgmt/running_component.h"

/// One command. In every text "~" stands for the installation home.
struct CommandCase {
  const char* name;
  std::vector<RequestDetail::Predicate> request;
  std::set<int> failures;  ///< the codes that it may end with beside 0
  /// It goes on when its target cannot be looked up, or the stop before its start fails; the trace tells. On purpose.
  bool goes_on = false;
  bool queued = true;                              ///< its result comes as an event
  bool reports_twice = false;                      ///< before and after it is carried out
  std::map<std::string, std::string> leaves = {};  ///< path in the home, text
  std::string context = {};                        ///< of the answer
  std::set<std::string> odd_ids = {};              ///< message ids that go with other codes than theirs, on purpose
};

inline std::ostream& operator<<(std::ostream& out, const CommandCase& command) {
  return out << command.name;
}

const std::vector<CommandCase>& commandCases();

/// Sets the machine up as it is before the command.
void prepareMachine(const InstallationHome& home);

/// With the installation home in place of each "~".
std::string atHome(const InstallationHome& home, std::string text);

/// A command that does nothing but end, and leaves nothing.
std::vector<RequestDetail::Predicate> commandThatOnlyEnds(const std::string& transaction_id);

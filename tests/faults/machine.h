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
  std::set<int> failures;  ///< the codes that it may end with when something fails, beside its own
  /// It goes on when its target cannot be looked up, or the stop before its start fails; the trace tells. On purpose.
  bool goes_on = false;
  bool queued = true;                              ///< its result comes as an event
  bool reports_twice = false;                      ///< before and after it is carried out
  int code = 0;                                    ///< what it ends with when nothing fails
  std::string parameter = {};                      ///< of its message then
  std::set<std::string> parameters = {};           ///< those when something fails; none: they are not looked at
  std::map<std::string, std::string> leaves = {};  ///< path in the home, text
  std::string context = {};                        ///< of the answer
  std::set<std::string> odd_ids = {};              ///< message ids that go with other codes than theirs, on purpose
  /// The functions that it is sure to call: each of them must have been seen to fail.
  std::set<std::string> calls = {};
  int allocations = 0;  ///< and so many of these at least
  /// What the trace must tell when a function fails: function, how the line begins.
  std::map<std::string, std::string> tells = {};
  /// None: every function is failed. Otherwise only these, in a host that traces and wants its children to, and the
  /// command ends as if nothing had failed.
  std::set<std::string> harmless = {};
};

inline std::ostream& operator<<(std::ostream& out, const CommandCase& command) {
  return out << command.name;
}

const std::vector<CommandCase>& commandCases();

/// The functions that a push is sure to call.
const std::set<std::string>& callsOfTheTransfer();

/// Sets the machine up as it is before the command.
void prepareMachine(const InstallationHome& home);
/// As many logs of earlier children as are kept.
void prepareLogs(const InstallationHome& home);

/// Whether a child has traced to a log of its own.
bool childHasTraced(const InstallationHome& home);

/// With the installation home in place of each "~".
std::string atHome(const InstallationHome& home, std::string text);

/// A command that does nothing but end, and leaves nothing.
std::vector<RequestDetail::Predicate> commandThatOnlyEnds(const std::string& transaction_id);

#pragma once
// The verbs of the command line. Each routine adds its own.

#include <algorithm>
#include <functional>
#include <string>
#include <vector>

#include "apps/vmqctl/command_line.h"
#include "apps/vmqctl/settings.h"

namespace vmqctl {

struct DeclaredVerb {
  std::string name;
  Verb verb;
  unsigned defaultTimeoutSeconds;  ///< 0 for no limit
  /// Called when the command line has been read: returns what is to be done, or throws a Failure of usage before
  /// anything is connected.
  std::function<Action()> prepare;
};

/// Every verb that there is, in the order of the help.
class Verbs {
 public:
  explicit Verbs(CommandLine& line) : line_(line) {}

  Verb add(const std::string& name, const std::string& description, unsigned defaultTimeoutSeconds,
           std::function<Action()> prepare) {
    all_.push_back({name, line_.verb(name, description), defaultTimeoutSeconds, std::move(prepare)});
    return all_.back().verb;
  }

  std::vector<DeclaredVerb>& all() { return all_; }

  /// REQUIRES: there is one.
  [[nodiscard]] const DeclaredVerb& named(const std::string& name) const {
    return *std::find_if(all_.begin(), all_.end(), [&](const DeclaredVerb& each) { return each.name == name; });
  }

 private:
  CommandLine& line_;
  std::vector<DeclaredVerb> all_;
};

void addAgentVerbs(Verbs& verbs);    ///< start, stop, restart
void addProductVerbs(Verbs& verbs);  ///< install to set-da-config
void addPush(Verbs& verbs);
void addDeploy(Verbs& verbs);
void addInventory(Verbs& verbs);
void addQuery(Verbs& verbs);
void addWatch(Verbs& verbs);
void addStatus(Verbs& verbs);

}  // namespace vmqctl

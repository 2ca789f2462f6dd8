#pragma once
// The vocabulary of the tests that run commands through the runner.

#include <string>

#include "tests/process/child_fixture.h"
#include "util/util.h"

class CommandFixture : public ChildFixture {
 protected:
  struct Result {
    bool started;
    int rc;
    std::string out, err;
    bool operator==(const Result&) const = default;
  };

  static Result run(const std::string& command, const std::string& in = "", char** env = nullptr,
                    bool nonBlocking = false) {
    int rc = -1;
    VMQ::String out("old"), err("old");
    const bool started =
        VMQ::Util::runCommandEnv(command.c_str(), env, rc, out, err, VMQ::String(in.c_str()), nonBlocking);
    return {started, rc, out.toNarrow(), err.toNarrow()};
  }
  static Result success(const std::string& out, const std::string& err = "") { return {true, 0, out, err}; }

  /// An agent's control script, by its name.
  std::string agentScript(const std::string& body) {
    return directory.writeScript("CorvelAgent", "cd " + directory.path().string() + "\n" + body);
  }
};

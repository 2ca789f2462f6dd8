#pragma once
// What ends a command early: one sentence for the operator and what to do next. main() prints both.

#include <stdexcept>
#include <string>

#include "apps/vmqctl/exit_codes.h"

namespace vmqctl {

class Failure : public std::runtime_error {
 public:
  /// sentence and next end in "."; next may be empty. They are escaped when they are printed, not here.
  Failure(ExitCode code, const std::string& sentence, std::string next = "")
      : std::runtime_error(sentence), code_(code), next_(std::move(next)) {}

  [[nodiscard]] ExitCode code() const { return code_; }
  [[nodiscard]] const std::string& next() const { return next_; }

 private:
  ExitCode code_;
  std::string next_;
};

/// The connection was made and broke before the answer was whole: the daemon may have acted on the request.
class AnswerLost : public Failure {
 public:
  using Failure::Failure;
};

/// Thrown by waits. Whoever waits knows what was waited for and makes a Failure of it.
struct TimedOut {};
struct Interrupted {};

}  // namespace vmqctl

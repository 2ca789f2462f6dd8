#pragma once
// The calls of the component that can be made to fail, those of the system and those of the host.

#include <optional>
#include <ostream>
#include <string>
#include <vector>

#include "test_seam.h"
#include "tests/support/system_faults.h"

/// One function that fails.
struct FailingFunction {
  const char* name;
  std::optional<SystemCall> call;  ///< none: a service of the host
  int status = 0;                  ///< the errno value, or what the service returns
  /// What it does when it fails. Those of the first kind change the result.
  enum Effect {
    kFails,
    /// The trace tells that a program could not be executed, its input not be written or its output not be read, but
    /// the result is that of the program. On purpose.
    kIsTraced,
    kLosesEvent,  ///< an event is not delivered, and the trace tells
    kLosesRow,    ///< the answer or an event is not delivered, which is the host's to know
    kThrows       ///< an exception, which may end the answering or the delivery of an event; the trace tells
  } effect = kFails;
};

inline std::ostream& operator<<(std::ostream& out, const FailingFunction& function) {
  return out << function.name;
}

/// All but the allocations, of which there are too many to fail each.
const std::vector<FailingFunction>& failingFunctions();
extern const FailingFunction kAllocation;

/// While it lives, the n-th call of the function from now on fails, once. One at a time.
class Fault {
 public:
  Fault(const FailingFunction& function, int nth);
  [[nodiscard]] bool happened() const;

 private:
  std::optional<SystemFault> system_;
  std::optional<TEST_FailCall> service_;
};

#pragma once
// The component of this process as a host agent has it: started by its entry point, asked through its tables.

#include <memory>
#include <string>
#include <utility>
#include <vector>

#include "bxira.h"
#include "row_buffer.h"
#include "table_client.h"
#include "tests/tasks/installation_home.h"

inline constexpr char kNode[] = "node7";

/// Starts the component when this is its first use in the process, and returns its installation home, cleared. It stays
/// as long as the process.
InstallationHome& runningComponent();

/// A query on one of the component's tables. Predicates are "equal" unless an operator is given.
RequestDetail query(const std::string& table, const std::vector<RequestDetail::Predicate>& predicates = {});
RequestDetail::Predicate equal(const std::string& column, const std::string& value);

/// The rows that one query on the request table gives.
std::vector<std::string> ask(const std::vector<RequestDetail::Predicate>& predicates);

/// An open query on the status table.
class StatusEvents {
 public:
  explicit StatusEvents(const std::vector<RequestDetail::Predicate>& predicates = {});
  /// The next event's bytes; waits for it. Fails the test and gives an empty text when there is none for a long time.
  std::string next();
  /// The rows of sampling the table.
  std::vector<std::string> sample();
  /// True when nothing has arrived that was not taken.
  bool none();

 private:
  vmqhost::RowBuffer rows_{1000};
  std::unique_ptr<vmqhost::OpenRequest> request_;
};

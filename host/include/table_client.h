#pragma once
// The other side of the tables: how the process that owns the host library (daemon, tests) finds tables, asks queries
// and listens for events. The component does not use this header.
// Every function may be called from any thread; one OpenRequest belongs to one thread at a time.

#include <memory>
#include <string>
#include <vector>

#include "bxira.h"

namespace vmqhost {

struct ColumnDescription {
  std::string name;  ///< upper case
  ColumnInfo info;
};

struct TableDescription {
  std::string application;
  std::string table;
  std::vector<ColumnDescription> columns;
  unsigned row_bytes = 0;
};

/// The registered tables, in the order of registration.
std::vector<TableDescription> listTables();

/// The manager of a table, or null. Lives as long as the process.
TableManager* findTable(const std::string& application, const std::string& table);

/// What IRA_GetOriginnode returns from now on. REQUIRES: called before any request is opened.
void setOriginNode(const std::string& node);

/// An open request; closes it when destroyed.
class OpenRequest {
 public:
  /// Opens a request on a registered table; from the return on it receives the table's events. Null when there is no
  /// such table, a predicate's value is longer than 65535 bytes or holds a NUL, or the component could not create the
  /// request. `requester` outlives the request.
  static std::unique_ptr<OpenRequest> open(const RequestDetail& detail, RowRequester& requester);
  ~OpenRequest();
  OpenRequest(const OpenRequest&) = delete;
  OpenRequest& operator=(const OpenRequest&) = delete;

  /// Runs the table's sampling on the calling thread (it may take long) and dispatches the rows. Returns the status of
  /// the dispatch, or else that of an insertion that failed: rows are missing then.
  unsigned sample();

  [[nodiscard]] bxira& request() { return *request_; }

 private:
  OpenRequest(TableManager& manager, RowRequester& requester);
  TableManager& manager_;
  ContextInfo context_;
  std::unique_ptr<bxira> request_;
};

}  // namespace vmqhost

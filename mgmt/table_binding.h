#pragma once
// What the three tables have in common: their request objects, their managers and their registration. A table adds its
// row, its columns and its sampling.
//
// The framework calls request objects and managers from its own threads. No exception leaves a routine that it calls.

#include <cerrno>
#include <memory>
#include <new>

#include "bss1.h"
#include "bxira.h"
#include "mgmt/table_columns.h"
#include "table_manager.h"
#include "util/current_exception.h"
#include "util/trace.h"

namespace VMQ {

inline RAS1_Unit tableBindingUnit{"mgmt/table_binding"};

/// A request on one table. `Table` gives the row type `Row`, the `columns` and the `requestClass` name for the trace.
template <class Table>
class TableRequest : public bxira {
 public:
  using Row = typename Table::Row;
  using bxira::bxira;

  void PrintSelf() override;
  unsigned NumColumns() override { return static_cast<unsigned>(TableColumns(Table::columns).size()); }
  unsigned GetColumnInfo(ColumnInfo* info, int index) override { return describeColumn(Table::columns, info, index); }
  unsigned ColumnIsException(char* column, char* row, _IntfOper oper, char* value) override {
    return columnIsException(Table::columns, column, row, oper, value);
  }

  /// Inserts those of the rows that satisfy the request's predicates, up to the first failure. Returns the status of
  /// the last insertion, 0 when there was none.
  virtual unsigned AddData(Row* rows, int count);
};

/// The manager of one table: creates its request objects of class `Agent` and delivers events to them. `staticManager`
/// is the table's manager global, null until the table is registered.
template <class Agent, class Manager, Manager*& staticManager>
class TableBinding : public TableManager {
 public:
  using Row = typename Agent::Row;
  using TableManager::TableManager;

  /// A new request object, for the framework to destroy; null when it could not be made.
  bxira* CreateBxira(RequestDetail* detail, ContextInfo* context) override;

  /// Offers the rows to every open request of the table and dispatches what they take. Returns the last non-zero status
  /// of a dispatch, else 0; 0 also while the table is not registered. For any thread; delivery is serialised by the
  /// manager's lock.
  static unsigned EventArrived(Row* rows, int count);
  unsigned AddDataToEvent(Row* rows, int count);

 private:
  static unsigned deliver(Agent& request, Row* rows, int count);
};

/// Status of a table whose manager could not be made.
inline constexpr unsigned STATUS_NO_MANAGER = 0x21060002;

/// Makes the manager, which then lives as long as the process, and registers it.
template <class Manager>
unsigned registerTable(Manager*& staticManager, const char* application, const char* table) {
  const Trace trace(tableBindingUnit);
  staticManager = new (std::nothrow) Manager(application, table);
  return staticManager == nullptr ? STATUS_NO_MANAGER : TableManager::RegisterWithManager(staticManager);
}

/// Holds a framework lock while it lives, when it could be taken.
class HeldLock {
 public:
  explicit HeldLock(BSS1_Lock* lock) : lock_(lock), status_(BSS1_GetLock(lock)) {}
  ~HeldLock() {
    if (status_ == 0) (void)BSS1_ReleaseLock(lock_);  // held by this thread: nothing is left to do about a failure
  }
  HeldLock(const HeldLock&) = delete;
  HeldLock& operator=(const HeldLock&) = delete;

  [[nodiscard]] int status() const { return status_; }

 private:
  BSS1_Lock* const lock_;
  const int status_;
};

/// Makes a request the thread's current one while it lives.
class HeldHandle {
 public:
  explicit HeldHandle(RES1_Handle handle) : handle_(handle), status_(bxira::UseHandle(handle)) {}
  ~HeldHandle() {
    if (status_ == 0) (void)RES1_Drop(handle_);  // in use by the line above
  }
  HeldHandle(const HeldHandle&) = delete;
  HeldHandle& operator=(const HeldHandle&) = delete;

 private:
  const RES1_Handle handle_;
  const unsigned status_;
};

// ---- definitions -------------------------------------------------------------------------------------------------

template <class Table>
void TableRequest<Table>::PrintSelf() {
  const Trace trace(tableBindingUnit);
  const HeldLock lock(manager()->lock());  // an event would move the rows
  TRACE_DETAIL(trace, "%s @%p <%u,%u>\n", Table::requestClass, static_cast<void*>(this), handle(), manager()->handle());
  TRACE_DETAIL(trace, "\t::appl=%s,table=%s,interval=%d,samptype=%d\n", manager()->application(), manager()->table(),
               detail().interval_seconds, detail().sample_type);
  TRACE_DETAIL(trace, "\t_data {\n");
  TRACE_DETAIL(trace, "\t\tcount=%d, allocated=%d, allocSize=%d\n", static_cast<int>(row_count),
               static_cast<int>(allocatedRows()), static_cast<int>(allocatedBytes()));
  for (unsigned row = 0; row < row_count; ++row) traceRow(trace, Table::columns, waitingRows() + row * sizeof(Row));
  TRACE_DETAIL(trace, "}\n");
}

template <class Table>
unsigned TableRequest<Table>::AddData(Row* rows, int count) {
  const Trace trace(tableBindingUnit);
  unsigned status = 0;
  for (int row = 0; row < count && status == 0; ++row) {
    char* const bytes = reinterpret_cast<char*>(&rows[row]);
    if (CheckForException(bytes) == 0) continue;
    TRACE_DETAIL(trace, "Passing row %d to InsertRow().", row);
    status = InsertRow(bytes);
  }
  return status;
}

template <class Agent, class Manager, Manager*& staticManager>
bxira* TableBinding<Agent, Manager, staticManager>::CreateBxira(RequestDetail* detail, ContextInfo* context) {
  const Trace trace(tableBindingUnit);
  try {
    auto request = std::make_unique<Agent>(detail, context, this);
    request->TakeSampleConstructor();
    return request.release();
  } catch (...) {
    traceCurrentException(trace, "creating a request");
    return nullptr;
  }
}

template <class Agent, class Manager, Manager*& staticManager>
unsigned TableBinding<Agent, Manager, staticManager>::EventArrived(Row* rows, int count) {
  const Trace trace(tableBindingUnit);
  return staticManager == nullptr ? 0 : staticManager->AddDataToEvent(rows, count);
}

template <class Agent, class Manager, Manager*& staticManager>
unsigned TableBinding<Agent, Manager, staticManager>::AddDataToEvent(Row* rows, int count) {
  const Trace trace(tableBindingUnit);
  const HeldLock held(lock());
  if (held.status() != 0) {
    // Walking the list while another thread changes it could bring the host down; the event is the smaller loss.
    TRACE_ERROR(trace, "Event of table %s is lost, its lock could not be taken, return code %d", table(),
                held.status());
    return static_cast<unsigned>(held.status());
  }
  unsigned status = 0;
  LinkedListIter walk(requests);
  while (bxira* request = walk.next()) {
    const unsigned delivered = deliver(static_cast<Agent&>(*request), rows, count);
    if (delivered != 0) status = delivered;
  }
  return status;
}

template <class Agent, class Manager, Manager*& staticManager>
unsigned TableBinding<Agent, Manager, staticManager>::deliver(Agent& request, Row* rows, int count) {
  const Trace trace(tableBindingUnit);
  const HeldHandle current(request.handle());
  unsigned status = 0;
  try {
    (void)request.AddData(rows, count);  // rows that did get in are dispatched all the same
    status = request.Dispatch();
  } catch (...) {
    traceCurrentException(trace, "delivering an event");
    status = ENOMEM;
  }
  request.row_count = 0;
  return status;
}

}  // namespace VMQ

#pragma once
// One query on a table: the base class of the component's request objects.
//
// A request object is created by its table's manager (TableManager::CreateBxira), put on the manager's list of open
// requests, sampled when the requester asks for it, and destroyed by the framework when the requester closes it.

#include <atomic>
#include <cstdint>
#include <mutex>
#include <string>
#include <vector>

class TableManager;
struct BxiraAutomationCapsule;  ///< the framework's own; the component never looks inside

/// Operator of a predicate.
enum _IntfOper : uint32_t { INTF_EQ = 1, INTF_NE, INTF_LT, INTF_LE, INTF_GT, INTF_GE };

/// Description of one column, filled in by GetColumnInfo.
struct ColumnInfo {
  const char* attribute;  ///< static text, lower case; the column's name is its upper-case form
  uint32_t byte_offset;   ///< place in the row
  uint16_t byte_width;
  uint16_t type;  ///< COLUMN_CHARACTER or COLUMN_INTEGER
};
inline constexpr uint16_t COLUMN_INTEGER = 3;    ///< 32-bit signed, the machine's byte order, not aligned
inline constexpr uint16_t COLUMN_CHARACTER = 9;  ///< blank-padded, not terminated

/// One predicate as GetFilterInfo hands it out. Texts live as long as the request object.
struct FLT1_FILTERINFO {
  const char* column;     ///< upper case, terminated
  const char* value;      ///< the value as sent, unpadded; terminated for the framework's own use
  uint16_t value_length;  ///< bytes, terminator not counted
  _IntfOper oper;
};

/// Takes the rows that a request dispatches, one call at a time.
class RowRequester {
 public:
  virtual ~RowRequester() = default;
  /// Takes `count` rows of `row_bytes` each, valid during the call. Called with the table's lock held for events: it
  /// must not block and must not call the framework. Returns 0, or a status that Dispatch hands back.
  virtual unsigned rowsArrived(const char* rows, unsigned row_bytes, unsigned count) = 0;
};

/// What is asked for. Copied into the request object.
struct RequestDetail {
  struct Predicate {
    std::string column;  ///< upper case
    _IntfOper oper = INTF_EQ;
    std::string value;  ///< host code page; at most 65535 bytes, no NUL
  };
  std::string application;
  std::string table;
  int interval_seconds = 0;  ///< 0: sampled on demand
  int sample_type = 0;
  std::vector<Predicate> predicates;
};

/// For whom. Outlives the request object.
struct ContextInfo {
  RowRequester* requester = nullptr;
};

/// Names a request object for the handle calls; 0 is no handle.
typedef uint32_t RES1_Handle;

/// Gives back one use of a handle. Returns 0, or ENOENT for a handle that is not in use.
unsigned RES1_Drop(RES1_Handle handle);

/// The node name of this host agent. Static text, set once by the process that owns the host library; empty before.
const char* IRA_GetOriginnode();

class bxira {
 public:
  bxira(RequestDetail* detail, ContextInfo* context, TableManager* manager);

  // The order of the virtual operations is part of the interface.
  virtual void PrintSelf() = 0;
  virtual void TakeSample() = 0;
  virtual unsigned NumColumns() = 0;
  virtual unsigned GetColumnInfo(ColumnInfo* info, int index) = 0;
  virtual unsigned ExecuteCommand(char* command, int length, char* reply);  ///< none here: returns ENOSYS
  virtual ~bxira();
  /// Puts a copy of the row among the rows waiting for Dispatch. Returns 0, or ENOMEM.
  virtual unsigned InsertRow(char* row);
  /// Non-zero when the row satisfies every predicate of the request.
  virtual unsigned CheckForException(char* row);
  /// Non-zero when the named column of the row satisfies one predicate.
  virtual unsigned ColumnIsException(char* column, char* row, _IntfOper oper, char* value) = 0;
  virtual void CommandCompleted(BxiraAutomationCapsule* capsule);

  bxira(const bxira&) = delete;
  bxira& operator=(const bxira&) = delete;

  /// The next predicate, in the order sent, with 0; non-zero after the last one, and the next call starts over.
  unsigned GetFilterInfo(FLT1_FILTERINFO* info);

  /// Compares a character column of `width` bytes with a value, as unsigned bytes: both blank-padded, the value cut at
  /// the width. Zero bytes at the end of a column, as in one that was never filled in, count as padding.
  static unsigned IsException(_IntfOper oper, const char* text, unsigned width, const char* value);
  /// Compares an integer column with a value in decimal text. A value that is no 32-bit number from its first character
  /// to its last matches nothing.
  static unsigned IsException(_IntfOper oper, int32_t number, const char* value);

  /// Hands the waiting rows to the requester; does nothing (and returns 0) when none wait. Returns the requester's
  /// status, ENOTCONN when there is no requester, or EIO when it threw. No row waits afterwards, delivered or not.
  unsigned Dispatch();

  /// The status of an insertion that has failed since the last call, 0 when none has: what was dispatched is then not
  /// all there was.
  unsigned takeInsertionFailure();

  /// Makes the request with this handle the calling thread's current one and counts a use. Returns 0 or ENOENT.
  static unsigned UseHandle(RES1_Handle handle);
  /// What the calling thread has made current and not dropped since; 0 when there is nothing.
  static RES1_Handle CurrentHandle();
  [[nodiscard]] RES1_Handle handle() const { return handle_; }

  [[nodiscard]] const RequestDetail& detail() const { return detail_; }
  [[nodiscard]] TableManager* manager() const { return manager_; }
  [[nodiscard]] unsigned allocatedRows() const;
  [[nodiscard]] unsigned allocatedBytes() const;
  [[nodiscard]] const char* waitingRows() const;  ///< REQUIRES: no other thread inserts or dispatches meanwhile

  /// Rows waiting for Dispatch. For display: event delivery sets it back to 0 after each event, but a row that another
  /// thread has inserted meanwhile still waits.
  std::atomic<unsigned> row_count{0};

 private:
  unsigned rowBytes();
  unsigned insert(const char* row);

  const RequestDetail detail_;
  ContextInfo* const context_;
  TableManager* const manager_;
  RES1_Handle handle_;
  size_t next_predicate_ = 0;  // one thread at a time: construction, then the sampling thread
  mutable std::mutex rows_mutex_;
  std::vector<char> rows_;  // guarded by rows_mutex_, like what follows
  unsigned waiting_ = 0;
  unsigned insertion_failure_ = 0;
};

#pragma once
// A small table of the tests' own: NAME (9 bytes), COUNT (an integer that is not aligned), NOTE (3 bytes).

#include <atomic>
#include <cstring>
#include <functional>
#include <string>
#include <vector>

#include "bxira.h"
#include "table_manager.h"

inline constexpr unsigned kSampleRowBytes = 16;

/// A row, padded as the table has it.
inline std::string sampleRow(const std::string& name, int32_t count, const std::string& note) {
  std::string row(kSampleRowBytes, ' ');
  row.replace(0, name.size(), name);
  std::memcpy(&row[9], &count, sizeof count);
  row.replace(13, note.size(), note);
  return row;
}

class SampleManager;

class SampleRequest : public bxira {
 public:
  using bxira::bxira;

  void PrintSelf() override {}
  void TakeSample() override;
  unsigned NumColumns() override { return 3; }
  unsigned GetColumnInfo(ColumnInfo* info, int index) override {
    static constexpr ColumnInfo kColumns[] = {
        {"name", 0, 9, COLUMN_CHARACTER}, {"count", 9, 4, COLUMN_INTEGER}, {"note", 13, 3, COLUMN_CHARACTER}};
    *info = kColumns[index];
    return 0;
  }
  unsigned ColumnIsException(char* column, char* row, _IntfOper oper, char* value) override {
    const std::string name = column;
    if (name == "NAME") return IsException(oper, row, 9, value);
    if (name == "NOTE") return IsException(oper, row + 13, 3, value);
    if (name != "COUNT") return 0;
    int32_t count;
    std::memcpy(&count, row + 9, sizeof count);
    return IsException(oper, count, value);
  }

  /// Inserts the row when it satisfies the request.
  unsigned offer(std::string row) { return CheckForException(row.data()) == 0 ? 0 : InsertRow(row.data()); }
};

class SampleManager : public TableManager {
 public:
  explicit SampleManager(const std::string& table) : TableManager("TEST", table.c_str()) {}

  /// A manager that lives as long as the process, registered. Its table's name begins so and is its own, also when the
  /// test runs again.
  static SampleManager& registered(const std::string& name) {
    static std::atomic<unsigned> number = 0;
    auto& manager = *new SampleManager(name + std::to_string(++number));
    RegisterWithManager(&manager);
    return manager;
  }

  bxira* CreateBxira(RequestDetail* detail, ContextInfo* context) override {
    if (refuse) return nullptr;
    return new SampleRequest(detail, context, this);
  }

  /// Offers a row to every open request and dispatches it, as a table delivers an event.
  unsigned deliver(const std::string& row) {
    unsigned status = 0;
    BSS1_GetLock(lock());
    LinkedListIter walk(requests);
    while (bxira* const each = walk.next()) {
      (void)static_cast<SampleRequest*>(each)->offer(row);
      if (const unsigned dispatched = each->Dispatch()) status = dispatched;
      each->row_count = 0;
    }
    BSS1_ReleaseLock(lock());
    return status;
  }

  bool refuse = false;                                 ///< CreateBxira gives nothing
  std::vector<std::string> sample;                     ///< what TakeSample offers
  std::function<void(SampleRequest&)> while_sampling;  ///< called by TakeSample
};

inline void SampleRequest::TakeSample() {
  auto& table = static_cast<SampleManager&>(*manager());
  if (table.while_sampling) table.while_sampling(*this);
  for (const std::string& row : table.sample) (void)offer(row);
}

/// Keeps what it gets.
class Collector : public RowRequester {
 public:
  unsigned rowsArrived(const char* arrived, unsigned row_bytes, unsigned count) override {
    ++calls;
    for (unsigned i = 0; i < count; ++i) rows.emplace_back(arrived + size_t{i} * row_bytes, row_bytes);
    return status;
  }

  std::vector<std::string> rows;
  unsigned calls = 0;
  unsigned status = 0;  ///< what it answers
};

inline RequestDetail sampleDetail(const std::string& table, std::vector<RequestDetail::Predicate> predicates = {}) {
  RequestDetail detail;
  detail.application = "TEST";
  detail.table = table;
  detail.predicates = std::move(predicates);
  return detail;
}

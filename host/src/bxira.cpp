// One query on a table: its predicates, its waiting rows and their dispatch.

#include "bxira.h"

#include <algorithm>
#include <cerrno>
#include <new>
#include <utility>

#include "handles.h"
#include "seam.h"

namespace {

constexpr size_t kLongestValue = UINT16_MAX;  // its length is handed out in 16 bits

RequestDetail checkedCopy(const RequestDetail* detail) {
  if (detail == nullptr) return {};
  RequestDetail copy = *detail;
  for (auto& predicate : copy.predicates) predicate.value.resize(std::min(predicate.value.size(), kLongestValue));
  return copy;
}

}  // namespace

bxira::bxira(RequestDetail* detail, ContextInfo* context, TableManager* manager)
    : detail_(checkedCopy(detail)), context_(context), manager_(manager), handle_(vmqhost::newHandle()) {}

bxira::~bxira() {
  vmqhost::retireHandle(handle_);
}

unsigned bxira::ExecuteCommand(char*, int, char*) {
  return ENOSYS;
}

void bxira::CommandCompleted(BxiraAutomationCapsule*) {}

unsigned bxira::GetFilterInfo(FLT1_FILTERINFO* info) {
  if (info == nullptr) return EINVAL;
  if (next_predicate_ == detail_.predicates.size()) {
    next_predicate_ = 0;
    return ENOENT;
  }
  const RequestDetail::Predicate& predicate = detail_.predicates[next_predicate_++];
  *info = {predicate.column.c_str(), predicate.value.c_str(), static_cast<uint16_t>(predicate.value.size()),
           predicate.oper};
  return 0;
}

unsigned bxira::CheckForException(char* row) {
  return std::all_of(detail_.predicates.begin(), detail_.predicates.end(), [&](const RequestDetail::Predicate& each) {
    // The interface takes writable texts, but nobody writes to them.
    return ColumnIsException(const_cast<char*>(each.column.c_str()), row, each.oper,
                             const_cast<char*>(each.value.c_str())) != 0;
  });
}

unsigned bxira::rowBytes() {
  unsigned bytes = 0;
  const unsigned columns = NumColumns();
  for (unsigned index = 0; index < columns; ++index) {
    ColumnInfo column{};
    if (GetColumnInfo(&column, static_cast<int>(index)) == 0) {
      bytes = std::max(bytes, column.byte_offset + column.byte_width);
    }
  }
  return bytes;
}

unsigned bxira::InsertRow(char* row) {
  const unsigned status = insert(row);
  if (status != 0) {
    const std::lock_guard held(rows_mutex_);
    insertion_failure_ = status;
  }
  return status;
}

unsigned bxira::insert(const char* row) try {
  if (int status; vmqhost::seam::fails("InsertRow", &status)) return static_cast<unsigned>(status);
  if (row == nullptr) return EINVAL;
  const unsigned bytes = rowBytes();
  const std::lock_guard held(rows_mutex_);
  rows_.insert(rows_.end(), row, row + bytes);
  row_count = ++waiting_;
  return 0;
} catch (const std::bad_alloc&) {
  return ENOMEM;
}

unsigned bxira::Dispatch() try {
  const unsigned bytes = rowBytes();
  const std::lock_guard held(rows_mutex_);  // also keeps batches in order
  const unsigned count = std::exchange(waiting_, 0);
  const std::vector<char> rows = std::exchange(rows_, {});
  row_count = 0;
  if (int status; vmqhost::seam::fails("Dispatch", &status)) return static_cast<unsigned>(status);
  if (count == 0) return 0;
  if (context_ == nullptr || context_->requester == nullptr) return ENOTCONN;
  return context_->requester->rowsArrived(rows.data(), bytes, count);
} catch (...) {
  return EIO;
}

unsigned bxira::takeInsertionFailure() {
  const std::lock_guard held(rows_mutex_);
  return std::exchange(insertion_failure_, 0);
}

unsigned bxira::allocatedRows() const {
  const std::lock_guard held(rows_mutex_);
  return waiting_ == 0 ? 0 : static_cast<unsigned>(rows_.capacity() / (rows_.size() / waiting_));
}

unsigned bxira::allocatedBytes() const {
  const std::lock_guard held(rows_mutex_);
  return static_cast<unsigned>(rows_.capacity());
}

const char* bxira::waitingRows() const {
  return rows_.data();
}

// A bounded buffer of rows.

#include "row_buffer.h"

#include <algorithm>
#include <cerrno>
#include <new>
#include <utility>

namespace vmqhost {

unsigned RowBuffer::rowsArrived(const char* rows, unsigned row_bytes, unsigned count) {
  const std::lock_guard held(mutex_);
  if (closed_) return 0;
  unsigned status = 0;
  for (unsigned index = 0; index < count; ++index) {
    if (keep(rows + size_t{index} * row_bytes, row_bytes)) continue;
    ++lost_at_end_;
    status = ENOBUFS;
  }
  changed_.notify_all();
  return status;
}

bool RowBuffer::keep(const char* row, unsigned row_bytes) {
  if (rows_ == maximum_rows_) return false;
  try {
    Item item{Item::kRow, std::string(row, row_bytes), 0};
    if (lost_at_end_ > 0) {
      items_.push_back({Item::kLost, {}, lost_at_end_});
      lost_at_end_ = 0;
    }
    items_.push_back(std::move(item));
    ++rows_;
    return true;
  } catch (const std::bad_alloc&) {
    return false;
  }
}

RowBuffer::Item RowBuffer::take(std::chrono::milliseconds timeout) {
  using namespace std::chrono_literals;
  std::unique_lock held(mutex_);
  const auto something = [this] { return !items_.empty() || lost_at_end_ > 0 || closed_; };
  // Cut, because a deadline computed from milliseconds::max() would lie in the past.
  if (!changed_.wait_for(held, std::min<std::chrono::milliseconds>(timeout, 1000h), something)) return {};
  if (!items_.empty()) {
    Item item = std::move(items_.front());
    items_.pop_front();
    if (item.kind == Item::kRow) --rows_;
    return item;
  }
  if (lost_at_end_ > 0) return {Item::kLost, {}, std::exchange(lost_at_end_, 0)};
  return {Item::kClosed, {}, 0};
}

void RowBuffer::close() {
  const std::lock_guard held(mutex_);
  closed_ = true;
  changed_.notify_all();
}

}  // namespace vmqhost

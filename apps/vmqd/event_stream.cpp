// One watcher.

#include "apps/vmqd/event_stream.h"

#include <poll.h>
#include <sys/eventfd.h>

#include <algorithm>
#include <cerrno>
#include <cstring>
#include <stdexcept>
#include <utility>

#include "apps/vmqd/json_text.h"
#include "apps/vmqd/log.h"
#include "apps/vmqd/refusal.h"

namespace vmqd {
namespace {

using Item = vmqhost::RowBuffer::Item;

void appendEvent(std::string& out, std::string_view name, const std::string& data) {
  out.append("event: ").append(name).append("\ndata: ").append(data).append("\n\n");
}

std::unique_ptr<vmqhost::OpenRequest> openRequest(const Predicates& predicates, RowRequester& requester) {
  auto request = vmqhost::OpenRequest::open(predicates.request(), requester);
  if (!request) throw Refusal(errors::internal, "The table could not be watched.");
  return request;
}

}  // namespace

PolledRowBuffer::PolledRowBuffer(unsigned maximum_rows)
    : rows_(maximum_rows), arrivals_(eventfd(0, EFD_NONBLOCK | EFD_CLOEXEC)) {
  if (!arrivals_) throw std::runtime_error(withReason("no event descriptor", errno));
}

unsigned PolledRowBuffer::rowsArrived(const char* rows, unsigned row_bytes, unsigned count) {
  const unsigned status = rows_.rowsArrived(rows, row_bytes, count);
  (void)eventfd_write(arrivals_.get(), 1);  // fails only where the counter is full, and then it is readable
  return status;
}

Item PolledRowBuffer::take() {
  eventfd_t ignored;
  (void)eventfd_read(arrivals_.get(), &ignored);  // before looking, so that what arrives later is announced anew
  return rows_.take(std::chrono::milliseconds(0));
}

EventStream::EventStream(const Predicates& predicates, const Settings& settings, WatcherSlots::Slot slot)
    : table_(predicates.table()),
      settings_(settings),
      slot_(std::move(slot)),
      rows_(settings.buffer_rows),
      request_(openRequest(predicates, rows_)) {
  std::string data = "{\"table\":";
  appendJsonString(data, table_.description.table);
  appendEvent(text_, "open", data + "}");
}

size_t EventStream::read(char* buffer, size_t capacity) {
  if (taken_ == text_.size()) {
    taken_ = 0;
    text_.clear();
    do {
      collect(capacity);
    } while (text_.empty() && wait());
  }
  const size_t count = std::min(capacity, text_.size() - taken_);
  std::memcpy(buffer, text_.data() + taken_, count);
  taken_ += count;
  return count;
}

void EventStream::collect(size_t wanted) {
  while (text_.size() < wanted && append(rows_.take())) {
  }
}

bool EventStream::append(const Item& item) {
  std::string data;
  switch (item.kind) {
    case Item::kRow:
      table_.rows.append(data, item.row.data());
      appendEvent(text_, "row", data);
      return true;
    case Item::kLost:
      data = "{\"rows\":";
      appendJsonNumber(data, static_cast<long long>(item.lost));
      appendEvent(text_, "lost", data + "}");
      return true;
    default:
      return false;
  }
}

bool EventStream::wait() {
  // Of the connection only the hang-up, which is always told: a client may send on, or have ended its sending.
  pollfd watched[] = {{rows_.descriptor(), POLLIN, 0}, {settings_.stop, POLLIN, 0}, {settings_.client, 0, 0}};
  const int ready = poll(watched, std::size(watched), static_cast<int>(settings_.keep_alive.count()));
  if (ready < 0) return errno == EINTR;
  if (ready == 0) text_ = ": keep-alive\n\n";
  return watched[1].revents == 0 && watched[2].revents == 0;
}

}  // namespace vmqd

// Reads a text/event-stream.

#include "apps/vmqctl/event_stream_parser.h"

namespace vmqctl {

bool EventStreamParser::feed(std::string_view piece) {
  for (const char c : piece) {
    if (tooLong_) return false;
    const bool secondHalfOfLineEnd = c == '\n' && afterReturn_;
    afterReturn_ = c == '\r';
    if (secondHalfOfLineEnd) continue;
    if (c == '\n' || c == '\r') {
      endLine();
    } else {
      line_ += c;
      tooLong_ = line_.size() + data_.size() > maximumEventBytes;
    }
  }
  return !tooLong_;
}

std::optional<ServerSentEvent> EventStreamParser::take() {
  if (events_.empty()) return std::nullopt;
  ServerSentEvent event = std::move(events_.front());
  events_.pop_front();
  return event;
}

void EventStreamParser::endLine() {
  std::string_view line = line_;
  constexpr std::string_view byteOrderMark = "\xEF\xBB\xBF";
  if (atStart_ && line.substr(0, byteOrderMark.size()) == byteOrderMark) line.remove_prefix(byteOrderMark.size());
  atStart_ = false;

  if (line.empty()) {
    dispatch();
  } else if (line.front() != ':') {  // a comment keeps the connection alive, no more
    const std::size_t colon = line.find(':');
    const std::string_view field = line.substr(0, colon);
    std::string_view value = colon == std::string_view::npos ? "" : line.substr(colon + 1);
    if (!value.empty() && value.front() == ' ') value.remove_prefix(1);
    if (field == "event") {
      name_ = value;
    } else if (field == "data") {
      if (hasData_) data_ += '\n';
      data_ += value;
      hasData_ = true;
    }
  }
  line_.clear();
}

void EventStreamParser::dispatch() {
  if (hasData_) events_.push_back({name_.empty() ? "message" : name_, data_});
  name_.clear();
  data_.clear();
  hasData_ = false;
}

}  // namespace vmqctl

#include "tests/mgmt/running_component.h"

#include <gtest/gtest.h>

#include <chrono>

#include "mgmt/initialize.h"

using std::chrono::milliseconds;
using vmqhost::OpenRequest;
using vmqhost::RowBuffer;

namespace {

std::vector<std::string> takeAll(RowBuffer& rows) {
  std::vector<std::string> taken;
  for (;;) {
    RowBuffer::Item item = rows.take(milliseconds(0));
    if (item.kind != RowBuffer::Item::kRow) return taken;
    taken.push_back(std::move(item.row));
  }
}

}  // namespace

InstallationHome& runningComponent() {
  static const std::unique_ptr<InstallationHome> home = [] {
    vmqhost::setOriginNode(kNode);
    auto made = std::make_unique<InstallationHome>();
    Initialize_Mgmt_Functions();
    return made;
  }();
  home->clear();
  return *home;
}

RequestDetail query(const std::string& table, const std::vector<RequestDetail::Predicate>& predicates) {
  RequestDetail detail;
  detail.application = "VMQ";
  detail.table = table;
  detail.predicates = predicates;
  return detail;
}

RequestDetail::Predicate equal(const std::string& column, const std::string& value) {
  return {column, INTF_EQ, value};
}

std::vector<std::string> ask(const std::vector<RequestDetail::Predicate>& predicates) {
  RowBuffer rows(1000);
  const auto request = OpenRequest::open(query("KAGREQT", predicates), rows);
  if (!request) throw std::logic_error("the request table could not be asked");
  EXPECT_EQ(request->sample(), 0u);
  return takeAll(rows);
}

StatusEvents::StatusEvents(const std::vector<RequestDetail::Predicate>& predicates)
    : request_(OpenRequest::open(query("KAGDYST", predicates), rows_)) {
  if (!request_) throw std::logic_error("the status table could not be asked");
}

std::string StatusEvents::next() {
  RowBuffer::Item item = rows_.take(std::chrono::minutes(1));
  if (item.kind == RowBuffer::Item::kRow) return item.row;
  ADD_FAILURE() << "no status event arrived";
  return {};
}

std::vector<std::string> StatusEvents::sample() {
  EXPECT_TRUE(none());
  EXPECT_EQ(request_->sample(), 0u);
  return takeAll(rows_);
}

bool StatusEvents::none() {
  return takeAll(rows_).empty();
}

// Asking tables: what the process that owns the host library does with them.

#include "table_client.h"

#include <algorithm>
#include <atomic>

#include "environment.h"
#include "lock.h"
#include "table_manager.h"
#include "table_registry.h"

namespace vmqhost {

namespace {

std::atomic<const char*> originNode = "";

std::string upperCase(std::string text) {
  for (char& c : text) {
    if (c >= 'a' && c <= 'z') c = static_cast<char>(c - 'a' + 'A');
  }
  return text;
}

/// Columns are described by request objects, so one is made for it.
TableDescription describe(TableManager& manager) {
  TableDescription description{manager.application(), manager.table(), {}, 0};
  RequestDetail detail;
  detail.application = description.application;
  detail.table = description.table;
  ContextInfo context;
  const std::unique_ptr<bxira> request(manager.CreateBxira(&detail, &context));
  if (!request) return description;
  const unsigned columns = request->NumColumns();
  for (unsigned index = 0; index < columns; ++index) {
    ColumnInfo info{};
    if (request->GetColumnInfo(&info, static_cast<int>(index)) != 0 || info.attribute == nullptr) continue;
    description.columns.push_back({upperCase(info.attribute), info});
    description.row_bytes = std::max(description.row_bytes, info.byte_offset + info.byte_width);
  }
  return description;
}

bool acceptable(const RequestDetail& detail) {
  return std::all_of(detail.predicates.begin(), detail.predicates.end(), [](const RequestDetail::Predicate& each) {
    return each.value.size() <= UINT16_MAX && each.value.find('\0') == std::string::npos;
  });
}

}  // namespace

std::vector<TableDescription> listTables() {
  std::vector<TableDescription> descriptions;
  for (TableManager* const manager : registeredTables()) descriptions.push_back(describe(*manager));
  return descriptions;
}

void setOriginNode(const std::string& node) {
  originNode.store(keptText(node.c_str()), std::memory_order_release);
}

OpenRequest::OpenRequest(TableManager& manager, RowRequester& requester) : manager_(manager), context_{&requester} {}

std::unique_ptr<OpenRequest> OpenRequest::open(const RequestDetail& detail, RowRequester& requester) {
  TableManager* const manager = findTable(detail.application, detail.table);
  if (manager == nullptr || !acceptable(detail)) return nullptr;
  std::unique_ptr<OpenRequest> opened(new OpenRequest(*manager, requester));
  RequestDetail copy = detail;
  opened->request_.reset(manager->CreateBxira(&copy, &opened->context_));
  if (!opened->request_) return nullptr;
  const LockScope held(*manager->lock());
  manager->requests.append(opened->request_.get());
  return opened;
}

OpenRequest::~OpenRequest() {
  if (!request_) return;
  const LockScope held(*manager_.lock());
  manager_.requests.remove(request_.get());
}

unsigned OpenRequest::sample() {
  const RES1_Handle handle = request_->handle();
  (void)bxira::UseHandle(handle);  // exists as long as the request
  request_->TakeSample();
  const unsigned dispatched = request_->Dispatch();
  const unsigned inserted = request_->takeInsertionFailure();
  (void)RES1_Drop(handle);
  return dispatched != 0 ? dispatched : inserted;
}

}  // namespace vmqhost

const char* IRA_GetOriginnode() {
  return vmqhost::originNode.load(std::memory_order_acquire);
}

// A component for the daemon's tests: tables that do what a test tells them to, all with the same columns.
//   ECHO   answers with COUNT rows (one without it) that repeat the query's TEXT, numbered by NUMBER from 0 (or with
//   the
//          query's NUMBER when there is no COUNT); BYTES tells what TEXT asks for, see tell()
//   GATE   opens the FIFO named by BYTES for reading, waits for its end and answers with one row
//   EVENTS a query sends COUNT events, numbered by NUMBER, with its TEXT; whatever is open on the table gets those that
//          pass its predicates, and so the query answers with them too
//   FAILS  TEXT=create: no request can be opened; TEXT=sample: the sampling throws; TEXT=insert: a row cannot be
//          inserted
// And the interface 5a000000-0000-0000-0000-000000000001, version 3, with the operations
//   0 replies with the sender's label, a blank and the request
//   1 raises the fault whose decimal number the request is
//   2 throws
//   3 opens the FIFO named by the request for reading, waits for its end and replies "passed"
// The environment variable TEST_STATUS is what the entry point returns.

#include <fcntl.h>
#include <unistd.h>

#include <algorithm>
#include <cstdlib>
#include <cstring>
#include <stdexcept>
#include <string>

#include "bss1.h"
#include "bxira.h"
#include "linked_list.h"
#include "rpc.h"
#include "table_manager.h"

namespace {

struct Row {
  char text[64];
  int32_t number;
  char bytes[128];
  int32_t count;
};
static_assert(sizeof(Row) == 200);

constexpr ColumnInfo columns[] = {
    {"text", 0, 64, COLUMN_CHARACTER},
    {"number", 64, 4, COLUMN_INTEGER},
    {"bytes", 68, 128, COLUMN_CHARACTER},
    {"count", 196, 4, COLUMN_INTEGER},
};

void pad(char* column, size_t width, const std::string& value) {
  std::memset(column, ' ', width);
  std::memcpy(column, value.data(), std::min(width, value.size()));
}

class TestRequest : public bxira {
 public:
  using Sampling = void (*)(TestRequest&);

  TestRequest(RequestDetail* detail, ContextInfo* context, TableManager* manager, Sampling sampling)
      : bxira(detail, context, manager), sampling_(sampling) {}

  void PrintSelf() override {}
  void TakeSample() override { sampling_(*this); }
  unsigned NumColumns() override { return std::size(columns); }
  unsigned GetColumnInfo(ColumnInfo* info, int index) override {
    *info = columns[index];
    return 0;
  }
  unsigned ColumnIsException(char* column, char* row, _IntfOper oper, char* value) override {
    const auto* const cells = reinterpret_cast<const Row*>(row);
    const std::string name(column);
    if (name == "TEXT") return IsException(oper, cells->text, sizeof cells->text, value);
    if (name == "BYTES") return IsException(oper, cells->bytes, sizeof cells->bytes, value);
    return IsException(oper, name == "NUMBER" ? cells->number : cells->count, value);
  }

  [[nodiscard]] std::string predicate(const std::string& column) const {
    std::string value;
    for (const auto& each : detail().predicates) {
      if (each.column == column) value = each.value;
    }
    return value;
  }
  [[nodiscard]] int number(const std::string& column, int otherwise) const {
    const std::string text = predicate(column);
    return text.empty() ? otherwise : std::atoi(text.c_str());
  }
  void insert(Row row) { (void)InsertRow(reinterpret_cast<char*>(&row)); }
  void insertMatching(Row row) {
    if (CheckForException(reinterpret_cast<char*>(&row)) != 0) insert(row);
  }

 private:
  const Sampling sampling_;
};

class TestManager : public TableManager {
 public:
  TestManager(const char* table, TestRequest::Sampling sampling) : TableManager("TEST", table), sampling_(sampling) {}
  bxira* CreateBxira(RequestDetail* detail, ContextInfo* context) override {
    auto* const request = new TestRequest(detail, context, this, sampling_);
    if (std::string(table()) != "FAILS" || request->predicate("TEXT") != "create") return request;
    delete request;
    return nullptr;
  }

 private:
  const TestRequest::Sampling sampling_;
};

std::string fromHex(const std::string& digits) {
  std::string bytes;
  for (size_t index = 0; index + 1 < digits.size(); index += 2) {
    bytes += static_cast<char>(std::stoi(digits.substr(index, 2), nullptr, 16));
  }
  return bytes;
}

/// "hex:..." those bytes; "env:NAME" the variable's value; "node" the node's name; "predicates" the query's, in order.
std::string tell(const TestRequest& request) {
  const std::string text = request.predicate("TEXT");
  if (text.compare(0, 4, "hex:") == 0) return fromHex(text.substr(4));
  if (text.compare(0, 4, "env:") == 0) return BSS1_GetEnv(text.c_str() + 4, "(unset)");
  if (text == "node") return IRA_GetOriginnode();
  if (text != "predicates") return "";
  std::string all;
  for (const auto& each : request.detail().predicates) {
    all += each.column + " " + std::to_string(each.oper) + " " + each.value + ";";
  }
  return all;
}

void echo(TestRequest& request) {
  Row row{};
  pad(row.text, sizeof row.text, request.predicate("TEXT"));
  const int count = request.number("COUNT", 0);
  pad(row.bytes, sizeof row.bytes, tell(request));
  row.count = count;
  row.number = request.number("NUMBER", 0);
  if (count == 0) return request.insert(row);
  for (row.number = 0; row.number < count; ++row.number) request.insertMatching(row);
}

void waitAtGate(const std::string& path) {
  const int fifo = open(path.c_str(), O_RDONLY | O_CLOEXEC);
  if (fifo < 0) throw std::runtime_error("no such gate");
  char ignored;
  while (read(fifo, &ignored, 1) > 0) {
  }
  close(fifo);
}

void passGate(TestRequest& request) {
  waitAtGate(request.predicate("BYTES"));
  Row row{};
  pad(row.text, sizeof row.text, "passed");
  request.insert(row);
}

void sendEvents(TestRequest& request) {
  TableManager& manager = *request.manager();
  Row row{};
  pad(row.text, sizeof row.text, request.predicate("TEXT"));
  row.count = request.number("COUNT", 1);
  for (row.number = 0; row.number < row.count; ++row.number) {
    (void)BSS1_GetLock(manager.lock());
    LinkedListIter open(manager.requests);
    while (bxira* const each = open.next()) {
      auto& receiver = static_cast<TestRequest&>(*each);
      const RES1_Handle handle = receiver.handle();
      (void)bxira::UseHandle(handle);
      receiver.insertMatching(row);
      (void)receiver.Dispatch();
      (void)RES1_Drop(handle);
    }
    (void)BSS1_ReleaseLock(manager.lock());
  }
}

void fail(TestRequest& request) {
  if (request.predicate("TEXT") == "sample") throw std::runtime_error("told to fail");
  if (request.predicate("TEXT") == "insert") (void)request.InsertRow(nullptr);
}

// ---- the interface -------------------------------------------------------------------------------------------------

std::string bodyOf(const rpc__call& call) {
  return {reinterpret_cast<const char*>(call.request->body), call.request->body_bytes};
}

rpc__reply replyWith(const std::string& text) {
  rpc__packet* const packet = rpc__alloc_pkt(static_cast<uint32_t>(text.size()));
  std::memcpy(packet->body, text.data(), text.size());
  return {packet, static_cast<uint32_t>(text.size())};
}

rpc__reply echoCall(const rpc__call& call) {
  return replyWith(std::string(call.sender.integers == rpc__little_endian ? "little" : "big") +
                   (call.sender.characters == rpc__ascii ? " ascii " : " ebcdic ") + bodyOf(call));
}
rpc__reply raiseFault(const rpc__call& call) {
  PFM1__Raise(static_cast<uint32_t>(std::stoul(bodyOf(call))));
}
rpc__reply failCall(const rpc__call&) {
  throw std::runtime_error("told to fail");
}
rpc__reply waitInCall(const rpc__call& call) {
  const std::string path = bodyOf(call);
  waitAtGate(path.substr(0, path.find('\0')));
  return replyWith("passed");
}

rpc__server_epv testEpv() {
  static constexpr rpc__server_stub stubs[] = {echoCall, raiseFault, failCall, waitInCall};
  return {stubs, sizeof stubs / sizeof *stubs};
}

constexpr rpc__if_spec testInterface{"test", {{0x5a, 0, 0, 0, 0, 0, 0, 0, 0, 0, 0, 0, 0, 0, 0, 1}}, 3, testEpv};
constexpr int noManager = 0;

void registerInterface() {
  uint32_t status;
  rpc__register_mgr(&rpc__nil_type, &testInterface, &noManager, &status);
}

}  // namespace

extern "C" [[gnu::visibility("default")]] unsigned Initialize_Mgmt_Functions() {
  (void)TableManager::RegisterWithManager(new TestManager("ECHO", echo));
  (void)TableManager::RegisterWithManager(new TestManager("GATE", passGate));
  (void)TableManager::RegisterWithManager(new TestManager("EVENTS", sendEvents));
  (void)TableManager::RegisterWithManager(new TestManager("FAILS", fail));
  registerInterface();
  return static_cast<unsigned>(std::atoi(BSS1_GetEnv("TEST_STATUS", "0")));
}

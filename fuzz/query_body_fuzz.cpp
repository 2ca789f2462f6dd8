// The JSON body of a query. What is accepted is written as JSON and read again; what is not is refused in JSON.

#include <nlohmann/json.hpp>
#include <string>

#include "apps/vmqd/json_text.h"
#include "apps/vmqd/query_body.h"
#include "apps/vmqd/refusal.h"
#include "fuzz/support.h"

namespace {

using vmqd::Predicates;

const vmqd::Table& table() {
  static const vmqd::Table& it = *new vmqd::Table(
      {"APP", "T", {{"TEXT", {"text", 0, 8, COLUMN_CHARACTER}}, {"NUMBER", {"number", 8, 4, COLUMN_INTEGER}}}, 12});
  return it;
}

constexpr const char* operatorNames[] = {"eq", "ne", "lt", "le", "gt", "ge"};

std::string asJson(const Predicates& predicates) {
  std::string body = R"({"predicates":{)";
  for (const auto& each : predicates.request().predicates) {
    if (body.back() != '{') body += ',';
    vmqd::appendJsonString(body, each.column);
    body += std::string(":{\"") + operatorNames[each.oper - INTF_EQ] + "\":";
    vmqd::appendJsonString(body, each.value);
    body += '}';
  }
  return body + "}}";
}

bool areSame(const Predicates& one, const Predicates& other) {
  const auto isSame = [](const auto& a, const auto& b) {
    return a.column == b.column && a.oper == b.oper && a.value == b.value;
  };
  return std::equal(one.request().predicates.begin(), one.request().predicates.end(),
                    other.request().predicates.begin(), other.request().predicates.end(), isSame);
}

}  // namespace

int LLVMFuzzerTestOneInput(const uint8_t* data, size_t size) {
  const std::string_view body(reinterpret_cast<const char*>(data), size);
  Predicates predicates(table());
  try {
    vmqd::readQueryBody(body, predicates);
  } catch (const vmqd::Refusal& refusal) {
    std::string buffer;
    vmqd::Reply reply(buffer);
    vmqd::refuse(reply, refusal.code(), refusal.what(), refusal.status());
    fuzz::require(nlohmann::json::accept(reply.text), "a refusal is JSON");
    return 0;
  }
  fuzz::require(nlohmann::json::accept(body), "only JSON is accepted");
  Predicates again(table());
  vmqd::readQueryBody(asJson(predicates), again);
  fuzz::require(areSame(predicates, again), "predicates that are written are read as they were");
  return 0;
}

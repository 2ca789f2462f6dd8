// The routes that list, query and watch tables.

#include "apps/vmqd/table_routes.h"

#include "apps/vmqd/event_stream.h"
#include "apps/vmqd/json_text.h"
#include "apps/vmqd/predicates.h"
#include "apps/vmqd/query_body.h"
#include "apps/vmqd/refusal.h"

namespace vmqd {
namespace {

const Table& tableOf(const Service& service, const Request& request) {
  if (const Table* const table = service.tables.find(request.parameters[0])) return *table;
  throw Refusal(errors::unknownTable, "There is no table " + inQuotes(request.parameters[0]) + ".");
}

/// Writes rows into the reply as they come. They may come on another thread, if the table has an event meanwhile, but
/// one call at a time, and none once the request is closed.
class RowsToJson : public RowRequester {
 public:
  RowsToJson(const JsonRowWriter& writer, std::string& out) : writer_(writer), out_(out) {}

  unsigned rowsArrived(const char* rows, unsigned row_bytes, unsigned count) override {
    for (; count > 0; --count, rows += row_bytes) {
      if (!first_) out_ += ',';
      first_ = false;
      writer_.append(out_, rows);
    }
    return 0;
  }

 private:
  const JsonRowWriter& writer_;
  std::string& out_;
  bool first_ = true;
};

/// COLUMN=value or COLUMN.operator=value.
void addArgument(const Argument& argument, Predicates& predicates) {
  const size_t dot = argument.name.find('.');
  const std::string_view column = argument.name.substr(0, dot);
  const _IntfOper oper =
      dot == std::string_view::npos ? INTF_EQ : Predicates::operatorNamed(column, argument.name.substr(dot + 1));
  predicates.add(column, oper, argument.value);
}

}  // namespace

void answerTables(Service& service, const Request&, Reply& reply) {
  reply.text = service.tables.json();
}

void answerQuery(Service& service, const Request& request, Reply& reply) {
  const Table& table = tableOf(service, request);
  Predicates predicates(table);
  readQueryBody(request.body, predicates);
  reply.text = R"({"table":)";
  appendJsonString(reply.text, table.description.table);
  reply.text += R"(,"rows":[)";
  {
    RowsToJson rows(table.rows, reply.text);
    const auto opened = vmqhost::OpenRequest::open(predicates.request(), rows);
    if (!opened) throw Refusal(errors::internal, "The table could not be queried.");
    if (const unsigned status = opened->sample()) {
      throw Refusal(errors::internal, "The query failed with status " + std::to_string(status) + ".");
    }
  }
  reply.text += "]}";
}

void answerEvents(Service& service, const Request& request, Reply& reply) {
  Predicates predicates(tableOf(service, request));
  for (const Argument& argument : request.arguments) addArgument(argument, predicates);
  const EventStream::Settings settings{service.settings.event_buffer_rows, service.settings.keep_alive, request.client,
                                       service.settings.stop};
  reply.stream = std::make_unique<EventStream>(predicates, settings, service.watchers.take());
}

}  // namespace vmqd

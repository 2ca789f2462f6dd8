#include "tasks/inventory_listing.h"

#include "util/corvel_home.h"
#include "util/string_tokenizer.h"
#include "util/trace.h"

using VMQ::String;
using VMQ::Trace;

namespace {

RAS1_Unit traceUnit{"tasks/inventory_listing"};

constexpr char HEADER[] = "\"ProdCode\",\"Description\",\"Platform\",\"Version\",\"Release\"";
constexpr int FIELD_COUNT = 5;

bool fieldCountFits(int count, InventoryFields fields) {
  return fields == InventoryFields::kExactlyFive ? count == FIELD_COUNT : count >= FIELD_COUNT;
}

}  // namespace

String inventoryCommand(const char* option) {
  return String(VMQ_CORVELHOME) + "/" + "bin" + "/" + "qinfo" + " " + option;
}

void forEachInventoryRecord(const String& listing, InventoryFields fields,
                            const std::function<bool(const InventoryRecord&)>& visit) {
  const Trace trace(traceUnit);
  const unsigned header = listing.find(String(HEADER), 0);
  if (header == String::NPOS) {
    TRACE_ERROR(trace, "Inventory header string %s, not found", HEADER);
    return;
  }
  TRACE_DETAIL(trace, "Index of inventory header is %d", static_cast<int>(header));
  const unsigned newline = listing.find(static_cast<unsigned short>('\n'), header);
  if (newline == String::NPOS) {
    TRACE_ERROR(trace, "No newline character '%c' found after Inventory header", '\n');
    return;
  }
  TRACE_DETAIL(trace, "Index of newline after inventory header is : %d", static_cast<int>(newline));

  StringTokenizer lines(listing.substr(newline), "\n");
  while (lines.hasMoreTokens()) {
    const String line = lines.nextToken();
    TRACE_DETAIL(trace, "Found product line: %s", line.c_str().get());
    StringTokenizer tokens(line, "\n\r,\"");
    const int count = tokens.countTokens();
    if (!fieldCountFits(count, fields)) {
      TRACE_ERROR(trace, "Product line has %d fields, expecting %d fields.  Product line is: %s", count, FIELD_COUNT,
                  line.c_str().get());
      continue;
    }
    InventoryRecord record;
    for (String* field :
         {&record.product_code, &record.description, &record.platform, &record.version, &record.release})
      *field = tokens.nextToken();
    if (!visit(record)) return;
  }
}

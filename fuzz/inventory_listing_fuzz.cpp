// What the inventory tool prints, against a plain reading of it.

#include <string>
#include <vector>

#include "fuzz/support.h"
#include "tasks/inventory_listing.h"

namespace {

using Fields = std::vector<std::string>;

Fields split(const std::string& text, const char* separators) {
  Fields pieces;
  for (size_t begin = 0; (begin = text.find_first_not_of(separators, begin)) != std::string::npos;) {
    const size_t end = std::min(text.find_first_of(separators, begin), text.size());
    pieces.push_back(text.substr(begin, end - begin));
    begin = end;
  }
  return pieces;
}

std::vector<Fields> recordsOf(const std::string& listing, bool exactlyFive) {
  std::vector<Fields> records;
  const size_t header = listing.find(R"("ProdCode","Description","Platform","Version","Release")");
  const size_t newline = header == std::string::npos ? header : listing.find('\n', header);
  if (newline == std::string::npos) return records;
  for (const std::string& line : split(listing.substr(newline), "\n")) {
    Fields fields = split(line, "\n\r,\"");
    if (fields.size() < 5 || (exactlyFive && fields.size() > 5)) continue;
    fields.resize(5);
    records.push_back(fields);
  }
  return records;
}

Fields fieldsOf(const InventoryRecord& record) {
  Fields fields;
  for (const auto* field :
       {&record.product_code, &record.description, &record.platform, &record.version, &record.release}) {
    fields.push_back(field->toNarrow());
  }
  return fields;
}

}  // namespace

int LLVMFuzzerTestOneInput(const uint8_t* data, size_t size) {
  const std::string listing = fuzz::upToNull(data, size);
  for (const InventoryFields mode : {InventoryFields::kExactlyFive, InventoryFields::kAtLeastFive}) {
    const auto expected = recordsOf(listing, mode == InventoryFields::kExactlyFive);
    for (size_t wanted = 0; wanted <= expected.size(); wanted += std::max<size_t>(expected.size(), 1)) {
      std::vector<Fields> visited;
      forEachInventoryRecord(listing.c_str(), mode, [&](const InventoryRecord& record) {
        visited.push_back(fieldsOf(record));
        return visited.size() <= wanted;  // once stops at the first record, once never
      });
      const size_t count = std::min(expected.size(), wanted + 1);
      fuzz::require(visited == std::vector(expected.begin(), expected.begin() + static_cast<long>(count)),
                    "every product line is visited, until the visitor has enough");
    }
  }
  return 0;
}

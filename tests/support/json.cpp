#include "tests/support/json.h"

template class nlohmann::basic_json<>;

nlohmann::json parsedJson(const std::string& text) {
  return nlohmann::json::parse(text);
}

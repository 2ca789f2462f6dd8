#pragma once
// JSON in tests. Its parser and values are compiled once, which takes seconds, and not for each file that uses them.

#include <nlohmann/json.hpp>
#include <string>

extern template class nlohmann::basic_json<>;

/// Throws nlohmann::json::parse_error.
nlohmann::json parsedJson(const std::string& text);

#pragma once
// What rows a request asks for, or, with the request table, what a request says: COLUMN=VALUE and comparisons.

#include <nlohmann/json.hpp>
#include <string>
#include <string_view>
#include <vector>

namespace vmqctl {

/// Keeps the order of the members: columns are shown as the daemon sends them, predicates sent as they were given.
using Json = nlohmann::ordered_json;

struct Predicate {
  std::string column;
  std::string op;  ///< eq ne lt le gt ge
  std::string value;
};

/// What one value of a request may hold.
inline constexpr std::size_t maximumValueBytes = 65535;

using Predicates = std::vector<Predicate>;

/// "COLUMN=VALUE", "COLUMN!=VALUE", or with <, <=, >, >=. Throws a Failure of usage for anything else.
Predicate parsePredicate(std::string_view text);

/// The object of a query's "predicates". Throws a Failure of usage when a column comes twice (an object cannot hold
/// it).
Json toJson(const Predicates& predicates);

/// The body of a query for these rows. Throws a Failure of usage for what cannot be sent: a column that comes twice, a
/// value that is not UTF-8 or too long.
std::string queryBody(const Predicates& predicates);

/// Throws what queryBody() would.
void checkSendable(const Predicates& predicates);

/// The part of a URL after "?": "TRANSID=t1&RETVAL.ne=0", percent-encoded.
std::string toQueryString(const Predicates& predicates);

/// The text with everything but letters, digits and "-._~" as "%" and two digits.
std::string percentEncoded(std::string_view text);

/// The same, but "/" stays.
std::string percentEncodedPath(std::string_view path);

}  // namespace vmqctl

// Parses predicates and writes them in the two forms that the daemon reads.

#include "apps/vmqctl/predicates.h"

#include <cstdio>

#include "apps/vmqctl/failure.h"

namespace vmqctl {
namespace {

struct Operator {
  std::string_view sign;
  std::string_view name;
};

// The longer sign before the one that it begins with.
constexpr Operator operators[] = {{"!=", "ne"}, {"<=", "le"}, {">=", "ge"}, {"=", "eq"}, {"<", "lt"}, {">", "gt"}};

constexpr std::string_view unreserved = "ABCDEFGHIJKLMNOPQRSTUVWXYZabcdefghijklmnopqrstuvwxyz0123456789-._~";

std::string encoded(std::string_view text, std::string_view plain) {
  constexpr std::string_view digits = "0123456789ABCDEF";
  std::string result;
  for (const char c : text) {
    if (plain.find(c) != std::string_view::npos) {
      result += c;
    } else {
      const auto byte = static_cast<unsigned char>(c);
      result += {'%', digits[byte >> 4], digits[byte & 15]};
    }
  }
  return result;
}

}  // namespace

Predicate parsePredicate(std::string_view text) {
  const std::size_t at = text.find_first_of("=!<>");
  if (at != 0 && at != std::string_view::npos) {
    for (const Operator& op : operators) {
      if (text.substr(at, op.sign.size()) == op.sign) {
        return {std::string(text.substr(0, at)), std::string(op.name), std::string(text.substr(at + op.sign.size()))};
      }
    }
  }
  throw Failure(ExitCode::Usage, "\"" + std::string(text) + "\" is not of the form COLUMN=VALUE.",
                "The operators are =, !=, <, <=, > and >=; quote <, > and ! for the shell.");
}

Json toJson(const Predicates& predicates) {
  Json object = Json::object();
  for (const Predicate& p : predicates) {
    if (object.contains(p.column)) {
      throw Failure(ExitCode::Usage, "The column " + p.column + " is given twice.", "Give each column once.");
    }
    object[p.column] = p.op == "eq" ? Json(p.value) : Json{{p.op, p.value}};
  }
  return object;
}

std::string queryBody(const Predicates& predicates) {
  for (const Predicate& p : predicates) {
    if (p.value.size() <= maximumValueBytes) continue;
    throw Failure(ExitCode::Usage, "The value of " + p.column + " has " + std::to_string(p.value.size()) +
                                       " bytes; a request holds at most " + std::to_string(maximumValueBytes) + ".");
  }
  try {
    return Json{{"predicates", toJson(predicates)}}.dump();
  } catch (const Json::type_error&) {
    throw Failure(ExitCode::Usage, "A value of the request is not UTF-8 text.", "Give it in UTF-8.");
  }
}

void checkSendable(const Predicates& predicates) {
  (void)queryBody(predicates);
}

std::string percentEncoded(std::string_view text) {
  return encoded(text, unreserved);
}

std::string percentEncodedPath(std::string_view path) {
  return encoded(path, std::string(unreserved) + "/");
}

std::string toQueryString(const Predicates& predicates) {
  std::string result;
  for (const Predicate& p : predicates) {
    if (!result.empty()) result += '&';
    result += percentEncoded(p.column);
    if (p.op != "eq") result += "." + p.op;
    result += "=" + percentEncoded(p.value);
  }
  return result;
}

}  // namespace vmqctl

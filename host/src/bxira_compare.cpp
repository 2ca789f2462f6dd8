// How a column of a row is compared with the value of a predicate.

#include <algorithm>
#include <charconv>
#include <compare>
#include <cstring>
#include <string_view>

#include "bxira.h"

namespace {

bool holds(_IntfOper oper, std::strong_ordering order) {
  switch (oper) {
    case INTF_EQ:
      return order == 0;
    case INTF_NE:
      return order != 0;
    case INTF_LT:
      return order < 0;
    case INTF_LE:
      return order <= 0;
    case INTF_GT:
      return order > 0;
    case INTF_GE:
      return order >= 0;
  }
  return false;
}

/// A column that nobody filled in holds zero bytes: like blanks, they are no text.
std::string_view columnText(const char* text, unsigned width) {
  const std::string_view all(text, width);
  return all.substr(0, all.find_last_not_of('\0') + 1);
}

unsigned char at(std::string_view text, size_t index) {
  return static_cast<unsigned char>(index < text.size() ? text[index] : ' ');
}

std::strong_ordering comparePadded(std::string_view left, std::string_view right) {
  for (size_t i = 0; i < std::max(left.size(), right.size()); ++i) {
    if (const auto order = at(left, i) <=> at(right, i); order != 0) return order;
  }
  return std::strong_ordering::equal;
}

}  // namespace

unsigned bxira::IsException(_IntfOper oper, const char* text, unsigned width, const char* value) {
  if (text == nullptr || value == nullptr) return 0;
  return holds(oper, comparePadded(columnText(text, width), std::string_view(value, strnlen(value, width))));
}

unsigned bxira::IsException(_IntfOper oper, int32_t number, const char* value) {
  if (value == nullptr) return 0;
  int32_t wanted = 0;
  const char* const end = value + std::strlen(value);
  const auto [stop, error] = std::from_chars(value, end, wanted);
  return error == std::errc() && stop == end && holds(oper, number <=> wanted);
}

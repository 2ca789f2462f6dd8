// How a column of a row is compared with the value of a predicate.

#include <algorithm>
#include <charconv>
#include <compare>
#include <cstring>
#include <string_view>

#include "bxira.h"

namespace {

// NOLINTBEGIN(modernize-use-nullptr): 0 is what an ordering is compared with
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
// NOLINTEND(modernize-use-nullptr)

/// A column that nobody filled in holds zero bytes: like blanks, they are no text.
std::string_view columnText(const char* text, unsigned width) {
  const std::string_view all(text, width);
  return all.substr(0, all.find_last_not_of('\0') + 1);
}

/// How a text compares with as many blanks. A wide column is mostly padding: that it is the same as itself one byte
/// further on is found faster than byte by byte.
std::strong_ordering compareWithBlanks(std::string_view text) {
  if (text.empty()) return std::strong_ordering::equal;
  if (text[0] == ' ' && std::memcmp(text.data(), text.data() + 1, text.size() - 1) == 0)
    return std::strong_ordering::equal;
  return static_cast<unsigned char>(text[text.find_first_not_of(' ')]) <=> static_cast<unsigned char>(' ');
}

std::strong_ordering comparePadded(std::string_view left, std::string_view right) {
  const size_t common = std::min(left.size(), right.size());
  if (const int order = std::memcmp(left.data(), right.data(), common); order != 0) return order <=> 0;
  if (left.size() > common) return compareWithBlanks(left.substr(common));
  return 0 <=> compareWithBlanks(right.substr(common));  // NOLINT(modernize-use-nullptr): as above
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

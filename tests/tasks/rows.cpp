#include "tests/tasks/rows.h"

#include <cstring>
#include <stdexcept>

namespace {

std::string column(const std::string& text, size_t width) {
  if (text.size() > width) throw std::invalid_argument("a row cannot hold: " + text);
  return text + std::string(width - text.size(), ' ');
}

std::string integer(int32_t number) {
  std::string bytes(sizeof number, '\0');
  std::memcpy(bytes.data(), &number, sizeof number);
  return bytes;
}

}  // namespace

std::string AnswerRow::bytes() const {
  return column(originnode, 64) + column(transid, 84) + column(command, 16) + column(product, 32) +
         column(context, 3072) + column(optional, 32) + column(daconfig, 32) + column(dascript, 512) + integer(retval) +
         column(version, 12) + column(retmsgid, 16) + column(retmsgparm, 256) + column(targetmsn, 64);
}

std::string StatusEvent::bytes() const {
  return column(originnode, 64) + column(transid, 84) + column(command, 16) + integer(retval) + column(retmsgid, 16) +
         column(retmsgparm, 256) + column(targetmsn, 64);
}

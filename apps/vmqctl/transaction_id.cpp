// Makes transaction ids.

#include "apps/vmqctl/transaction_id.h"

#include <sys/random.h>

#include <cerrno>
#include <cstdint>
#include <cstdio>
#include <ctime>
#include <system_error>

namespace vmqctl {

std::string newTransactionId() {
  std::uint64_t number = 0;
  if (getrandom(&number, sizeof number, 0) != sizeof number) {  // so few bytes are never cut short
    throw std::system_error(errno, std::generic_category(), "no random number");
  }
  const std::time_t now = std::time(nullptr);
  std::tm utc = {};
  if (gmtime_r(&now, &utc) == nullptr) throw std::system_error(errno, std::generic_category(), "no time");
  char day[32];
  if (std::strftime(day, sizeof day, "%Y%m%dT%H%M%SZ", &utc) == 0) day[0] = '\0';  // a year beyond our buffer
  char text[maximumTransactionIdBytes + 1];
  (void)std::snprintf(text, sizeof text, "vmqctl-%s-%016llx", day, static_cast<unsigned long long>(number));  // fits
  return text;
}

}  // namespace vmqctl

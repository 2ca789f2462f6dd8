#pragma once
// What an answer row or a status event says about its command.

#include <string>

#include "apps/vmqctl/predicates.h"

namespace vmqctl {

struct Result {
  long returnValue = 0;    ///< RETVAL; 0 is success
  std::string messageId;   ///< RETMSGID; may be set beside a success, and missing beside a failure
  std::string parameters;  ///< RETMSGPARM
};

/// Throws a Failure when the row has no whole number in RETVAL.
Result resultOf(const Json& row);

/// The text in a column of a row, "" when it has none there.
std::string textIn(const Json& row, const char* column);

/// The message's text from the catalogue; "" for an unknown id.
std::string messageText(const std::string& id);

/// "VMQ1006E The command is not supported; ... (parameters: PAUSE)". "" when there is nothing to explain.
std::string explanation(const Result& result);

}  // namespace vmqctl

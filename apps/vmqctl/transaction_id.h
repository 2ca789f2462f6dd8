#pragma once
// The id that ties a status event to its request.

#include <string>

namespace vmqctl {

/// The width of the TRANSID column: a longer id would come back cut.
constexpr std::size_t maximumTransactionIdBytes = 84;

/// A new one, such as "vmqctl-20240513T101500Z-9f3a1c2e5d7b8a60": the time helps a reader of logs, the random part
/// makes it unique.
std::string newTransactionId();

}  // namespace vmqctl

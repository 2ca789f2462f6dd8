#pragma once
// How far a transfer has come, in one line for a terminal.

#include <chrono>
#include <cstddef>
#include <cstdint>
#include <string>

namespace vmqctl {

struct TransferState {
  std::uint64_t bytesDone = 0;
  std::uint64_t bytesTotal = 0;
  std::size_t fileNumber = 1;  ///< of the file that is being sent, from 1
  std::size_t files = 1;
  std::string name;  ///< of that file
  std::chrono::duration<double> lasted{};
  bool verifying = false;  ///< that file has been sent, and is being compared with what has arrived
};

/// " 45 % [#########-----------] 1.2 GiB of 2.7 GiB, 310 MiB/s, 0:05 left, file 3 of 12: ux/a.bin",
/// "verifying ux/a.bin, file 3 of 12". Not escaped.
std::string transferLine(const TransferState& state);

/// "0 bytes", "1 byte", "1023 bytes", "1.5 KiB", "12 MiB": two digits at least, no more than are worth reading.
std::string inBytes(std::uint64_t bytes);

}  // namespace vmqctl

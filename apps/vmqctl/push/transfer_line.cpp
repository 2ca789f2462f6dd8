// The line of a transfer.

#include "apps/vmqctl/push/transfer_line.h"

#include <algorithm>
#include <cmath>
#include <cstdio>

namespace vmqctl {
namespace {

constexpr std::size_t barColumns = 20;
constexpr double shortest = 0.1;  // seconds; a rate over less than that tells nothing

double partDone(const TransferState& state) {
  if (state.bytesTotal == 0) return static_cast<double>(state.fileNumber - 1) / static_cast<double>(state.files);
  return std::min(1.0, static_cast<double>(state.bytesDone) / static_cast<double>(state.bytesTotal));
}

/// "0:05", "1:02:03"
std::string clockTime(double seconds) {
  const auto whole = static_cast<unsigned long long>(std::ceil(std::min(seconds, 1e9)));
  char text[40];
  if (whole < 3600) {
    (void)std::snprintf(text, sizeof text, "%llu:%02llu", whole / 60, whole % 60);  // fits
  } else {
    (void)std::snprintf(text, sizeof text, "%llu:%02llu:%02llu", whole / 3600, whole / 60 % 60, whole % 60);  // fits
  }
  return text;
}

}  // namespace

std::string inBytes(std::uint64_t bytes) {
  if (bytes < 1024) return std::to_string(bytes) + (bytes == 1 ? " byte" : " bytes");
  constexpr const char* units[] = {"KiB", "MiB", "GiB", "TiB", "PiB", "EiB"};
  double value = static_cast<double>(bytes) / 1024;
  std::size_t unit = 0;
  for (; value >= 1023.5 && unit + 1 < std::size(units); ++unit) value /= 1024;
  char text[32];
  (void)std::snprintf(text, sizeof text, value < 9.95 ? "%.1f %s" : "%.0f %s", value, units[unit]);  // fits
  return text;
}

std::string transferLine(const TransferState& state) {
  const std::string count = "file " + std::to_string(state.fileNumber) + " of " + std::to_string(state.files);
  if (state.verifying) return "verifying " + state.name + ", " + count;
  const double part = partDone(state);
  const auto filled = static_cast<std::size_t>(part * barColumns);
  char percent[16];
  (void)std::snprintf(percent, sizeof percent, "%3d %% ", static_cast<int>(part * 100));  // fits
  std::string line = percent + ("[" + std::string(filled, '#')) + std::string(barColumns - filled, '-') + "] " +
                     inBytes(state.bytesDone) + " of " + inBytes(state.bytesTotal);
  if (state.bytesDone > 0 && state.lasted.count() >= shortest) {
    const double rate = static_cast<double>(state.bytesDone) / state.lasted.count();
    const double left = static_cast<double>(state.bytesTotal - std::min(state.bytesTotal, state.bytesDone)) / rate;
    line += ", " + inBytes(static_cast<std::uint64_t>(rate)) + "/s, " + clockTime(left) + " left";
  }
  return line + ", " + count + ": " + state.name;
}

}  // namespace vmqctl

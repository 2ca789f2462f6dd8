#pragma once
// Waiting for what another thread or process is about to do and gives no signal of.

#include <chrono>
#include <thread>

/// Asks every millisecond. False when the answer is still no after 30 seconds.
template <typename Condition>
bool eventually(Condition condition) {
  const auto end = std::chrono::steady_clock::now() + std::chrono::seconds(30);
  while (!condition()) {
    if (std::chrono::steady_clock::now() > end) return false;
    std::this_thread::sleep_for(std::chrono::milliseconds(1));
  }
  return true;
}

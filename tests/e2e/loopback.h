#pragma once
// TCP ports of 127.0.0.1.

#include <cstdint>

/// A port that nothing listened on a moment ago.
uint16_t freePort();

/// True when something answers an HTTP request there with status 200.
bool answers(uint16_t port);

/// Holds a port, without ever answering, while it lives.
class OccupiedPort {
 public:
  OccupiedPort();
  ~OccupiedPort();
  OccupiedPort(const OccupiedPort&) = delete;
  OccupiedPort& operator=(const OccupiedPort&) = delete;
  [[nodiscard]] uint16_t number() const { return number_; }

 private:
  int descriptor_;
  uint16_t number_;
};

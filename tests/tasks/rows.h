#pragma once
// Rows as tests write them down: texts without their padding.

#include <cstdint>
#include <string>

/// What an answer row of the request table holds. Compared as the bytes that it stands for.
struct AnswerRow {
  std::string originnode{}, transid{}, command{}, product{}, context{}, optional{}, daconfig{}, dascript{};
  int32_t retval = 0;
  std::string version{}, retmsgid{}, retmsgparm{}, targetmsn{};

  [[nodiscard]] std::string bytes() const;
};

/// What an event of the status table holds.
struct StatusEvent {
  std::string originnode{}, transid{}, command{};
  int32_t retval = 0;
  std::string retmsgid{}, retmsgparm{}, targetmsn{};

  [[nodiscard]] std::string bytes() const;
};

#pragma once
// An environment variable for the length of a test.

#include <cstdlib>
#include <optional>
#include <string>

/// Sets a variable, or unsets it, and puts back what was there. For tests of one thread.
class ScopedVariable {
 public:
  ScopedVariable(std::string name, std::optional<std::string> value) : name_(std::move(name)) {
    if (const char* const before = std::getenv(name_.c_str())) before_ = before;
    put(value);
  }
  ~ScopedVariable() { put(before_); }
  ScopedVariable(const ScopedVariable&) = delete;
  ScopedVariable& operator=(const ScopedVariable&) = delete;

  void put(const std::optional<std::string>& value) const {
    if (value) {
      setenv(name_.c_str(), value->c_str(), /*overwrite=*/1);
    } else {
      unsetenv(name_.c_str());
    }
  }

 private:
  const std::string name_;
  std::optional<std::string> before_;
};

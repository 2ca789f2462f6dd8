#pragma once
// The environment that a child is started with, built beside the host's own.

#include <string>
#include <vector>

namespace VMQ {

/// A copy of the host's environment, made under the host's environment lock. Changing it never changes the host's.
/// Belongs to one thread.
class ChildEnvironment {
 public:
  ChildEnvironment();

  /// Applies one entry as putenv does: "NAME=VALUE" replaces or adds, a text without "=" removes the variable of that
  /// name.
  void put(const char* entry);

  /// The value of a variable, or null. Valid until the next put.
  [[nodiscard]] const char* get(const char* name) const;

  /// A null-terminated list for execve. Valid until the next put and no longer than this object.
  [[nodiscard]] char* const* entries();

 private:
  std::vector<std::string> entries_;
  std::vector<char*> pointers_;
};

/// Puts each entry of a null-terminated list, in order. A null list is empty.
void setEnv(ChildEnvironment& environment, const char* const* entries);

}  // namespace VMQ

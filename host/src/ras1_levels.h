#pragma once
// What KBB_RAS1 says: which levels each unit has.

#include <cstdint>
#include <string>
#include <string_view>
#include <vector>

#include "ras1.h"

namespace vmqhost {

inline constexpr uint32_t kAllLevels = RAS1_ERROR | RAS1_EVENT | RAS1_DETAIL;

class LevelRules {
 public:
  /// Reads the syntax that ras1.h describes. On a mistake returns false and says in `error` what is wrong; the rules
  /// are then unchanged.
  bool parse(std::string_view text, std::string& error);

  /// The levels of a unit.
  [[nodiscard]] uint32_t levelsOf(std::string_view unit) const;

 private:
  struct Rule {
    std::string prefix;
    uint32_t levels;
  };
  std::vector<Rule> rules_;
};

}  // namespace vmqhost

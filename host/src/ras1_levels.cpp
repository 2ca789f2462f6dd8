// Parsing of KBB_RAS1.

#include "ras1_levels.h"

#include <algorithm>
#include <iterator>
#include <optional>
#include <utility>

namespace vmqhost {

namespace {

constexpr struct {
  std::string_view name;
  uint32_t levels;
} kLevelNames[] = {
    {"none", 0}, {"error", RAS1_ERROR}, {"event", RAS1_EVENT}, {"detail", RAS1_DETAIL}, {"all", kAllLevels},
};

std::optional<uint32_t> levelNamed(std::string_view name) {
  const auto* const found =
      std::find_if(std::begin(kLevelNames), std::end(kLevelNames), [&](const auto& each) { return each.name == name; });
  if (found == std::end(kLevelNames)) return std::nullopt;
  return found->levels;
}

/// Takes the text up to the next separator off the front. False when there was none left to take.
class Pieces {
 public:
  Pieces(std::string_view text, char separator) : rest_(text), separator_(separator) {}

  bool next(std::string_view& piece) {
    if (done_) return false;
    const size_t end = rest_.find(separator_);
    piece = rest_.substr(0, end);
    done_ = end == std::string_view::npos;
    if (!done_) rest_.remove_prefix(end + 1);
    return true;
  }

 private:
  std::string_view rest_;
  const char separator_;
  bool done_ = false;
};

}  // namespace

bool LevelRules::parse(std::string_view text, std::string& error) {
  std::vector<Rule> rules;
  Pieces items(text, ',');
  for (std::string_view item; !text.empty() && items.next(item);) {
    const size_t equals = item.find('=');
    if (equals == 0) {
      error = "\"" + std::string(item) + "\" has no unit before its \"=\"";
      return false;
    }
    Rule rule{equals == std::string_view::npos ? "" : std::string(item.substr(0, equals)), 0};
    Pieces names(equals == std::string_view::npos ? item : item.substr(equals + 1), '+');
    for (std::string_view name; names.next(name);) {
      const std::optional<uint32_t> levels = levelNamed(name);
      if (!levels) {
        error = "\"" + std::string(name) + "\" is no trace level (none, error, event, detail or all)";
        return false;
      }
      rule.levels |= *levels;
    }
    rules.push_back(std::move(rule));
  }
  rules_ = std::move(rules);
  return true;
}

uint32_t LevelRules::levelsOf(std::string_view unit) const {
  const auto last = std::find_if(rules_.rbegin(), rules_.rend(),
                                 [&](const Rule& rule) { return unit.substr(0, rule.prefix.size()) == rule.prefix; });
  return last == rules_.rend() ? uint32_t{RAS1_ERROR} : last->levels;
}

}  // namespace vmqhost

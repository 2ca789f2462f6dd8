// Which lines an administrator gets for which value of KBB_RAS1.

#include <gtest/gtest.h>

#include "ras1.h"
#include "tests/host/trace_log.h"

namespace {

constinit RAS1_Unit startStop{"tasks/start_stop"};
constinit RAS1_Unit install{"tasks/install"};
constinit RAS1_Unit string{"util/string"};

constexpr uint32_t kAll = RAS1_ERROR | RAS1_EVENT | RAS1_DETAIL;

uint32_t enabledLevels(RAS1_Unit& unit) {
  uint32_t enabled = 0;
  for (const RAS1_Level level : {RAS1_ERROR, RAS1_EVENT, RAS1_DETAIL}) {
    if (RAS1_Enabled(unit, level)) enabled |= level;
  }
  return enabled;
}

struct LevelsCase {
  const char* setting;
  uint32_t start_stop, install, string;
};

TEST(TraceLevels, FollowTheLastItemThatMatchesTheUnit) {
  constexpr LevelsCase kCases[] = {
      {"error", RAS1_ERROR, RAS1_ERROR, RAS1_ERROR},
      {"none", 0, 0, 0},
      {"event", RAS1_EVENT, RAS1_EVENT, RAS1_EVENT},
      {"detail", RAS1_DETAIL, RAS1_DETAIL, RAS1_DETAIL},
      {"all", kAll, kAll, kAll},
      {"error+detail", RAS1_ERROR | RAS1_DETAIL, RAS1_ERROR | RAS1_DETAIL, RAS1_ERROR | RAS1_DETAIL},
      {"none+event", RAS1_EVENT, RAS1_EVENT, RAS1_EVENT},
      {"error,tasks/=all,util/string=none", kAll, kAll, 0},
      {"tasks/=all,error", RAS1_ERROR, RAS1_ERROR, RAS1_ERROR},
      {"tasks/=none,tasks/start_stop=event", RAS1_EVENT, 0, RAS1_ERROR},
      {"util/=detail", RAS1_ERROR, RAS1_ERROR, RAS1_DETAIL},
      {"tasks/start_stop_more=all", RAS1_ERROR, RAS1_ERROR, RAS1_ERROR},
      {"Tasks/=all", RAS1_ERROR, RAS1_ERROR, RAS1_ERROR},
  };
  for (const LevelsCase& each : kCases) {
    SCOPED_TRACE(each.setting);
    const TraceLog log(each.setting);
    EXPECT_EQ(enabledLevels(startStop), each.start_stop);
    EXPECT_EQ(enabledLevels(install), each.install);
    EXPECT_EQ(enabledLevels(string), each.string);
  }
}

TEST(TraceLevels, AreErrorsWhenTheSettingIsEmptyOrUnset) {
  const TraceLog log("");
  EXPECT_EQ(enabledLevels(startStop), uint32_t{RAS1_ERROR});
  const ScopedVariable unset("KBB_RAS1", std::nullopt);
  EXPECT_EQ(configureTrace(), std::nullopt);
  EXPECT_EQ(enabledLevels(startStop), uint32_t{RAS1_ERROR});
}

TEST(TraceLevels, AreThoseOfTheLastConfigurationForUnitsThatAskLater) {
  const TraceLog log("none,late/=event");
  static constinit RAS1_Unit late{"late/unit"};
  EXPECT_EQ(RAS1_Sync(&late), uint32_t{RAS1_EVENT});
  EXPECT_EQ(late.levels.load(), uint32_t{RAS1_EVENT});
}

TEST(TraceLevels, StayAsTheyWereWhenTheSettingIsMistaken) {
  constexpr const char* kMistakes[][2] = {
      {"errors", R"(KBB_RAS1: "errors" is no trace level (none, error, event, detail or all))"},
      {"ERROR", R"(KBB_RAS1: "ERROR" is no trace level (none, error, event, detail or all))"},
      {"error,", R"(KBB_RAS1: "" is no trace level (none, error, event, detail or all))"},
      {",error", R"(KBB_RAS1: "" is no trace level (none, error, event, detail or all))"},
      {"error, detail", R"(KBB_RAS1: " detail" is no trace level (none, error, event, detail or all))"},
      {"error+", R"(KBB_RAS1: "" is no trace level (none, error, event, detail or all))"},
      {"tasks/=", R"(KBB_RAS1: "" is no trace level (none, error, event, detail or all))"},
      {"tasks/=all=none", R"(KBB_RAS1: "all=none" is no trace level (none, error, event, detail or all))"},
      {"tasks/", R"(KBB_RAS1: "tasks/" is no trace level (none, error, event, detail or all))"},
      {"=all", R"(KBB_RAS1: "=all" has no unit before its "=")"},
  };
  const TraceLog log("event");
  for (const auto& [setting, message] : kMistakes) {
    SCOPED_TRACE(setting);
    const ScopedVariable mistaken("KBB_RAS1", setting);
    EXPECT_EQ(configureTrace(), message);
    EXPECT_EQ(enabledLevels(startStop), uint32_t{RAS1_EVENT});
  }
}

TEST(TraceLevels, CutTheMessageOfAMistakeAtTheCallersBuffer) {
  const TraceLog log("event");
  const ScopedVariable mistaken("KBB_RAS1", "loud");
  char error[10];
  EXPECT_FALSE(RAS1_Configure(error, sizeof error));
  EXPECT_STREQ(error, "KBB_RAS1:");
  EXPECT_FALSE(RAS1_Configure(nullptr, 0));
}

}  // namespace

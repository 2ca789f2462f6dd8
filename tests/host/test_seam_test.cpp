// What tests can make the services do.

#include "test_seam.h"

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <cerrno>
#include <chrono>
#include <ctime>
#include <thread>

#include "bss1.h"
#include "fsi1.h"
#include "nls2.h"
#include "tests/host/sample_table.h"
#include "tests/host/trace_log.h"
#include "tests/support/scoped_variable.h"
#include "tests/support/temporary_directory.h"
#include "xml1.h"

namespace {

using testing::ElementsAre;

constinit RAS1_Unit unit{"tests/seam"};

// ---- trace -------------------------------------------------------------------------------------------------------

TEST(TraceCapture, KeepsLinesOfEveryLevelAsTheyWerePassed) {
  const TEST_TraceCapture trace;
  ASSERT_TRUE(RAS1_Enabled(unit, RAS1_EVENT));
  RAS1_Event(&unit, RAS1_ENTRY, 1, "routine");
  RAS1_Printf(&unit, RAS1_DETAIL, 2, "routine", "\t_data {\n");
  RAS1_Printf(&unit, RAS1_ERROR, 3, "routine", "code %d", 7);
  RAS1_Event(&unit, RAS1_EXIT, 1, "routine");
  const std::vector<TEST_TraceCapture::Line> lines = trace.lines();
  ASSERT_EQ(lines.size(), 4u);
  EXPECT_EQ(lines[1].level, RAS1_DETAIL);
  EXPECT_EQ(lines[1].unit, "tests/seam");
  EXPECT_EQ(lines[1].function, "routine");
  EXPECT_EQ(lines[1].text, "\t_data {\n");
  EXPECT_THAT(trace.texts(RAS1_EVENT), ElementsAre("entry", "exit"));
  EXPECT_TRUE(trace.has(RAS1_ERROR, "code 7"));
  EXPECT_FALSE(trace.has(RAS1_ERROR, "code"));
  EXPECT_FALSE(trace.has(RAS1_DETAIL, "code 7"));
  EXPECT_TRUE(trace.hasPrefix(RAS1_ERROR, "code"));
  EXPECT_FALSE(trace.hasPrefix(RAS1_ERROR, "ode"));
}

TEST(TraceCapture, ForgetsWhatItIsToldTo) {
  TEST_TraceCapture trace;
  RAS1_Printf(&unit, RAS1_DETAIL, 2, "routine", "x");
  trace.clear();
  EXPECT_TRUE(trace.lines().empty());
}

TEST(TraceCapture, StartsEmpty) {
  {
    const TEST_TraceCapture trace;
    RAS1_Printf(&unit, RAS1_DETAIL, 2, "routine", "x");
  }
  const TEST_TraceCapture trace;
  EXPECT_TRUE(trace.lines().empty());
}

TEST(TraceCapture, KeepsLongTextsWhole) {
  const TEST_TraceCapture trace;
  const std::string text(200000, 'x');
  RAS1_Printf(&unit, RAS1_DETAIL, 2, "routine", "%s", text.c_str());
  EXPECT_TRUE(trace.has(RAS1_DETAIL, text));
}

TEST(TraceCapture, LeavesErrnoAlone) {
  const TEST_TraceCapture trace;
  errno = ENOTDIR;
  RAS1_Printf(&unit, RAS1_DETAIL, 2, "routine", "x");
  EXPECT_EQ(errno, ENOTDIR);
}

TEST(TraceCapture, WritesNothingAndGivesTheLevelsBack) {
  static constinit RAS1_Unit late{"tests/late"};
  const TraceLog log("error");
  ASSERT_FALSE(RAS1_Enabled(unit, RAS1_DETAIL));
  {
    const TEST_TraceCapture trace;
    EXPECT_TRUE(RAS1_Enabled(unit, RAS1_DETAIL));
    EXPECT_TRUE(RAS1_Enabled(late, RAS1_DETAIL));
    ASSERT_EQ(configureTrace(), std::nullopt);
    EXPECT_TRUE(RAS1_Enabled(unit, RAS1_DETAIL));
    RAS1_Printf(&unit, RAS1_DETAIL, 2, "routine", "captured");
  }
  EXPECT_FALSE(RAS1_Enabled(unit, RAS1_DETAIL));
  EXPECT_FALSE(RAS1_Enabled(late, RAS1_DETAIL));
  EXPECT_TRUE(log.lines().empty());
}

// ---- passing of time ---------------------------------------------------------------------------------------------

TEST(RecordedSleeps, RecordSleepsAndMoveTheClocks) {
  const TEST_RecordedSleeps sleeps;
  const int64_t time = BSS1_GetTime();
  const int64_t elapsed = BSS1_GetElapsed();
  BSS1_Sleep(3600);
  BSS1_Sleep(5);
  EXPECT_THAT(sleeps.seconds(), ElementsAre(3600u, 5u));
  EXPECT_GE(BSS1_GetTime() - time, 3605);
  EXPECT_LT(BSS1_GetTime() - time, 3605 + 60);
  EXPECT_GE(BSS1_GetElapsed() - elapsed, 3605000);
  EXPECT_LT(BSS1_GetElapsed() - elapsed, 3605000 + 60000);
}

TEST(RecordedWaits, RecordWaitsThatTimeOut) {
  const TEST_RecordedWaits waits;
  pthread_mutex_t mutex = PTHREAD_MUTEX_INITIALIZER;
  pthread_cond_t condition = PTHREAD_COND_INITIALIZER;
  const int64_t elapsed = BSS1_GetElapsed();
  pthread_mutex_lock(&mutex);
  int result = 0;
  while (result == 0) result = BSS1_TimedWait(&condition, &mutex, 300000);
  pthread_mutex_unlock(&mutex);
  EXPECT_EQ(result, ETIMEDOUT);
  EXPECT_THAT(waits.milliseconds(), ElementsAre(300000));
  EXPECT_GE(BSS1_GetElapsed() - elapsed, 300000);
}

TEST(RecordedSleeps, EndWithTheWallClockRightAndTheElapsedClockNotBack) {
  int64_t elapsed;
  {
    const TEST_RecordedSleeps sleeps;
    BSS1_Sleep(100000);
    elapsed = BSS1_GetElapsed();
  }
  EXPECT_LE(BSS1_GetTime(), std::time(nullptr) + 1);
  EXPECT_GE(BSS1_GetElapsed(), elapsed);
  const TEST_RecordedSleeps again;
  EXPECT_TRUE(again.seconds().empty());
}

TEST(RecordedSleeps, LeaveTimedWaitsTheirRealTime) {
  const TEST_RecordedSleeps sleeps;
  pthread_mutex_t mutex = PTHREAD_MUTEX_INITIALIZER;
  pthread_cond_t condition = PTHREAD_COND_INITIALIZER;
  pthread_mutex_lock(&mutex);
  std::thread signals([&] {
    std::this_thread::sleep_for(std::chrono::milliseconds(50));  // longer than a recorded wait
    pthread_mutex_lock(&mutex);
    pthread_cond_signal(&condition);
    pthread_mutex_unlock(&mutex);
  });
  EXPECT_EQ(BSS1_TimedWait(&condition, &mutex, 300000), 0);
  pthread_mutex_unlock(&mutex);
  signals.join();
}

// ---- failing calls -----------------------------------------------------------------------------------------------

constexpr int kStatus = 1234;

/// Everything that a call of a service may need.
struct Services {
  TemporaryDirectory folder;
  BSS1_Lock* lock = BSS1_NewLock();
  XML1_Parser* parser = XML1_ParserCreate(nullptr);
  SampleManager table{"SEAM"};
  Collector collector;
  ContextInfo context{&collector};
  SampleRequest request{nullptr, &context, &table};
  std::string row = sampleRow("x", 1, "");
  FSI1_List* list = nullptr;

  Services() { EXPECT_EQ(FSI1_NewList(folder.path().c_str(), &list), 0); }
  ~Services() {
    FSI1_DeleteList(list);
    XML1_ParserFree(parser);
    BSS1_DeleteLock(lock);
  }
};

struct ServiceCase {
  const char* service;
  /// Calls the service once. Returns 0 when it did its work, else the status, or kStatus for a null result.
  int (*call)(Services&);
};

constexpr ServiceCase kServices[] = {
    {"BSS1_GetEnv", [](Services&) { return BSS1_GetEnv("PATH", nullptr) == nullptr ? kStatus : 0; }},
    {"BSS1_PutEnv", [](Services&) { return BSS1_PutEnv("VMQ_TEST_SEAM=1"); }},
    {"BSS1_GetLock",
     [](Services& services) {
       const int status = BSS1_GetLock(services.lock);
       if (status == 0) BSS1_ReleaseLock(services.lock);
       return status;
     }},
    {"BSS1_ReleaseLock",
     [](Services& services) {
       EXPECT_EQ(BSS1_GetLock(services.lock), 0);
       return BSS1_ReleaseLock(services.lock);
     }},
    {"BSS1_InitializeOnce",
     [](Services&) {
       static BSS1_Once once = BSS1_ONCE_INIT;
       return BSS1_InitializeOnce(&once, [] {});
     }},
    {"FSI1_NewList",
     [](Services& services) {
       FSI1_List* list = nullptr;
       const int status = FSI1_NewList(services.folder.path().c_str(), &list);
       if (status == 0) FSI1_DeleteList(list);
       return status;
     }},
    {"FSI1_FetchList",
     [](Services& services) {
       FSI1_Entry entry{};
       const int status = FSI1_FetchList(services.list, &entry);
       return status == FSI1_END_OF_LIST ? 0 : status;
     }},
    {"FSI1_DeleteList",
     [](Services& services) {
       FSI1_List* list = nullptr;
       EXPECT_EQ(FSI1_NewList(services.folder.path().c_str(), &list), 0);
       return FSI1_DeleteList(list);
     }},
    {"XML1_ParserCreate",
     [](Services&) {
       XML1_Parser* const parser = XML1_ParserCreate(nullptr);
       XML1_ParserFree(parser);
       return parser == nullptr ? kStatus : 0;
     }},
    {"XML1_GetBuffer", [](Services& services) { return XML1_GetBuffer(services.parser, 1) == nullptr ? kStatus : 0; }},
    {"XML1_ParseBuffer",
     [](Services& services) {
       XML1_GetBuffer(services.parser, 1);
       return XML1_ParseBuffer(services.parser, 0, 0) == 1 ? 0 : XML1_GetErrorCode(services.parser);
     }},
    {"NLS2_GetLocale",
     [](Services&) {
       NLS2_Locale* const locale = NLS2_GetLocale(NLS2_CURRENT_LOCALE, 0);
       NLS2_ReleaseLocale(locale);
       return locale == nullptr ? kStatus : 0;
     }},
    {"RegisterWithManager",
     [](Services&) {
       static unsigned number = 0;
       auto manager = std::make_unique<SampleManager>("SEAM" + std::to_string(++number));
       const unsigned status = TableManager::RegisterWithManager(manager.get());
       if (status == 0) (void)manager.release();  // lives as long as the process now
       return static_cast<int>(status);
     }},
    {"InsertRow", [](Services& services) { return static_cast<int>(services.request.InsertRow(services.row.data())); }},
    {"Dispatch", [](Services& services) { return static_cast<int>(services.request.Dispatch()); }},
};

TEST(FailCall, FailsTheGivenCallOfEachServiceOnce) {
  for (const ServiceCase& each : kServices) {
    SCOPED_TRACE(each.service);
    Services services;
    const TEST_FailCall second(each.service, 2, kStatus);
    EXPECT_EQ(each.call(services), 0);
    EXPECT_FALSE(second.happened());
    EXPECT_EQ(each.call(services), kStatus);
    EXPECT_TRUE(second.happened());
    EXPECT_EQ(each.call(services), 0);
  }
}

TEST(FailCall, LeavesOtherServicesAlone) {
  for (const ServiceCase& failing : kServices) {
    Services services;
    const TEST_FailCall next(failing.service, 1, kStatus);
    for (const ServiceCase& each : kServices) {
      // These calls need another service, which would be the one that fails.
      const std::string both = std::string(each.service) + "/" + failing.service;
      if (each.service == failing.service || both == "BSS1_GetLock/BSS1_ReleaseLock" ||
          both == "BSS1_ReleaseLock/BSS1_GetLock" || both == "FSI1_NewList/FSI1_DeleteList" ||
          both == "FSI1_DeleteList/FSI1_NewList" || both == "XML1_ParseBuffer/XML1_GetBuffer") {
        continue;
      }
      EXPECT_EQ(each.call(services), 0) << both;
    }
    EXPECT_FALSE(next.happened());
  }
}

TEST(FailCall, EndsWithItsObject) {
  for (const ServiceCase& each : kServices) {
    Services services;
    { const TEST_FailCall next(each.service, 1, kStatus); }
    EXPECT_EQ(each.call(services), 0) << each.service;
  }
}

TEST(FailCall, OfReleaseLockGivesTheLockBackAllTheSame) {
  Services services;
  EXPECT_EQ(BSS1_GetLock(services.lock), 0);
  const TEST_FailCall next("BSS1_ReleaseLock", 1, kStatus);
  EXPECT_EQ(BSS1_ReleaseLock(services.lock), kStatus);
  EXPECT_EQ(BSS1_ReleaseLock(services.lock), EPERM);
}

TEST(FailCall, OfDispatchDropsTheRowsThatWait) {
  Services services;
  EXPECT_EQ(services.request.InsertRow(services.row.data()), 0u);
  const TEST_FailCall next("Dispatch", 1, kStatus);
  EXPECT_EQ(services.request.Dispatch(), unsigned{kStatus});
  EXPECT_EQ(services.request.row_count, 0u);
  EXPECT_EQ(services.request.Dispatch(), 0u);
  EXPECT_TRUE(services.collector.rows.empty());
}

TEST(FailCall, OfAServiceDoesNotDisturbTheTraceItself) {
  const TEST_FailCall next("BSS1_GetEnv", 1, 0);
  const TraceLog log("all");
  EXPECT_FALSE(next.happened());
}

}  // namespace

// Files, where the system refuses what it hardly ever does.
#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <cerrno>
#include <cstdlib>
#include <filesystem>
#include <string>

#include "test_seam.h"
#include "tests/support/process_resources.h"
#include "tests/support/system_faults.h"
#include "tests/support/temporary_directory.h"
#include "util/startup_db.h"
#include "util/util.h"

namespace fs = std::filesystem;
using testing::ElementsAre;
using testing::IsEmpty;
using VMQ::AgentEntry;
using VMQ::StartupDB;
using VMQ::String;
using VMQ::Util;

namespace {

// ---- the run-as database -------------------------------------------------------------------------------------------

constexpr char kBefore[] = "<runas>kept</runas>";
constexpr char kAfter[] =
    "<runas>\n"
    "\t<agent>\n"
    "\t\t<productCode>um</productCode>\n"
    "\t</agent>\n"
    "</runas>\n";

class SavedDatabase : public testing::Test {
 protected:
  SavedDatabase() : path_(directory_.writeFile("runas.cfg", kBefore)), database_(String(path_.c_str())) {
    database_.addAgent(new AgentEntry(String("um")));
    trace_.clear();
  }
  [[nodiscard]] long files() const {
    return std::distance(fs::directory_iterator(directory_.path()), fs::directory_iterator());
  }

  const TemporaryDirectory directory_;
  TEST_TraceCapture trace_;
  const std::string path_;
  StartupDB database_;
};

TEST_F(SavedDatabase, StaysAsItWasWhenAStepOfTheReplacementFails) {
  const struct {
    const char* step;
    SystemCall call;
    int nth = 1;
  } cases[] = {
      {"looking at the file", SystemCall::kStat},      {"giving its owner", SystemCall::kFchown},
      {"giving its mode", SystemCall::kFchmod},        {"writing", SystemCall::kWrite},
      {"bringing it to the disk", SystemCall::kFsync}, {"closing the new file", SystemCall::kClose},
      {"giving it the name", SystemCall::kRename},
  };
  for (const auto& [step, call, nth] : cases) {
    SCOPED_TRACE(step);
    trace_.clear();
    const ProcessResources before = ProcessResources::now();
    {
      const SystemFault fault(call, EIO, nth);
      EXPECT_TRUE(database_.save());
      EXPECT_TRUE(fault.happened());
    }
    EXPECT_THAT(trace_.texts(RAS1_ERROR),
                ElementsAre("Error writing file " + path_ + ", it stays as it was: Input/output error"));
    EXPECT_EQ(readWholeFile(path_), kBefore);
    EXPECT_EQ(files(), 1);
    EXPECT_EQ(ProcessResources::now(), before);
  }
  EXPECT_TRUE(database_.save());
  EXPECT_EQ(readWholeFile(path_), kAfter);
}

TEST_F(SavedDatabase, InterruptedWriteIsRepeated) {
  const SystemFault fault(SystemCall::kWrite, EINTR, 1, 2);
  EXPECT_TRUE(database_.save());
  EXPECT_TRUE(fault.happened());
  EXPECT_THAT(trace_.texts(RAS1_ERROR), IsEmpty());
  EXPECT_EQ(readWholeFile(path_), kAfter);
}

// ---- files ---------------------------------------------------------------------------------------------------------

TEST(ReadFile, ThatBreaksOffGivesItsErrorNumberAndNoBuffer) {
  const TemporaryDirectory directory;
  // Longer than the C library reads when it asks for the length.
  const std::string path = directory.writeFile("file", std::string(20000, 'x'));
  const ProcessResources before = ProcessResources::now();
  char nothing = 0;
  char* contents = &nothing;
  unsigned long size = 99;
  {
    const SystemFault fault(SystemCall::kFread, EISDIR);
    EXPECT_EQ(Util::readFile(path.c_str(), &contents, &size), EISDIR);
    EXPECT_TRUE(fault.happened());
  }
  EXPECT_EQ(contents, nullptr);
  EXPECT_EQ(size, 0u);
  EXPECT_EQ(ProcessResources::now(), before);
}

TEST(CreateDir, FindsADirectoryThatSomebodyElseMadeMeanwhile) {
  const TemporaryDirectory directory;
  for (const int nth : {1, 2}) {
    TEST_TraceCapture trace;
    std::string path = directory / ("a" + std::to_string(nth)) + "/b";
    const SystemFault fault(SystemCall::kMkdir, EEXIST, nth);
    EXPECT_EQ(Util::createDir(path.data()), 0);
    EXPECT_TRUE(fault.happened());
    EXPECT_TRUE(fs::is_directory(path));
    EXPECT_THAT(trace.texts(RAS1_ERROR), IsEmpty());
  }
}

}  // namespace

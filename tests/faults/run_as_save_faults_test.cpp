// Every call that saving the run-as database makes of the system fails at its first, second, ... time. The file then
// holds its old contents, and the trace tells, or its new ones. Nothing else is left beside it.

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <cerrno>
#include <cstring>
#include <filesystem>

#include "test_seam.h"
#include "tests/support/process_resources.h"
#include "tests/support/system_faults.h"
#include "tests/support/temporary_directory.h"
#include "util/startup_db.h"

namespace {

namespace fs = std::filesystem;
using VMQ::AgentEntry;
using VMQ::StartupDB;
using VMQ::String;

constexpr char kOld[] = "<runas>old</runas>";
constexpr char kNew[] = "<runas>\n\t<agent>\n\t\t<productCode>um</productCode>\n\t</agent>\n</runas>\n";

struct Step {
  const char* name;
  SystemCall call;
  int error;
  bool opens = false;     ///< before it the file is not open for writing: saving says that it has failed
  int harmless_call = 0;  ///< the one that nothing depends on
};

// clang-format off
constexpr Step kSteps[] = {
    {"open",     SystemCall::kOpen,     EACCES, /*opens=*/true},
    {"fstat",    SystemCall::kStat,     EIO},
    {"realpath", SystemCall::kRealpath, ELOOP,  /*opens=*/true},
    {"mkostemp", SystemCall::kMkostemp, ENOSPC, /*opens=*/true},
    {"fchown",   SystemCall::kFchown,   EPERM},
    {"fchmod",   SystemCall::kFchmod,   EPERM},
    {"write",    SystemCall::kWrite,    ENOSPC},
    {"fsync",    SystemCall::kFsync,    EIO},
    {"close",    SystemCall::kClose,    EIO,    /*opens=*/false, /*harmless_call=*/2},  // of the old file
    {"rename",   SystemCall::kRename,   EXDEV},
};
// clang-format on

class SavingTheRunAsFile : public testing::TestWithParam<Step> {
 protected:
  /// False when it does not make so many calls of the function.
  bool survives(int nth, bool file_exists);

 private:
  [[nodiscard]] std::string contents() const { return fs::exists(path_) ? readWholeFile(path_) : "nothing"; }

  TemporaryDirectory directory_;
  const std::string path_ = directory_ / "runas.cfg";
  TEST_TraceCapture trace_;
};

bool SavingTheRunAsFile::survives(int nth, bool file_exists) {
  SCOPED_TRACE(testing::Message() << GetParam().name << " fails at call " << nth << (file_exists ? "" : ", no file"));
  fs::remove(path_);
  if (file_exists) directory_.writeFile("runas.cfg", kOld);
  const std::string before = contents();
  StartupDB database{String(path_.c_str())};
  database.addAgent(new AgentEntry(String("um")));
  trace_.clear();
  const ProcessResources resources = ProcessResources::now();
  bool saved = false;
  bool failed = false;
  {
    const SystemFault fault(GetParam().call, GetParam().error, nth);
    saved = database.save();
    failed = fault.happened();
  }
  EXPECT_EQ(ProcessResources::now(), resources);
  const std::vector<std::string> errors = trace_.texts(RAS1_ERROR);
  const std::string reason = std::strerror(GetParam().error);
  if (!failed || nth == GetParam().harmless_call) {
    EXPECT_EQ(contents(), kNew);
    EXPECT_TRUE(saved);
    EXPECT_THAT(errors, testing::IsEmpty());
  } else {
    EXPECT_EQ(contents(), before);
    EXPECT_EQ(saved, !GetParam().opens);
    EXPECT_THAT(errors, testing::ElementsAre(GetParam().opens
                                                 ? "Error opening file, " + path_ + ", in write mode: %"
                                                 : "Error writing file " + path_ + ", it stays as it was: " + reason));
  }
  const long files = std::distance(fs::directory_iterator(directory_.path()), fs::directory_iterator());
  EXPECT_EQ(files, fs::exists(path_) ? 1 : 0) << "something is left beside it";
  return failed;
}

TEST_P(SavingTheRunAsFile, LeavesItsOldOrItsNewContentsAndTells) {
  for (const bool file_exists : {true, false}) {
    int nth = 1;
    while (survives(nth, file_exists) && !HasFailure()) ++nth;
    EXPECT_GT(nth, 1) << GetParam().name << " was never failed";
  }
}

INSTANTIATE_TEST_SUITE_P(Calls, SavingTheRunAsFile, testing::ValuesIn(kSteps),
                         [](const auto& tested) { return std::string(tested.param.name); });

}  // namespace

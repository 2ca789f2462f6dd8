// The run-as database, written to its file.
#include <fcntl.h>
#include <gmock/gmock.h>
#include <gtest/gtest.h>
#include <sys/resource.h>
#include <sys/stat.h>
#include <unistd.h>

#include <csignal>
#include <filesystem>
#include <random>
#include <string>

#include "test_seam.h"
#include "tests/support/process_resources.h"
#include "tests/support/scoped_locale.h"
#include "tests/support/temporary_directory.h"
#include "util/startup_db.h"

namespace fs = std::filesystem;
using VMQ::AgentEntry;
using VMQ::InstanceEntry;
using VMQ::StartupDB;
using VMQ::String;

namespace {

AgentEntry* newAgent(const std::string& productCode) {
  return new AgentEntry(String(productCode.c_str()));
}

InstanceEntry* newInstance(const std::string& name, const std::string& user) {
  return new InstanceEntry(String(name.c_str()), String(user.c_str()));
}

class StartupDBSaveTest : public testing::Test {
 protected:
  [[nodiscard]] StartupDB open(const std::string& path) const { return StartupDB(String(path.c_str())); }
  [[nodiscard]] StartupDB open() const { return open(path_); }
  [[nodiscard]] long files() const {
    return std::distance(fs::directory_iterator(directory_.path()), fs::directory_iterator());
  }

  TemporaryDirectory directory_;
  const std::string path_ = directory_ / "runas.cfg";
  TEST_TraceCapture trace_;
};

TEST_F(StartupDBSaveTest, FileHasTheNineKindsOfLines) {
  StartupDB database = open();
  database.addAgent(newAgent("um"));
  database.getAgent(0U)->addInstance(newInstance("inst1", "dbuser"));
  database.getAgent(0U)->addInstance(newInstance("inst2", ""));
  database.addAgent(newAgent("ux"));
  EXPECT_TRUE(database.save());
  EXPECT_EQ(readWholeFile(path_),
            "<runas>\n"
            "\t<agent>\n"
            "\t\t<productCode>um</productCode>\n"
            "\t\t<instance>\n"
            "\t\t\t<name>inst1</name>\n"
            "\t\t\t<user>dbuser</user>\n"
            "\t\t</instance>\n"
            "\t\t<instance>\n"
            "\t\t\t<name>inst2</name>\n"
            "\t\t\t<user></user>\n"
            "\t\t</instance>\n"
            "\t</agent>\n"
            "\t<agent>\n"
            "\t\t<productCode>ux</productCode>\n"
            "\t</agent>\n"
            "</runas>\n");
}

TEST_F(StartupDBSaveTest, EmptyModelIsAnEmptyRoot) {
  EXPECT_TRUE(open().save());
  EXPECT_EQ(readWholeFile(path_), "<runas>\n</runas>\n");
}

TEST_F(StartupDBSaveTest, EarlierContentsAreReplaced) {
  directory_.writeFile("runas.cfg",
                       "<r><agent><productCode>um</productCode></agent>" + std::string(5000, ' ') + "</r>");
  StartupDB database = open();
  database.removeAgent(0);
  EXPECT_TRUE(database.save());
  EXPECT_EQ(readWholeFile(path_), "<runas>\n</runas>\n");
  EXPECT_EQ(files(), 1);
}

TEST_F(StartupDBSaveTest, RemovedInstanceIsNotWritten) {
  StartupDB database = open();
  database.addAgent(newAgent("um"));
  database.getAgent(0U)->addInstance(newInstance("a", ""));
  database.getAgent(0U)->addInstance(newInstance("b", ""));
  database.getAgent(0U)->removeInstance(0);
  EXPECT_TRUE(database.save());
  const StartupDB loaded = open();
  EXPECT_EQ(loaded.getAgent(0U)->getNumInstances(), 1u);
  EXPECT_EQ(loaded.getAgent(0U)->getInstance(0U)->getInstanceName(), String("b"));
}

TEST_F(StartupDBSaveTest, ChangedUserReachesTheFile) {
  directory_.writeFile("runas.cfg",
                       "<r><agent><productCode>um</productCode><instance><name>n</name></instance></agent></r>");
  const StartupDB database = open();
  database.getAgent(0U)->getInstance(0U)->setUser(String("new"));
  EXPECT_TRUE(database.save());
  EXPECT_EQ(open().getAgent(0U)->getInstance(0U)->getUser(), String("new"));
}

TEST_F(StartupDBSaveTest, BytesBeyondAsciiComeBack) {
  StartupDB database = open();
  database.addAgent(newAgent("\xC3\xA9"));
  EXPECT_TRUE(database.save());
  EXPECT_EQ(open().getAgent(0U)->getProductCode().toNarrow(), "\xC3\xA9");
}

TEST_F(StartupDBSaveTest, CharactersOfSeveralBytesAreWrittenWhole) {
  const ScopedLocale utf8("C.UTF-8");
  const std::string name = "\xE2\x82\xAC\xE2\x82\xAC\xC3\xA9";
  StartupDB database = open();
  database.addAgent(newAgent(name));
  EXPECT_TRUE(database.save());
  EXPECT_EQ(readWholeFile(path_),
            "<runas>\n\t<agent>\n\t\t<productCode>" + name + "</productCode>\n\t</agent>\n</runas>\n");
  EXPECT_EQ(open().getAgent(0U)->getProductCode().toNarrow(), name);
}

TEST_F(StartupDBSaveTest, LongValueIsWrittenWhole) {
  const std::string name(100000, 'n');
  StartupDB database = open();
  database.addAgent(newAgent(name));
  EXPECT_TRUE(database.save());
  EXPECT_EQ(open().getAgent(0U)->getProductCode().toNarrow(), name);
}

TEST_F(StartupDBSaveTest, RandomModelsSurviveTheRoundTrip) {
  const unsigned seed = std::random_device()();
  SCOPED_TRACE(seed);
  std::mt19937 random(seed);
  const auto value = [&random] {
    std::string text;
    for (unsigned n = random() % 10; n > 0; --n) text += "abzAZ019_-.@$>'\"\\/;:"[random() % 20];
    return text;
  };
  for (int round = 0; round < 30; ++round) {
    fs::remove(path_);
    StartupDB database = open();
    for (unsigned agents = random() % 6; agents > 0; --agents) {
      AgentEntry* const agent = newAgent(value());
      for (unsigned instances = random() % 6; instances > 0; --instances)
        agent->addInstance(newInstance(value(), value()));
      database.addAgent(agent);
    }
    ASSERT_TRUE(database.save());
    const std::string text = readWholeFile(path_);
    const StartupDB loaded = open();
    ASSERT_EQ(loaded.getNumAgents(), database.getNumAgents());
    for (unsigned a = 0; a < loaded.getNumAgents(); ++a) {
      const AgentEntry* const expected = database.getAgent(a);
      const AgentEntry* const agent = loaded.getAgent(a);
      EXPECT_EQ(agent->getProductCode(), expected->getProductCode());
      ASSERT_EQ(agent->getNumInstances(), expected->getNumInstances());
      for (unsigned i = 0; i < agent->getNumInstances(); ++i) {
        EXPECT_EQ(agent->getInstance(i)->getInstanceName(), expected->getInstance(i)->getInstanceName());
        EXPECT_EQ(agent->getInstance(i)->getUser(), expected->getInstance(i)->getUser());
      }
    }
    ASSERT_TRUE(loaded.save());
    EXPECT_EQ(readWholeFile(path_), text);
  }
}

// ---- the file ------------------------------------------------------------------------------------------------------

TEST_F(StartupDBSaveTest, ModeOfTheFileStays) {
  directory_.writeFile("runas.cfg", "<runas/>");
  fs::permissions(path_, fs::perms::owner_read | fs::perms::owner_write);
  EXPECT_TRUE(open().save());
  EXPECT_EQ(fs::status(path_).permissions(), fs::perms::owner_read | fs::perms::owner_write);
}

TEST_F(StartupDBSaveTest, LinkStaysALink) {
  directory_.writeFile("real.cfg", "<runas/>");
  fs::create_symlink("real.cfg", path_);
  StartupDB database = open();
  database.addAgent(newAgent("um"));
  EXPECT_TRUE(database.save());
  EXPECT_TRUE(fs::is_symlink(path_));
  EXPECT_EQ(readWholeFile(directory_ / "real.cfg"), readWholeFile(path_));
  EXPECT_EQ(open().getNumAgents(), 1u);
}

TEST_F(StartupDBSaveTest, FileThatCannotBeOpenedIsAFailure) {
  for (const std::string& path : {directory_ / "none/runas.cfg", directory_.path().string()}) {
    trace_.clear();
    StartupDB database = open(path);
    database.addAgent(newAgent("um"));
    EXPECT_FALSE(database.save());
    EXPECT_TRUE(trace_.has(RAS1_ERROR, "Error opening file, " + path + ", in write mode: %"));
    EXPECT_EQ(database.getNumAgents(), 1u);
  }
}

TEST_F(StartupDBSaveTest, NameThatLeavesNoRoomForTheFileBesideIsAFailureAndTheFileStays) {
  const std::string name(250, 'n');
  const std::string contents = "<r><agent><productCode>um</productCode></agent></r>";
  const std::string path = directory_.writeFile(name, contents);
  EXPECT_FALSE(open(path).save());
  EXPECT_TRUE(trace_.has(RAS1_ERROR, "Error opening file, " + path + ", in write mode: %"));
  EXPECT_EQ(readWholeFile(path), contents);
  EXPECT_EQ(files(), 1);
}

TEST_F(StartupDBSaveTest, FileWithoutANameAnyMoreIsAFailure) {
  const int descriptor = ::open(directory_.writeFile("gone", "<r/>").c_str(), O_RDWR | O_CLOEXEC);
  ASSERT_GE(descriptor, 0);
  fs::remove(directory_ / "gone");
  const std::string path = "/proc/self/fd/" + std::to_string(descriptor);
  EXPECT_FALSE(open(path).save());
  EXPECT_TRUE(trace_.has(RAS1_ERROR, "Error opening file, " + path + ", in write mode: %"));
  EXPECT_EQ(files(), 0);
  close(descriptor);
}

TEST_F(StartupDBSaveTest, ValueThatCouldNotBeReadBackIsRefusedAndTheFileStays) {
  directory_.writeFile("runas.cfg", "<runas>kept</runas>");
  for (const char* const value : {"a<b", "R&D", "&amp;", "</user><user>root", "a]]>b", "\x01", "not UTF-8: \xFC"}) {
    SCOPED_TRACE(value);
    for (int place = 0; place < 3; ++place) {
      trace_.clear();
      StartupDB database = open();
      database.addAgent(newAgent(place == 0 ? value : "um"));
      database.getAgent(0U)->addInstance(newInstance(place == 1 ? value : "n", place == 2 ? value : "u"));
      EXPECT_FALSE(database.save());
      EXPECT_TRUE(
          trace_.has(RAS1_ERROR, "File " + path_ + " is not saved: a name or user in it could not be read back"));
    }
  }
  EXPECT_EQ(readWholeFile(path_), "<runas>kept</runas>");
  EXPECT_EQ(files(), 1);
}

TEST_F(StartupDBSaveTest, CarriageReturnThatWouldComeBackAsALineFeedIsRefused) {
  const std::string contents =
      "<runas><agent><productCode>um</productCode><instance><name>a&#13;b</name></instance></agent></runas>";
  directory_.writeFile("runas.cfg", contents);
  const StartupDB database = open();
  ASSERT_EQ(database.getAgent(0U)->getInstance(0U)->getInstanceName(), "a\rb");
  EXPECT_FALSE(database.save());
  EXPECT_EQ(readWholeFile(path_), contents);
}

// A limit on the size of files stands for a full disk.
TEST_F(StartupDBSaveTest, FullDiskIsTracedAndLeavesTheEarlierContentsWhole) {
  directory_.writeFile("runas.cfg", "<runas>kept</runas>");
  StartupDB database = open();
  database.addAgent(newAgent(std::string(5000, 'x')));
  rlimit before{};
  ASSERT_EQ(getrlimit(RLIMIT_FSIZE, &before), 0);
  rlimit small = before;
  small.rlim_cur = 100;
  const auto handler = std::signal(SIGXFSZ, SIG_IGN);
  ASSERT_EQ(setrlimit(RLIMIT_FSIZE, &small), 0);
  const bool saved = database.save();
  ASSERT_EQ(setrlimit(RLIMIT_FSIZE, &before), 0);
  std::signal(SIGXFSZ, handler);
  EXPECT_TRUE(saved);
  EXPECT_TRUE(trace_.has(RAS1_ERROR, "Error writing file " + path_ + ", it stays as it was: File too large"));
  EXPECT_EQ(readWholeFile(path_), "<runas>kept</runas>");
  EXPECT_EQ(files(), 1);
}

TEST_F(StartupDBSaveTest, FullDeviceIsTraced) {
  EXPECT_TRUE(open("/dev/full").save());
  EXPECT_TRUE(trace_.has(RAS1_ERROR, "Error writing file /dev/full, it stays as it was: No space left on device"));
  EXPECT_FALSE(fs::is_regular_file("/dev/full"));
}

TEST_F(StartupDBSaveTest, NothingIsLeftOpen) {
  const ProcessResources before = ProcessResources::now();
  (void)open().save();
  (void)open("/dev/full").save();
  (void)open(directory_ / "none/runas.cfg").save();
  EXPECT_EQ(ProcessResources::now(), before);
}

}  // namespace

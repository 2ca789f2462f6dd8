// The configuration file: what each key does, and what is said about each mistake.

#include "apps/vmqd/config.h"

#include <gmock/gmock.h>
#include <sys/stat.h>

#include <filesystem>
#include <string>

#include "tests/support/temporary_directory.h"

namespace vmqd {
namespace {

using ::testing::ElementsAre;
using ::testing::HasSubstr;
using ::testing::Pair;

Configuration parsed(const std::string& lines) {
  return parseConfiguration("vmqd.conf", "home = /tmp\n" + lines);
}

/// What is said about the lines that follow a first, good one.
std::string complaint(const std::string& lines) {
  try {
    (void)parsed(lines);
  } catch (const ConfigurationError& error) {
    return error.what();
  }
  return "";
}

TEST(Configuration, OnlyTheHomeIsRequired) {
  const Configuration configuration = parsed("");
  EXPECT_EQ("/tmp", configuration.home);
  EXPECT_EQ("/run/vmqd/vmqd.sock", configuration.socket);
  EXPECT_EQ("", configuration.library);
  EXPECT_EQ("", configuration.node);
  EXPECT_EQ(1000u, configuration.event_buffer_rows);
  EXPECT_EQ(1048576u, configuration.maximum_request_bytes);
  EXPECT_EQ(4194304u, configuration.maximum_packet_bytes);
  EXPECT_EQ(33554432u, configuration.packet_memory_bytes);
  EXPECT_EQ(256u, configuration.maximum_connections);
  EXPECT_EQ(60u, configuration.client_seconds);
  EXPECT_EQ(5u, configuration.stop_seconds);
  EXPECT_THAT(configuration.allowed_uids, ElementsAre());
  EXPECT_THAT(configuration.variables, ElementsAre(Pair("CORVELHOME", "/tmp")));
}

TEST(Configuration, EveryKeyHasItsPlace) {
  const Configuration configuration = parsed(
      "socket = /s/v.sock\n"
      "library=/l/libvmq.so\n"
      "\tnode\t=\tn1\t\r\n"
      "depot = /d\n"
      "trace = error,tasks/=all\n"
      "trace_log = /t/log\n"
      "command_timeout_seconds = 90\n"
      "allowed_uids = 1000, 1001\n"
      "event_buffer_rows = 1\n"
      "maximum_request_bytes = 1024\n"
      "maximum_packet_bytes = 8192\n"
      "packet_memory_bytes = 2147483648\n"
      "maximum_connections = 4\n"
      "client_seconds = 86400\n"
      "stop_seconds = 0\n"
      "environment.JAVA_HOME = /usr/lib/jvm = x\n"
      "environment.EMPTY =\n");
  EXPECT_EQ("/s/v.sock", configuration.socket);
  EXPECT_EQ("/l/libvmq.so", configuration.library);
  EXPECT_EQ("n1", configuration.node);
  EXPECT_THAT(configuration.allowed_uids, ElementsAre(1000u, 1001u));
  EXPECT_EQ(1u, configuration.event_buffer_rows);
  EXPECT_EQ(1024u, configuration.maximum_request_bytes);
  EXPECT_EQ(8192u, configuration.maximum_packet_bytes);
  EXPECT_EQ(2147483648u, configuration.packet_memory_bytes);
  EXPECT_EQ(4u, configuration.maximum_connections);
  EXPECT_EQ(86400u, configuration.client_seconds);
  EXPECT_EQ(0u, configuration.stop_seconds);
  EXPECT_THAT(configuration.variables,
              ElementsAre(Pair("CORVELHOME", "/tmp"), Pair("QORDEPLOY_AGENTDEPOT", "/d"),
                          Pair("KBB_RAS1", "error,tasks/=all"), Pair("KBB_RAS1_LOG", "/t/log"), Pair("TIMEOUT", "90"),
                          Pair("JAVA_HOME", "/usr/lib/jvm = x"), Pair("EMPTY", "")));
}

TEST(Configuration, CommentsAndBlankLinesSayNothing) {
  EXPECT_EQ("n#1", parsed("# home = /nowhere\n\n   \n\t# x\nnode = n#1").node);
}

TEST(Configuration, TracesMayBeSetToNothing) {
  EXPECT_THAT(parsed("trace =\ntrace_log =\n").variables,
              ElementsAre(Pair("CORVELHOME", "/tmp"), Pair("KBB_RAS1", ""), Pair("KBB_RAS1_LOG", "")));
}

TEST(Configuration, PlacesOfKeysAreKnownLater) {
  EXPECT_EQ("vmqd.conf:3: trace", parsed("\ntrace = x").places.find("trace")->second);
}

struct Mistake {
  std::string line;
  std::string complaint;
};

const Mistake mistakes[] = {
    Mistake{"sokket = /x", "vmqd.conf:2: sokket: is not a known key"},
    Mistake{"Socket = /x", "vmqd.conf:2: Socket: is not a known key"},
    Mistake{"node = a\n\nnode = b", "vmqd.conf:4: node: is set twice"},
    Mistake{"home = /tmp", "vmqd.conf:2: home: is set twice"},
    Mistake{"environment.A = 1\nenvironment.A = 2", "vmqd.conf:3: environment.A: is set twice"},
    Mistake{"node", "vmqd.conf:2: is not of the form \"key = value\""},
    Mistake{"= x", "vmqd.conf:2: is not of the form \"key = value\""},
    Mistake{"node = a # the name", "vmqd.conf:2: node: a comment needs a line of its own"},
    Mistake{"trace = all\t#x", "vmqd.conf:2: trace: a comment needs a line of its own"},
    Mistake{std::string("trace = a\0b", 11), "vmqd.conf:2: trace: must not hold control characters"},
    Mistake{"trace = a\x1b[0m", "vmqd.conf:2: trace: must not hold control characters"},
    Mistake{"socket = run/x", "vmqd.conf:2: socket: must be an absolute path"},
    Mistake{"socket =", "vmqd.conf:2: socket: must be an absolute path"},
    Mistake{"socket = /x/", "vmqd.conf:2: socket: must name a socket, not a directory"},
    Mistake{"socket = /" + std::string(107, 'x'), "vmqd.conf:2: socket: must be at most 107 bytes long"},
    Mistake{"library = libvmq.so", "vmqd.conf:2: library: must be an absolute path"},
    Mistake{"depot = depot", "vmqd.conf:2: depot: must be an absolute path"},
    Mistake{"depot =", "vmqd.conf:2: depot: must be an absolute path"},
    Mistake{"depot = /my depot", "vmqd.conf:2: depot: must not hold white space or characters that a shell interprets"},
    Mistake{"depot = /d;rm", "vmqd.conf:2: depot: must not hold white space or characters that a shell interprets"},
    Mistake{"trace_log = x.log", "vmqd.conf:2: trace_log: must be an absolute path"},
    Mistake{"node =", "vmqd.conf:2: node: must be a name of 1 to 64 bytes without blanks"},
    Mistake{"node = a b", "vmqd.conf:2: node: must be a name of 1 to 64 bytes without blanks"},
    Mistake{"node = " + std::string(65, 'n'), "vmqd.conf:2: node: must be a name of 1 to 64 bytes without blanks"},
    Mistake{"command_timeout_seconds = 0", "vmqd.conf:2: command_timeout_seconds: must be a number from 1 to 604800"},
    Mistake{"command_timeout_seconds = 5m", "vmqd.conf:2: command_timeout_seconds: must be a number from 1 to 604800"},
    Mistake{"command_timeout_seconds =", "vmqd.conf:2: command_timeout_seconds: must be a number from 1 to 604800"},
    Mistake{"allowed_uids =", "vmqd.conf:2: allowed_uids: must be numbers of users joined by \",\""},
    Mistake{"allowed_uids = 1,,2", "vmqd.conf:2: allowed_uids: must be numbers of users joined by \",\""},
    Mistake{"allowed_uids = 1,", "vmqd.conf:2: allowed_uids: must be numbers of users joined by \",\""},
    Mistake{"allowed_uids = -1", "vmqd.conf:2: allowed_uids: must be numbers of users joined by \",\""},
    Mistake{"allowed_uids = root", "vmqd.conf:2: allowed_uids: must be numbers of users joined by \",\""},
    Mistake{"allowed_uids = 4294967295", "vmqd.conf:2: allowed_uids: must be numbers of users joined by \",\""},
    Mistake{"allowed_uids = 4294967296", "vmqd.conf:2: allowed_uids: must be numbers of users joined by \",\""},
    Mistake{"event_buffer_rows = 0", "vmqd.conf:2: event_buffer_rows: must be a number from 1 to 1000000"},
    Mistake{"event_buffer_rows = 1000001", "vmqd.conf:2: event_buffer_rows: must be a number from 1 to 1000000"},
    Mistake{"event_buffer_rows = -1", "vmqd.conf:2: event_buffer_rows: must be a number from 1 to 1000000"},
    Mistake{"event_buffer_rows = +1", "vmqd.conf:2: event_buffer_rows: must be a number from 1 to 1000000"},
    Mistake{"event_buffer_rows = 99999999999999999999",
            "vmqd.conf:2: event_buffer_rows: must be a number from 1 to 1000000"},
    Mistake{"maximum_request_bytes = 1023",
            "vmqd.conf:2: maximum_request_bytes: must be a number from 1024 to 268435456"},
    Mistake{"maximum_packet_bytes = 8191",
            "vmqd.conf:2: maximum_packet_bytes: must be a number from 8192 to 268435456"},
    Mistake{"packet_memory_bytes = 8191", "vmqd.conf:2: packet_memory_bytes: must be a number from 8192 to 2147483648"},
    Mistake{"packet_memory_bytes = 4194303",
            "vmqd.conf:2: packet_memory_bytes: packet_memory_bytes (4194303) must not be less than "
            "maximum_packet_bytes (4194304)"},
    Mistake{"maximum_packet_bytes = 33554433",
            "vmqd.conf:2: maximum_packet_bytes: packet_memory_bytes (33554432) must not be less than "
            "maximum_packet_bytes (33554433)"},
    Mistake{"maximum_connections = 3", "vmqd.conf:2: maximum_connections: must be a number from 4 to 10000"},
    Mistake{"stop_seconds = 3601", "vmqd.conf:2: stop_seconds: must be a number from 0 to 3600"},
    Mistake{"environment. = x", "vmqd.conf:2: environment.: is not the name of an environment variable"},
    Mistake{"environment.1A = x", "vmqd.conf:2: environment.1A: is not the name of an environment variable"},
    Mistake{"environment.A-B = x", "vmqd.conf:2: environment.A-B: is not the name of an environment variable"},
    Mistake{"environment.CORVELHOME = /x", "vmqd.conf:2: environment.CORVELHOME: is set by the key \"home\""},
    Mistake{"environment.TIMEOUT = 1",
            "vmqd.conf:2: environment.TIMEOUT: is set by the key \"command_timeout_seconds\""}};

TEST(ConfigurationMistakes, AreNamedWithKeyAndLine) {
  for (const auto& each : mistakes) {
    EXPECT_EQ(each.complaint, complaint(each.line)) << each.line;
  }
}

TEST(Configuration, TheHomeIsADirectoryThatExists) {
  const auto complaintAbout = [](const std::string& text) -> std::string {
    try {
      (void)parseConfiguration("f", text);
    } catch (const ConfigurationError& error) {
      return error.what();
    }
    return "";
  };
  EXPECT_EQ("f: home: is missing", complaintAbout(""));
  EXPECT_EQ("f:1: home: must be an absolute path", complaintAbout("home = ."));
  EXPECT_EQ("f:1: home: /does/not/exist: No such file or directory", complaintAbout("home = /does/not/exist"));
  EXPECT_EQ("f:1: home: /dev/null is not a directory", complaintAbout("home = /dev/null"));
  const TemporaryDirectory directory;
  for (const char* const name : {"my home", "h$(id)", "h;id", "h'"}) {
    std::filesystem::create_directory(directory.path() / name);
    EXPECT_EQ("f:1: home: must not hold white space or characters that a shell interprets",
              complaintAbout("home = " + (directory / name)));
  }
}

TEST(ConfigurationFile, IsReadWhole) {
  const TemporaryDirectory directory;
  std::string text = "home = /tmp\n";
  while (text.size() < 100000) text += "# filler, so that it takes many reads\n";
  EXPECT_EQ("last", readConfiguration(directory.writeFile("c", text + "node = last")).node);
}

TEST(ConfigurationFile, ThatCannotBeReadIsNamed) {
  const TemporaryDirectory directory;
  const auto complaintAbout = [](const std::string& file) -> std::string {
    try {
      (void)readConfiguration(file);
    } catch (const ConfigurationError& error) {
      return error.what();
    }
    return "";
  };
  EXPECT_EQ(directory / "none" + ": No such file or directory", complaintAbout(directory / "none"));
  EXPECT_EQ(directory.path().string() + ": is not a file", complaintAbout(directory.path()));
  EXPECT_THAT(complaintAbout(directory.writeFile("large", std::string((1 << 20) + 1, '#'))),
              HasSubstr("is larger than any configuration"));
}

TEST(ConfigurationFile, ThatEveryUserMayWriteIsRefused) {
  const TemporaryDirectory directory;
  const std::string file = directory.writeFile("c", "home = /tmp\n");
  ASSERT_EQ(0, chmod(file.c_str(), 0666));
  try {
    (void)readConfiguration(file);
    FAIL() << "it has been read";
  } catch (const ConfigurationError& error) {
    EXPECT_EQ(file + ": every user may write to it", error.what());
  }
}

std::string sourceText(const std::string& name) {
  return readWholeFile(std::string(VMQ_SOURCE_DIR) + "/" + name);
}

TEST(ConfigurationKeys, AreAllInTheReferenceAndInTheExample) {
  const std::string reference = sourceText("docs/vmqd.md");
  const std::string example = sourceText("packaging/vmqd.conf.example");
  for (const auto& [name, help] : configurationKeys()) {
    EXPECT_THAT(reference, HasSubstr("| `" + std::string(name) + "` |"));
    EXPECT_THAT(example, HasSubstr(std::string(name.substr(0, name.find("NAME")))));
    EXPECT_FALSE(help.empty());
  }
}

}  // namespace
}  // namespace vmqd

// The name of the host, on machines of all kinds: this program brings its own uname and gethostname.
#include <gtest/gtest.h>
#include <sys/utsname.h>
#include <unistd.h>

#include <cerrno>
#include <cstring>
#include <string>

#include "test_seam.h"
#include "util/util.h"

namespace {

// What the machine says; an empty host name makes gethostname fail, an empty system makes uname fail.
struct Machine {
  std::string system;
  std::string nodeName;
  std::string hostName;
};
Machine machine;

}  // namespace

int uname(struct utsname* names) noexcept {
  if (machine.system.empty()) {
    errno = EFAULT;
    return -1;
  }
  std::strncpy(names->sysname, machine.system.c_str(), sizeof names->sysname);
  std::strncpy(names->nodename, machine.nodeName.c_str(), sizeof names->nodename);
  return 0;
}

int gethostname(char* name, size_t size) noexcept {
  if (machine.hostName.empty()) {
    errno = EFAULT;
    return -1;
  }
  std::strncpy(name, machine.hostName.c_str(), size);  // leaves a long name unterminated, as systems may
  return 0;
}

namespace {

std::string hostNameOf(const Machine& other) {
  machine = other;
  return VMQ::Util::getHostName().toNarrow();
}

TEST(HostNameTest, IsTheNodeName) {
  EXPECT_EQ(hostNameOf({"Linux", "node7", "other"}), "node7");
}

TEST(HostNameTest, DomainIsCut) {
  EXPECT_EQ(hostNameOf({"Linux", "node7.example.com", ""}), "node7");
  EXPECT_EQ(hostNameOf({"Linux", "node7.", ""}), "node7");
}

TEST(HostNameTest, NameThatIsAllDomainIsEmpty) {
  EXPECT_EQ(hostNameOf({"Linux", ".example.com", ""}), "");
}

TEST(HostNameTest, EmptyNodeNameIsAnEmptyName) {
  EXPECT_EQ(hostNameOf({"Linux", "", ""}), "");
}

TEST(HostNameTest, HpUxIsAskedForItsWholeName) {
  const std::string long_name(200, 'h');
  EXPECT_EQ(hostNameOf({"HP-UX", "hhhhhhhh", long_name + ".example.com"}), long_name);
  EXPECT_EQ(hostNameOf({"my HP-UX 11", "node", "host"}), "host");
}

TEST(HostNameTest, HpUxFallsBackToItsNodeName) {
  EXPECT_EQ(hostNameOf({"HP-UX", "node.example.com", ""}), "node");
}

TEST(HostNameTest, LongestNameIsTerminated) {
  EXPECT_EQ(hostNameOf({"HP-UX", "node", std::string(300, 'h')}), std::string(256, 'h'));
}

TEST(HostNameTest, MachineThatSaysNothingHasNoName) {
  const TEST_TraceCapture trace;
  EXPECT_EQ(hostNameOf({"", "", ""}), "");
  EXPECT_TRUE(trace.has(RAS1_ERROR, "No host name: Bad address"));
}

}  // namespace

// The service manager's readiness protocol.

#include "apps/vmqd/notify.h"

#include <gtest/gtest.h>
#include <sys/socket.h>
#include <sys/un.h>
#include <unistd.h>

#include <cerrno>
#include <cstddef>
#include <cstdlib>
#include <cstring>
#include <string>

#include "apps/vmqd/descriptor.h"
#include "tests/support/temporary_directory.h"

namespace vmqd {
namespace {

/// A socket that a service manager would listen on; "@NAME" is in the abstract name space.
Descriptor listenAs(const std::string& name) {
  Descriptor descriptor(socket(AF_UNIX, SOCK_DGRAM | SOCK_NONBLOCK, 0));
  sockaddr_un address{};
  address.sun_family = AF_UNIX;
  std::memcpy(address.sun_path, name.data(), name.size());
  if (name[0] == '@') address.sun_path[0] = '\0';
  const auto length = static_cast<socklen_t>(offsetof(sockaddr_un, sun_path) + name.size());
  EXPECT_EQ(0, bind(descriptor.get(), reinterpret_cast<const sockaddr*>(&address), length));
  return descriptor;
}

std::string receivedBy(const Descriptor& descriptor) {
  char text[100];
  const ssize_t count = recv(descriptor.get(), text, sizeof text, 0);
  return count < 0 ? "" : std::string(text, static_cast<size_t>(count));
}

ServiceManager managerAt(const std::string& name) {
  setenv("NOTIFY_SOCKET", name.c_str(), 1);
  return {};
}

TEST(ServiceManager, IsToldOnASocketWithAPath) {
  const TemporaryDirectory directory;
  const Descriptor listening = listenAs(directory / "n");
  const ServiceManager manager = managerAt(directory / "n");
  EXPECT_EQ(0, manager.notify("READY=1"));
  EXPECT_EQ("READY=1", receivedBy(listening));
  EXPECT_EQ(0, manager.notify("STOPPING=1"));
  EXPECT_EQ("STOPPING=1", receivedBy(listening));
}

TEST(ServiceManager, IsToldOnAnAbstractSocket) {
  const std::string name = "@vmq-notify-test-" + std::to_string(getpid());
  const Descriptor listening = listenAs(name);
  EXPECT_EQ(0, managerAt(name).notify("READY=1"));
  EXPECT_EQ("READY=1", receivedBy(listening));
}

TEST(ServiceManager, OfThisProcessIsNotThatOfItsChildren) {
  const ServiceManager manager = managerAt("/nowhere");
  EXPECT_EQ(nullptr, getenv("NOTIFY_SOCKET"));
}

TEST(ServiceManager, NeedNotBeThere) {
  unsetenv("NOTIFY_SOCKET");
  EXPECT_EQ(0, ServiceManager().notify("READY=1"));
  EXPECT_EQ(0, managerAt("").notify("READY=1"));
}

TEST(ServiceManager, ThatHasGoneIsReported) {
  const TemporaryDirectory directory;
  EXPECT_EQ(ENOENT, managerAt(directory / "none").notify("READY=1"));
  const std::string path = directory / "n";
  { const Descriptor listening = listenAs(path); }
  EXPECT_EQ(ECONNREFUSED, managerAt(path).notify("READY=1"));
  EXPECT_EQ(ENAMETOOLONG, managerAt("/" + std::string(200, 'x')).notify("READY=1"));
}

}  // namespace
}  // namespace vmqd

#include "tests/e2e/loopback.h"

#include <arpa/inet.h>
#include <gtest/gtest.h>
#include <netinet/in.h>
#include <sys/socket.h>
#include <sys/time.h>
#include <unistd.h>

#include <array>
#include <random>
#include <string>

namespace {

sockaddr_in loopback(uint16_t port) {
  sockaddr_in address{};
  address.sin_family = AF_INET;
  address.sin_port = htons(port);
  address.sin_addr.s_addr = htonl(INADDR_LOOPBACK);
  return address;
}

}  // namespace

OccupiedPort::OccupiedPort() : descriptor_(socket(AF_INET, SOCK_STREAM | SOCK_CLOEXEC, 0)), number_(0) {
  // Not from the range of which the system gives clients their ends of connections: one may get it meanwhile.
  std::uniform_int_distribution<uint16_t> ports(20000, 29999);
  std::random_device random;
  for (int tries = 0; tries < 1000; ++tries) {
    const uint16_t port = ports(random);
    const sockaddr_in address = loopback(port);
    if (bind(descriptor_, reinterpret_cast<const sockaddr*>(&address), sizeof address) != 0) continue;
    if (listen(descriptor_, 16) != 0) break;
    number_ = port;
    return;
  }
  ADD_FAILURE() << "no free port on 127.0.0.1";
}

OccupiedPort::~OccupiedPort() {
  close(descriptor_);
}

uint16_t freePort() {
  return OccupiedPort().number();
}

bool answers(uint16_t port) {
  const int descriptor = socket(AF_INET, SOCK_STREAM | SOCK_CLOEXEC, 0);
  const timeval limit{.tv_sec = 5, .tv_usec = 0};
  (void)setsockopt(descriptor, SOL_SOCKET, SO_RCVTIMEO, &limit, sizeof limit);  // without it, only slower to fail
  const sockaddr_in address = loopback(port);
  const std::string request = "GET / HTTP/1.0\r\n\r\n";
  std::array<char, 12> status{};  // "HTTP/1.0 200"
  const bool answered = connect(descriptor, reinterpret_cast<const sockaddr*>(&address), sizeof address) == 0 &&
                        send(descriptor, request.data(), request.size(), MSG_NOSIGNAL) == ssize_t(request.size()) &&
                        recv(descriptor, status.data(), status.size(), MSG_WAITALL) == ssize_t(status.size());
  close(descriptor);
  return answered && std::string(status.data() + 9, 3) == "200";
}

// Files pushed to a daemon with the project's own component.

#include <gmock/gmock.h>

#include <algorithm>
#include <cstring>
#include <filesystem>
#include <string>
#include <thread>
#include <vector>

#include "tests/apps/vmqd/test_daemon.h"
#include "tests/support/process_memory.h"

namespace {

using nlohmann::json;

constexpr const char* operation = "/v1/rpc/d98cf2a5-2fae-4d68-b005-646ff83eed82/0";
constexpr const char* littleAscii = "Data-Representation: 10000000\r\n";

std::string little(uint32_t value, size_t bytes) {
  std::string text;
  for (; bytes > 0; --bytes, value >>= 8) text += static_cast<char>(value & 0xFF);
  return text;
}

/// The packet of one chunk.
std::string packetOf(const std::string& name, uint32_t chunk, const std::string& data) {
  const size_t count = std::max<size_t>(1, (data.size() + 4095) / 4096);
  std::string packet(84, '\0');
  packet += name + std::string(256 - name.size(), '\0');
  packet += little(0, 4) + little(chunk, 4) + little(static_cast<uint32_t>(count - 1), 4);
  packet += little(static_cast<uint32_t>(count), 2) + little(static_cast<uint32_t>(count), 2);
  for (size_t block = 0; block < count; ++block) {
    const std::string piece = data.substr(block * 4096, 4096);
    packet += little(static_cast<uint32_t>(piece.size()), 4) + piece + std::string(4096 - piece.size(), '\0');
  }
  return packet;
}

HttpReply sendChunk(HttpClient& client, const std::string& name, uint32_t chunk, const std::string& data) {
  return client.request("POST", operation, packetOf(name, chunk, data), littleAscii);
}

/// The status of the reply; 999 when the call has failed.
uint32_t push(HttpClient& client, const std::string& name, uint32_t chunk, const std::string& data) {
  const HttpReply reply = sendChunk(client, name, chunk, data);
  uint32_t status = 999;
  if (reply.status == 200 && reply.body.size() == sizeof status) std::memcpy(&status, reply.body.data(), sizeof status);
  EXPECT_EQ(200, reply.status) << reply.body;
  return status;
}

TEST(Push, StoresAFileInChunks) {
  const DaemonFixture daemon;
  HttpClient client(daemon.socket());
  EXPECT_EQ(0u, push(client, "ux\\1.0\\file.bin", 1, std::string(10000, 'a')));
  EXPECT_EQ(0u, push(client, "ux\\1.0\\file.bin", 2, "b\r\n"));
  EXPECT_EQ(std::string(10000, 'a') + "b\r\n", readWholeFile(daemon.depot() + "/ux/1.0/file.bin"));
  EXPECT_EQ(10003, parsedJson(client.get("/v1/depot/ux/1.0/file.bin").body)["size"]);
}

TEST(Push, ConvertsScripts) {
  const DaemonFixture daemon;
  HttpClient client(daemon.socket());
  EXPECT_EQ(0u, push(client, "install.sh", 1, "#!/bin/sh\r\nexit\r\n\x1A"));
  EXPECT_EQ("#!/bin/sh\nexit\n", readWholeFile(daemon.depot() + "/install.sh"));
}

TEST(Push, IsAnsweredWithTheStatusOfTheComponent) {
  const DaemonFixture daemon;
  HttpClient client(daemon.socket());
  EXPECT_EQ(4u, push(client, "../file", 1, "a"));
  daemon.directory().writeFile("depot/file", "in the way");
  EXPECT_EQ(6u, push(client, "file/dir/other", 1, "a"));
  EXPECT_EQ(0u, push(client, "empty", 1, ""));
  EXPECT_EQ("", readWholeFile(daemon.depot() + "/empty"));
}

TEST(Push, PacketThatLiesIsAFaultAndStoresNothing) {
  const DaemonFixture daemon;
  HttpClient client(daemon.socket());
  const std::string packet = packetOf("file", 1, "a");
  const HttpReply reply = client.request("POST", operation, packet.substr(0, packet.size() - 1), littleAscii);
  EXPECT_EQ(422, reply.status);
  EXPECT_EQ(0x1c000007, parsedJson(reply.body)["error"]["status"]);
  EXPECT_FALSE(std::filesystem::exists(daemon.depot() + "/file"));
  EXPECT_EQ(0u, push(client, "file", 1, "a"));
}

TEST(Push, ThatADaemonDidNotSurviveCanBeRepeated) {
  DaemonFixture daemon;
  const std::string data(300000, 'x');
  {
    HttpClient client(daemon.socket());
    ASSERT_EQ(0u, push(client, "dir/file", 1, data));
    // The daemon goes while the second chunk is on its way.
    const std::string packet = packetOf("dir/file", 2, data);
    ASSERT_TRUE(client.send(std::string("POST ") + operation + " HTTP/1.1\r\nHost: x\r\n" + littleAscii +
                            "Content-Length: " + std::to_string(packet.size()) + "\r\n\r\n" +
                            packet.substr(0, packet.size() / 2)));
    daemon.kill();
    EXPECT_TRUE(client.hungUp());
  }
  EXPECT_EQ(data, readWholeFile(daemon.depot() + "/dir/file")) << "what had arrived stays";
  daemon.start();
  HttpClient client(daemon.socket());
  ASSERT_EQ(0u, push(client, "dir/file", 1, data));
  ASSERT_EQ(0u, push(client, "dir/file", 2, data));
  EXPECT_EQ(data + data, readWholeFile(daemon.depot() + "/dir/file"));
}

TEST(Push, OfSeveralFilesAtATime) {
  const DaemonFixture daemon;
  std::vector<std::thread> clients;
  for (int number = 0; number < 4; ++number) {
    clients.emplace_back([&daemon, number] {
      HttpClient client(daemon.socket());
      const std::string name = "dir/" + std::to_string(number);
      for (uint32_t chunk = 1; chunk <= 20; ++chunk) {
        EXPECT_EQ(0u, push(client, name, chunk, std::string(50000, static_cast<char>('a' + number))));
      }
    });
  }
  for (std::thread& client : clients) client.join();
  for (int number = 0; number < 4; ++number) {
    EXPECT_EQ(std::string(1000000, static_cast<char>('a' + number)),
              readWholeFile(daemon.depot() + "/dir/" + std::to_string(number)));
  }
}

TEST(Push, DoesNotMakeTheDaemonGrow) {
  DaemonFixture daemon;
  const std::string data(1000 * 4096, 'x');
  const auto pushMuch = [&] {
    std::vector<std::thread> clients;
    for (int number = 0; number < 4; ++number) {
      clients.emplace_back([&, number] {
        HttpClient client(daemon.socket());
        for (uint32_t chunk = 1; chunk <= 10; ++chunk) {
          EXPECT_EQ(0u, push(client, std::to_string(number), chunk, data));
        }
      });
    }
    for (std::thread& client : clients) client.join();
  };
  const long before = memoryOf(daemon.process().pid(), "VmRSS");
  pushMuch();
  for (int number = 0; number < 4; ++number) {
    EXPECT_EQ(std::filesystem::file_size(daemon.depot() + "/" + std::to_string(number)), 10 * data.size());
  }
  if (!memoryTells) return;
  // One packet and one array of its blocks wait for the next call.
  EXPECT_LT(memoryOf(daemon.process().pid(), "VmRSS") - before, (2 * 4 + 4) * 1024L) << "KiB more than before";
  // Two of each packet, while it is taken apart.
  EXPECT_LT(memoryOf(daemon.process().pid(), "VmHWM") - before, (4 * 2 * 4 + 4) * 1024L);
}

// To get pages from the system for each packet anew costs more than what is done with the packet.
TEST(Push, TakesItsMemoryOnceForAllChunks) {
  constexpr size_t pagesOfAChunk = 1000;
  DaemonFixture daemon;
  HttpClient client(daemon.socket());
  const std::string data(pagesOfAChunk * 4096, 'x');
  ASSERT_EQ(0u, push(client, "file", 1, data));
  const long before = pageFaultsOf(daemon.process().pid());
  for (uint32_t chunk = 2; chunk <= 11; ++chunk) ASSERT_EQ(0u, push(client, "file", chunk, data));
  EXPECT_EQ(std::filesystem::file_size(daemon.depot() + "/file"), 11 * data.size());
  if (memoryTells) {
    EXPECT_LT(pageFaultsOf(daemon.process().pid()) - before, long{pagesOfAChunk});
  }
}

}  // namespace

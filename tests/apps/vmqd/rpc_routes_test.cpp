// The route that carries remote calls.

#include <gmock/gmock.h>

#include <cstdio>
#include <string>
#include <thread>
#include <utility>
#include <vector>

#include "tests/apps/vmqd/test_daemon.h"
#include "tests/support/eventually.h"

namespace {

using nlohmann::json;
using ::testing::HasSubstr;

constexpr const char* route = "/v1/rpc/5a000000-0000-0000-0000-000000000001/";
constexpr const char* littleAscii = "Data-Representation: 10000000\r\n";

TEST(CallRoute, RepliesWithThePacketOfTheReply) {
  const TestDaemon daemon;
  HttpClient client(daemon.socket());
  const HttpReply reply = callOperation(client, 0, std::string("bytes \0\xFF", 8));
  EXPECT_EQ(200, reply.status);
  EXPECT_EQ("application/octet-stream", reply.headers.at("content-type"));
  EXPECT_EQ("10000000", reply.headers.at("data-representation"));
  EXPECT_EQ(std::string("little ascii bytes \0\xFF", 21), reply.body);
  EXPECT_EQ("little ascii ", callOperation(client, 0, "").body);
}

TEST(CallRoute, TellsTheStubHowThePacketIsWritten) {
  const TestDaemon daemon;
  HttpClient client(daemon.socket());
  const std::pair<const char*, const char*> labels[] = {{"00000000", "big ascii "},
                                                        {"10000000", "little ascii "},
                                                        {"01000000", "big ebcdic "},
                                                        {"11000000", "little ebcdic "}};
  for (const auto& [label, told] : labels) {
    EXPECT_EQ(told, client
                        .request("POST", std::string(route) + "0?version=3", "",
                                 std::string("data-representation: ") + label + "\r\n")
                        .body);
  }
}

TEST(CallRoute, TakesIdentifiersInEitherCase) {
  const TestDaemon daemon;
  HttpClient client(daemon.socket());
  EXPECT_EQ(200,
            client.request("POST", "/v1/rpc/5A000000-0000-0000-0000-000000000001/0?version=3", "", littleAscii).status);
}

struct BadCall {
  std::string path;
  std::string headers;
  int status;
  std::string code;
  std::string message;
};

TEST(BadCalls, AreRefusedWithACodeAndASentence) {
  const TestDaemon daemon;
  HttpClient client(daemon.socket());
  const std::string good = std::string(route) + "0?version=3";
  const BadCall calls[] = {
      {good, "", 400, "bad_request", "The header Data-Representation is missing."},
      {good, "Data-Representation: 20000000\r\n", 400, "bad_request",
       "The header Data-Representation is \"20000000\", but only 00000000, 10000000, 01000000 and 11000000 are known."},
      {good, "Data-Representation: 1\r\n", 400, "bad_request",
       "The header Data-Representation is \"1\", but only 00000000, 10000000, 01000000 and 11000000 are known."},
      {std::string(route) + "0?version=x", littleAscii, 400, "bad_request", "\"x\" is not the number of a version."},
      {std::string(route) + "0?version=-3", littleAscii, 400, "bad_request", "\"-3\" is not the number of a version."},
      {std::string(route) + "0?version=4294967296", littleAscii, 400, "bad_request",
       "\"4294967296\" is not the number of a version."},
      {good + "&more=1", littleAscii, 400, "bad_request", "There is no argument \"more\"."},
      {"/v1/rpc/5a000000-0000-0000-0000-000000000002/0", littleAscii, 404, "not_found",
       "There is no interface \"5a000000-0000-0000-0000-000000000002\"."},
      {"/v1/rpc/QOR_Agent_v1/0", littleAscii, 404, "not_found", "There is no interface \"QOR_Agent_v1\"."},
      {std::string(route) + "0", littleAscii, 404, "not_found", "The interface has no version 1."},
      {std::string(route) + "0?version=4", littleAscii, 404, "not_found", "The interface has no version 4."},
      {std::string(route) + "4?version=3", littleAscii, 404, "not_found", "The interface has no operation \"4\"."},
      {std::string(route) + "-1?version=3", littleAscii, 404, "not_found", "The interface has no operation \"-1\"."},
      {std::string(route) + "zero?version=3", littleAscii, 404, "not_found",
       "The interface has no operation \"zero\"."},
      {std::string(route) + "0/more", littleAscii, 404, "unknown_route",
       std::string("There is nothing at \"") + route + "0/more\"."},
      {route, littleAscii, 404, "unknown_route", std::string("There is nothing at \"") + route + "\"."},
      {"/v1/rpc//0", littleAscii, 404, "unknown_route", "There is nothing at \"/v1/rpc//0\"."},
  };
  for (const BadCall& each : calls) {
    SCOPED_TRACE(each.path + " " + each.headers);
    const HttpReply reply = client.request("POST", each.path, "packet", each.headers);
    EXPECT_EQ(each.status, reply.status);
    EXPECT_EQ("application/json", reply.headers.at("content-type"));
    const json expected = {{"error", {{"code", each.code}, {"message", each.message}}}};
    EXPECT_EQ(expected, parsedJson(reply.body));
  }
  EXPECT_EQ("POST", client.get(good).headers.at("allow"));
}

TEST(Faults, AreToldWithTheirNumber) {
  const TestDaemon daemon;
  HttpClient client(daemon.socket());
  const HttpReply reply = callOperation(client, 1, "469762055");
  EXPECT_EQ(422, reply.status);
  const json expected = {
      {"error",
       {{"code", "fault"},
        {"message",
         "The call ended with the fault 0x1c000007: a count or an index in the packet does not fit, or the "
         "packet is shorter than its counts say."},
        {"status", 469762055}}}};
  EXPECT_EQ(expected, parsedJson(reply.body));
  EXPECT_EQ(4294967295u, parsedJson(callOperation(client, 1, "4294967295").body)["error"]["status"]);
  EXPECT_THAT(callOperation(client, 1, "469762075").body, HasSubstr("0x1c00001b: there is no memory for the call."));
}

TEST(Faults, AreWhatExceptionsBecome) {
  const TestDaemon daemon;
  HttpClient client(daemon.socket());
  const HttpReply reply = callOperation(client, 2, "");
  EXPECT_EQ(422, reply.status);
  EXPECT_EQ(0x1c000012, parsedJson(reply.body)["error"]["status"]);
  EXPECT_EQ(200, callOperation(client, 0, "").status);
}

// ---- how large packets may be --------------------------------------------------------------------------------------

TEST(Packets, MayBeLargerThanOtherBodies) {
  const TestDaemon daemon({"maximum_request_bytes = 1024", "maximum_packet_bytes = 100000"});
  HttpClient client(daemon.socket());
  const std::string largest(100000, 'x');
  EXPECT_EQ("little ascii " + largest, callOperation(client, 0, largest).body);
  EXPECT_EQ(100000, daemon.get("/v1")["maximum_packet_bytes"]);
  EXPECT_EQ(413, client.post("/v1/tables/ECHO/query", std::string(1025, ' ')).status);
}

TEST(Packets, ThatAreTooLargeAreRefusedBeforeTheyCome) {
  const TestDaemon daemon({"maximum_packet_bytes = 100000"});
  HttpClient client(daemon.socket());
  ASSERT_TRUE(client.send(std::string("POST ") + route + "0?version=3 HTTP/1.1\r\nHost: x\r\n" + littleAscii +
                          "Content-Length: 100001\r\n\r\n"));
  const HttpReply reply = client.receive();
  EXPECT_EQ(413, reply.status);
  EXPECT_EQ("body_too_large", errorCode(reply));
  EXPECT_THAT(reply.body, HasSubstr("100000"));
  EXPECT_TRUE(client.hungUp());
}

/// In chunks, without telling the length before.
HttpReply callUnannounced(HttpClient& client, const std::string& packet) {
  EXPECT_TRUE(client.send(std::string("POST ") + route + "0?version=3 HTTP/1.1\r\nHost: x\r\n" + littleAscii +
                          "Transfer-Encoding: chunked\r\n\r\n"));
  for (size_t begin = 0; begin < packet.size(); begin += 0x1000) {
    const std::string piece = packet.substr(begin, 0x1000);
    char size[16];
    (void)std::snprintf(size, sizeof size, "%zx\r\n", piece.size());
    EXPECT_TRUE(client.send(size + piece + "\r\n"));
  }
  EXPECT_TRUE(client.send("0\r\n\r\n"));
  return client.receive();
}

TEST(Packets, NeedNotTellTheirLengthBefore) {
  const TestDaemon daemon({"maximum_packet_bytes = 10000"});
  HttpClient client(daemon.socket());
  EXPECT_EQ("little ascii " + std::string(10000, 'x'), callUnannounced(client, std::string(10000, 'x')).body);
  EXPECT_EQ(413, callUnannounced(client, std::string(10001, 'x')).status);
}

// ---- how many packets there may be ---------------------------------------------------------------------------------

TEST(PacketMemory, CallsWithoutRoomAreToldToComeAgain) {
  const TestDaemon daemon({"maximum_packet_bytes = 10000", "packet_memory_bytes = 20000"});
  Gate gate(daemon.directory() / "gate");
  HttpClient first(daemon.socket());
  ASSERT_TRUE(first.send(std::string("POST ") + route + "3?version=3 HTTP/1.1\r\nHost: x\r\n" + littleAscii +
                         "Content-Length: 10000\r\n\r\n" + gate.packet(10000)));
  gate.waitForQuery();

  HttpClient second(daemon.socket());
  EXPECT_EQ(200, callOperation(second, 0, std::string(10000, 'x')).status) << "there is room for two";
  // A packet that has been begun counts as a whole.
  HttpClient slow(daemon.socket());
  ASSERT_TRUE(slow.send(std::string("POST ") + route + "0?version=3 HTTP/1.1\r\nHost: x\r\nExpect: 100-continue\r\n" +
                        littleAscii + "Content-Length: 9000\r\n\r\n"));
  ASSERT_EQ(100, slow.receiveInterim());
  const HttpReply refused = callOperation(second, 0, std::string(1001, 'x'));
  EXPECT_EQ(503, refused.status);
  EXPECT_EQ("busy", errorCode(refused));
  EXPECT_EQ("1", refused.headers.at("retry-after"));
  EXPECT_EQ(200, callOperation(second, 0, std::string(1000, 'x')).status) << "on the same connection";
  EXPECT_EQ(503, callUnannounced(second, "x").status) << "it may become as large as any";
  EXPECT_EQ(200, second.post("/v1/tables/ECHO/query", "{}").status) << "other requests go on";

  gate.open();
  EXPECT_EQ("passed", first.receive().body);
  EXPECT_EQ(200, callOperation(second, 0, std::string(1001, 'x')).status) << "there is room again";
  ASSERT_TRUE(slow.send(std::string(9000, 'y')));
  EXPECT_EQ("little ascii " + std::string(9000, 'y'), slow.receive().body);
}

TEST(PacketMemory, LengthAnnouncedBesidePiecesSaysNothing) {
  const TestDaemon daemon({"maximum_packet_bytes = 10000", "packet_memory_bytes = 10000"});
  const auto begin = [&](HttpClient& client) {
    EXPECT_TRUE(client.send(std::string("POST ") + route +
                            "0?version=3 HTTP/1.1\r\nHost: x\r\nExpect: 100-continue\r\n" + littleAscii +
                            "Content-Length: 1\r\nTransfer-Encoding: chunked\r\n\r\n"));
    return client.receiveInterim();
  };
  HttpClient first(daemon.socket());
  ASSERT_EQ(100, begin(first));
  HttpClient second(daemon.socket());
  EXPECT_EQ(503, callOperation(second, 0, "x").status) << "the first may become as large as any";
}

TEST(PacketMemory, IsGivenBackByClientsThatLeave) {
  const TestDaemon daemon({"maximum_packet_bytes = 10000", "packet_memory_bytes = 10000"});
  for (int round = 0; round < 20; ++round) {
    HttpClient leaving(daemon.socket());
    ASSERT_TRUE(leaving.send(std::string("POST ") + route +
                             "0?version=3 HTTP/1.1\r\nHost: x\r\nExpect: 100-continue\r\n" + littleAscii +
                             "Content-Length: 10000\r\n\r\n"));
    const int status = leaving.receiveInterim();
    // The one before it may not be gone yet.
    ASSERT_TRUE(status == 100 || status == 503) << status;
  }
  HttpClient client(daemon.socket());
  HttpReply reply;
  EXPECT_TRUE(eventually([&] {
    reply = callOperation(client, 0, std::string(10000, 'x'));
    return reply.status != 503;
  }));
  EXPECT_EQ(200, reply.status);
}

TEST(PacketMemory, AllCallsAreAnsweredInTheEnd) {
  const TestDaemon daemon({"maximum_packet_bytes = 1000000", "packet_memory_bytes = 1000000"});
  std::vector<std::thread> clients;
  for (int number = 0; number < 4; ++number) {
    clients.emplace_back([&daemon, number] {
      HttpClient client(daemon.socket());
      const std::string packet(1000000, static_cast<char>('a' + number));
      for (int done = 0; done < 10;) {
        const HttpReply reply = callOperation(client, 0, packet);
        if (reply.status == 503) continue;
        ASSERT_EQ("little ascii " + packet, reply.body);
        ++done;
      }
    });
  }
  for (std::thread& client : clients) client.join();
}

}  // namespace

// The route that tells what has arrived in the depot.

#include <gmock/gmock.h>
#include <sys/stat.h>

#include <filesystem>
#include <string>
#include <vector>

#include "tests/apps/vmqd/test_daemon.h"

namespace {

using nlohmann::json;

struct Known {
  std::string name;
  std::string contents;
  std::string sha256;
};

TEST(DepotRoute, TellsSizeAndDigest) {
  const TestDaemon daemon;
  HttpClient client(daemon.socket());
  // The digests are those that sha256sum prints.
  const Known files[] = {
      {"empty", "", "e3b0c44298fc1c149afbf4c8996fb92427ae41e4649b934ca495991b7852b855"},
      {"dir/abc", "abc", "ba7816bf8f01cfea414140de5dae2223b00361a396177a9cb410ff61f20015ad"},
      {"million", std::string(1000000, 'a'), "cdc76e5c9914fb9281a1c7e284d73e67f1809a48a497200e046d39ccc7112cd0"},
  };
  for (const Known& each : files) {
    daemon.directory().writeFile("depot/" + each.name, each.contents);
    const HttpReply reply = client.get("/v1/depot/" + each.name);
    EXPECT_EQ(200, reply.status);
    EXPECT_EQ("application/json", reply.headers.at("content-type"));
    const json expected = {{"path", each.name}, {"size", each.contents.size()}, {"sha256", each.sha256}};
    EXPECT_EQ(expected, parsedJson(reply.body));
  }
}

TEST(DepotRoute, DecodesThePath) {
  const TestDaemon daemon;
  daemon.directory().writeFile("depot/my dir/50% + caf\u00e9", "x");
  const json reply = daemon.get("/v1/depot/my%20dir/50%25%20+%20caf%C3%A9");
  EXPECT_EQ("my dir/50% + caf\u00e9", reply["path"]);
  EXPECT_EQ(1, reply["size"]);
}

TEST(DepotRoute, KnowsOnlyRegularFiles) {
  const TestDaemon daemon;
  HttpClient client(daemon.socket());
  daemon.directory().writeFile("depot/dir/file", "x");
  ASSERT_EQ(0, mkfifo((daemon.depot() + "/fifo").c_str(), 0600));
  std::filesystem::create_symlink("loop", daemon.depot() + "/loop");
  const std::vector<std::string> names = {
      "none", "dir", "dir/", "dir/file/more", "fifo", "loop", "%2Fetc%2Fpasswd", std::string(300, 'n')};
  for (const std::string& name : names) {
    SCOPED_TRACE(name);
    const HttpReply reply = client.get("/v1/depot/" + name);
    EXPECT_EQ(404, reply.status);
    EXPECT_EQ("not_found", errorCode(reply));
  }
  EXPECT_EQ("There is no file \"none\" in the depot.", daemon.get("/v1/depot/none")["error"]["message"]);
}

TEST(DepotRoute, WithoutADepotThereAreNoFiles) {
  const TestDaemon daemon;
  std::filesystem::remove_all(daemon.depot());
  EXPECT_EQ(404, HttpClient(daemon.socket()).get("/v1/depot/file").status);
}

TEST(DepotRoute, LooksIntoTheHomeWhenNoDepotIsSet) {
  TestDaemon daemon({}, /*start=*/false);
  daemon.directory().writeFile("vmqd.conf", "socket = " + daemon.socket() + "\nhome = " + daemon.home() +
                                                "\nlibrary = " VMQ_TEST_COMPONENT "\n");
  daemon.start();
  daemon.directory().writeFile("home/file", "abc");
  EXPECT_EQ(3, daemon.get("/v1/depot/file")["size"]);
}

TEST(DepotRoute, RefusesPathsThatLeadOutOfTheDepot) {
  const TestDaemon daemon;
  HttpClient client(daemon.socket());
  for (const char* const path : {"..", "../vmqd.conf", "dir/../file", "dir/..", "%2e%2e/vmqd.conf", "..%2Fvmqd.conf"}) {
    SCOPED_TRACE(path);
    const HttpReply reply = client.get(std::string("/v1/depot/") + path);
    EXPECT_EQ(400, reply.status);
    EXPECT_EQ("bad_request", errorCode(reply));
  }
  EXPECT_EQ("\"../x\" leads out of its directory.", daemon.get("/v1/depot/../x")["error"]["message"]);
  EXPECT_EQ("The path of the file is missing.", daemon.get("/v1/depot/")["error"]["message"]);
  EXPECT_EQ("unknown_route", errorCode(client.get("/v1/depot")));
}

}  // namespace

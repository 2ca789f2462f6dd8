// push and deploy: what is sent, what is told, and what they make of every answer.

#include <gmock/gmock.h>
#include <sys/stat.h>

#include <csignal>
#include <filesystem>
#include <nlohmann/json.hpp>

#include "tests/apps/vmqctl/scripts.h"
#include "tests/apps/vmqctl/vmqctl_process.h"
#include "tests/support/temporary_directory.h"

namespace {

using testing::ElementsAre;
using testing::EndsWith;
using testing::HasSubstr;
using testing::Not;
using Json = nlohmann::ordered_json;

const std::string rpcRequest = "POST /v1/rpc/d98cf2a5-2fae-4d68-b005-646ff83eed82/0";
const std::string again = " Push again: each file is begun anew.";
constexpr std::size_t twoBlocks = 356 + 2 * 4100;

std::string statusBytes(unsigned status) {
  return {static_cast<char>(status), 0, 0, 0};
}

/// A packet written by hand: little-endian, blocks of these lengths.
std::string packetOf(const std::string& name, int chunk, const std::vector<std::string>& blocks) {
  const auto number = [](unsigned value, int bytes) {
    std::string text;
    for (int i = 0; i < bytes; ++i) text += static_cast<char>(value >> (8 * i));
    return text;
  };
  const auto count = static_cast<unsigned>(blocks.size());
  std::string packet(84, '\0');
  packet += name + std::string(255 - name.size() + 1 + 4, '\0');
  packet += number(static_cast<unsigned>(chunk), 4) + number(count - 1, 4) + number(count, 2) + number(count, 2);
  for (const std::string& block : blocks) {
    packet += number(static_cast<unsigned>(block.size()), 4) + block + std::string(4096 - block.size(), '\0');
  }
  return packet;
}

/// What a packet says, for tests that are not about its bytes: "NAME#CHUNK".
std::string labelOf(const std::string& packet) {
  return std::string(packet.c_str() + 84) + "#" + std::to_string(static_cast<unsigned char>(packet.at(344)));
}

class Push : public testing::Test {
 protected:
  Push() {
    service("/depot", twoBlocks);
    answerPackets([](Exchange& exchange) { exchange.replyPacket(statusBytes(0)); });
  }

  void service(const std::string& depot, std::size_t maximumPacketBytes) {
    daemon_.on("GET /v1", [=](Exchange& exchange) {
      exchange.reply(200, R"({"version":"1","node":"n","home":"/home","depot":")" + depot +
                              R"(","maximum_packet_bytes":)" + std::to_string(maximumPacketBytes) + "}");
    });
  }
  /// Keeps every packet and answers it so.
  void answerPackets(const ScriptedDaemon::Handler& answer) {
    daemon_.on(rpcRequest, [this, answer](Exchange& exchange) {
      heads_.push_back(exchange.head());
      packets_.push_back(exchange.body());
      answer(exchange);
    });
  }
  /// The n-th packet, from 1, is answered so; the others with success.
  void answerPacket(std::size_t n, const ScriptedDaemon::Handler& answer) {
    answerPackets([this, n, answer](Exchange& exchange) {
      if (packets_.size() == n) {
        answer(exchange);
      } else {
        exchange.replyPacket(statusBytes(0));
      }
    });
  }
  void statusForPacket(std::size_t n, unsigned status) {
    answerPacket(n, [status](Exchange& exchange) { exchange.replyPacket(statusBytes(status)); });
  }
  void inDepot(const std::string& path, std::size_t size, const std::string& sha256) {
    daemon_.on("GET /v1/depot/" + path, [=](Exchange& exchange) {
      exchange.reply(
          200, R"({"path":")" + path + R"(","size":)" + std::to_string(size) + R"(,"sha256":")" + sha256 + R"("})");
    });
  }

  VmqctlResult run(std::vector<std::string> arguments, VmqctlOptions options = {}) {
    return runVmqctl(line(std::move(arguments)), std::move(options));
  }
  std::vector<std::string> line(std::vector<std::string> arguments) const {
    arguments.insert(arguments.end(), {"--socket", daemon_.socket()});
    return arguments;
  }
  /// Ends with this code and says just this, apart from the files that arrived.
  void expectFailure(const VmqctlResult& result, int code, const std::string& error) {
    EXPECT_EQ(result.code, code);
    EXPECT_THAT(result.err, EndsWith("vmqctl: " + error + "\n"));
  }
  std::vector<std::string> labels() const {
    std::vector<std::string> result;
    for (const std::string& packet : packets_) result.push_back(labelOf(packet));
    return result;
  }

  TemporaryDirectory directory_;
  std::vector<std::string> heads_;
  std::vector<std::string> packets_;
  ScriptedDaemon daemon_;  // last: its threads use what is above
};

const std::string table1 = "RESULT  FILES  BYTES  CALLS  DEPOT\n";

// ---- what is sent ----

TEST_F(Push, SendsAFileAsOnePacket) {
  const VmqctlResult result = run({"push", directory_.writeFile("a.txt", "hello\n")});
  EXPECT_EQ(result.code, 0);
  EXPECT_THAT(packets_, ElementsAre(packetOf("a.txt", 1, {"hello\n"})));
  EXPECT_EQ(result.out, table1 + "done        1      6      1  /depot/\n");
  EXPECT_EQ(result.err, "sent a.txt (6 bytes)\n");
  EXPECT_THAT(heads_.at(0), HasSubstr("\r\nContent-Type: application/octet-stream\r\n"));
  EXPECT_THAT(heads_.at(0), HasSubstr("\r\nData-Representation: 10000000\r\n"));
}

TEST_F(Push, SendsAnEmptyFileAsABlockWithoutBytes) {
  EXPECT_EQ(run({"push", directory_.writeFile("e", "")}).code, 0);
  EXPECT_THAT(packets_, ElementsAre(packetOf("e", 1, {""})));
}

TEST_F(Push, ChunksEndWhereTheFileDoes) {
  const std::string a(4096, 'a');
  const std::string b(4096, 'b');
  const std::string c(4096, 'c');
  const std::string d(4096, 'd');
  EXPECT_EQ(run({"push", directory_.writeFile("1", a), directory_.writeFile("2", a + b),
                 directory_.writeFile("2+1", a + b + "x"), directory_.writeFile("4", a + b + c + d)})
                .code,
            0);
  EXPECT_THAT(packets_, ElementsAre(packetOf("1", 1, {a}), packetOf("2", 1, {a, b}), packetOf("2+1", 1, {a, b}),
                                    packetOf("2+1", 2, {"x"}), packetOf("4", 1, {a, b}), packetOf("4", 2, {c, d})));
}

TEST_F(Push, SendsLargePacketsWhole) {
  service("/depot", 4194304);
  std::string text;
  for (int i = 0; text.size() < 1022 * 4096 + 1; ++i) text += std::to_string(i) + "\n";
  EXPECT_EQ(run({"push", directory_.writeFile("big", text)}).code, 0);
  std::vector<std::string> blocks;
  for (std::size_t i = 0; i < 1022; ++i) blocks.push_back(text.substr(i * 4096, 4096));
  ASSERT_EQ(packets_.size(), 2U);
  EXPECT_TRUE(packets_[0] == packetOf("big", 1, blocks));
  EXPECT_TRUE(packets_[1] == packetOf("big", 2, {text.substr(1022 * 4096)}));
  EXPECT_THAT(heads_.at(0), HasSubstr("\r\nExpect: 100-continue\r\n"));
}

TEST_F(Push, KeepsItsConnection) {
  EXPECT_EQ(run({"push", directory_.writeFile("a", std::string(100000, 'a'))}).code, 0);
  EXPECT_EQ(packets_.size(), 13U);
  // One for the question at the start, one for all packets.
  EXPECT_EQ(daemon_.connections(), 2U);
}

TEST_F(Push, FolderGoesInOrderIntoTheFolderOfTheDepot) {
  directory_.writeFile("ux/lib/b", "");
  directory_.writeFile("ux/lib/B", "");
  directory_.writeFile("ux/a", std::string(8193, 'a'));
  EXPECT_EQ(run({"push", directory_ / "ux", "--to", "/products/"}).code, 0);
  EXPECT_THAT(labels(),
              ElementsAre("products/ux/a#1", "products/ux/a#2", "products/ux/lib/B#1", "products/ux/lib/b#1"));
}

TEST_F(Push, NamesAreSentByteForByte) {
  EXPECT_EQ(run({"push", directory_.writeFile("\xC3\xBC \xE2\x82\xAC.txt", "")}).code, 0);
  EXPECT_THAT(packets_, ElementsAre(packetOf("\xC3\xBC \xE2\x82\xAC.txt", 1, {""})));
}

TEST_F(Push, RepeatedPushBeginsAnew) {
  const std::string file = directory_.writeFile("a", std::string(8193, 'a'));
  EXPECT_EQ(run({"push", file}).code, 0);
  EXPECT_EQ(run({"push", file}).code, 0);
  EXPECT_THAT(labels(), ElementsAre("a#1", "a#2", "a#1", "a#2"));
}

// ---- what is told ----

TEST_F(Push, JsonTellsWhatWasSent) {
  const std::string a = directory_.writeFile("a", std::string(8193, 'a'));
  const std::string b = directory_.writeFile("b", "");
  Json told = Json::parse(run({"push", a, b, "-o", "json"}).out);
  EXPECT_GT(told["seconds"], 0);
  told.erase("seconds");
  EXPECT_EQ(told, Json::parse(R"({"result":"done","depot":"/depot/","bytes":8193,"calls":3,"files":[
      {"name":"a","source":")" +
                              a + R"(","bytes":8193,"chunks":2,"sha256":null},
      {"name":"b","source":")" +
                              b + R"(","bytes":0,"chunks":1,"sha256":null}],"stopped_at":null})"));
}

TEST_F(Push, JsonOfAFailureTellsWhatArrivedBefore) {
  statusForPacket(3, 5);
  const Json told = Json::parse(
      run({"push", directory_.writeFile("a", std::string(8193, 'a')), directory_.writeFile("b", ""), "-o", "json"})
          .out);
  EXPECT_EQ(told["result"], "failed");
  EXPECT_EQ(told["files"].size(), 1U);
  EXPECT_EQ(told["stopped_at"], "b");
}

TEST_F(Push, HomeIsTheDepotWhenNoneIsConfigured) {
  service("", twoBlocks);
  EXPECT_THAT(run({"push", directory_.writeFile("a", "")}).out, EndsWith("/home/\n"));
}

// The parser of the command line takes brackets for lists.
TEST_F(Push, NamesInBracketsAreNames) {
  directory_.writeFile("ab", "");
  directory_.writeFile("[ab]", "");
  std::filesystem::create_directory(directory_ / "[");
  directory_.writeFile("[/a b]", "");
  VmqctlOptions options;
  options.program =
      directory_.writeScript("in-folder", "cd '" + directory_.path().string() + "' && exec " VMQCTL_PROGRAM " \"$@\"");
  EXPECT_EQ(run({"push", "[ab]", "[/a b]"}, options).code, 0);
  EXPECT_THAT(labels(), ElementsAre("[ab]#1", "a b]#1"));
}

TEST_F(Push, DryRunSendsNothing) {
  directory_.writeFile("ux/a", "123");
  const VmqctlResult result = run({"push", directory_ / "ux", "--dry-run"});
  EXPECT_EQ(result.code, 0);
  EXPECT_EQ(result.out, "NAME  BYTES  SOURCE\nux/a      3  " + directory_ / "ux/a" + "\n");
  EXPECT_EQ(result.err, "not sent: " + rpcRequest + " for each file\n");
  EXPECT_EQ(
      run({"push", directory_ / "ux", "--dry-run", "-o", "json"}).out,
      Json::parse(R"({"files":[{"name":"ux/a","bytes":3,"source":")" + directory_ / "ux/a" + R"("}]})").dump(2) + "\n");
  EXPECT_THAT(daemon_.log(), ElementsAre());
}

TEST_F(Push, EmptyFoldersAreTold) {
  directory_.writeFile("ux/a", "");
  std::filesystem::create_directory(directory_ / "ux/tmp");
  EXPECT_THAT(run({"push", directory_ / "ux"}).err,
              testing::StartsWith("not sent, since no file is in it: " + directory_ / "ux/tmp" + "\n"));
}

// ---- what is refused before anything is sent ----

TEST_F(Push, RefusesBeforeItSendsAnything) {
  directory_.writeFile("d/a", "");
  ASSERT_EQ(mkfifo((directory_ / "d/pipe").c_str(), 0600), 0);
  const std::string good = directory_.writeFile("good", "");
  const struct {
    std::vector<std::string> arguments;
    const char* says;
  } cases[] = {
      {{good, directory_ / "d"}, "d/pipe is neither a file nor a folder. Nothing was sent."},
      {{good, directory_ / "gone"}, "gone: No such file or directory. Nothing was sent."},
      {{good, "--to", "x/../y"}, "A folder of the depot may not hold \"..\". Nothing was sent."},
      {{good, good}, "would both become good. Nothing was sent."},
      {{good, "--to", std::string(255, 'n')}, "has 260 bytes; at most 255 can be sent. Nothing was sent."},
  };
  for (const auto& each : cases) {
    std::vector<std::string> arguments = each.arguments;
    arguments.insert(arguments.begin(), "push");
    const VmqctlResult result = run(arguments);
    EXPECT_EQ(result.code, 2);
    EXPECT_THAT(result.err, HasSubstr(each.says));
    EXPECT_EQ(result.out, "");
  }
  EXPECT_THAT(daemon_.log(), ElementsAre());
}

TEST_F(Push, RefusesPathsThatAreTooLongInThisDepot) {
  service("/" + std::string(1020, 'd'), twoBlocks);
  const std::string a = directory_.writeFile("aa", "");
  EXPECT_EQ(run({"push", a}).code, 0);  // exactly 1024
  const VmqctlResult result = run({"push", directory_.writeFile("aaa", "")});
  EXPECT_EQ(result.code, 2);
  EXPECT_THAT(result.err, HasSubstr("/aaa has 1025 characters; at most 1024 are possible. Nothing was sent."));
  EXPECT_EQ(packets_.size(), 1U);
}

TEST_F(Push, RefusesDaemonsThatTakeNoFiles) {
  const std::string a = directory_.writeFile("a", "");
  service("/depot", 4455);
  expectFailure(run({"push", a}), 1,
                "The daemon takes packets of 4455 bytes at most, and the smallest piece of a file takes 4456; nothing "
                "was sent. Raise maximum_packet_bytes in its configuration.");
  daemon_.on("GET /v1", [](Exchange& exchange) { exchange.reply(200, R"({"home":"/h","depot":""})"); });
  expectFailure(run({"push", a}), 1,
                "The daemon does not say that it takes files; nothing was sent. Check that vmqd and vmqctl are of the "
                "same version.");
  daemon_.on("GET /v1", [](Exchange& exchange) { exchange.reply(200, R"({"home":"","depot":""})"); });
  expectFailure(run({"push", a}), 1,
                "The daemon has no depot and no home; nothing was sent. Set home in the daemon's configuration.");
}

// ---- what the machine may answer ----

TEST_F(Push, EachStatusIsExplained) {
  const std::string a = directory_.writeFile("a", "");
  const struct {
    unsigned status;
    std::string meaning;
    std::string left;
  } cases[] = {
      {1, "it has no usable depot directory", "Nothing of it was stored"},
      {3, "the destination path is longer than 1024 characters", "Nothing of it was stored"},
      {4, "the destination file could not be opened", "Nothing of it was stored"},
      {5, "a block could not be written, as on a full disk", "The file is incomplete on the machine"},
      {6, "the destination directory could not be created", "Nothing of it was stored"},
      {7, "vmqctl does not know it", "Nothing of it was stored"},
  };
  for (const auto& [status, meaning, left] : cases) {
    packets_.clear();
    statusForPacket(1, status);
    const VmqctlResult result = run({"push", a});
    EXPECT_EQ(result.out, "");
    expectFailure(result, 1,
                  "a, chunk 1 of 1: The machine answers with status " + std::to_string(status) + ": " + meaning + ". " +
                      left + ". The daemon's trace log says more. Push again: each file is begun anew.");
  }
}

TEST_F(Push, FailureInTheMiddleSaysWhereAndThatTheFileIsIncomplete) {
  statusForPacket(3, 4);
  const VmqctlResult result =
      run({"push", directory_.writeFile("a", ""), directory_.writeFile("b", std::string(3 * 8192, 'b')),
           directory_.writeFile("c", "")});
  expectFailure(result, 1,
                "b, chunk 2 of 3: The machine answers with status 4: the destination file could not be opened. The "
                "file is incomplete on the machine; 1 of 3 files arrived before it. The daemon's trace log says more. "
                "Push again: each file is begun anew.");
  EXPECT_THAT(labels(), ElementsAre("a#1", "b#1", "b#2"));
}

TEST_F(Push, StatusIsReadInTheRepresentationOfTheReply) {
  answerPacket(1, [](Exchange& exchange) { exchange.replyPacket(std::string("\0\0\0\5", 4), "00000000"); });
  EXPECT_THAT(run({"push", directory_.writeFile("a", "")}).err, HasSubstr("status 5:"));
}

TEST_F(Push, AnswersThatAreNoStatusAreNotUnderstood) {
  const std::string a = directory_.writeFile("a", "");
  answerPackets([](Exchange& exchange) { exchange.replyPacket("abc"); });
  expectFailure(run({"push", a}), 1,
                "a, chunk 1 of 1: The daemon's answer has 3 bytes in place of a status. The file may be incomplete on "
                "the machine. Check that vmqd and vmqctl are of the same version." +
                    again);
  answerPackets([](Exchange& exchange) { exchange.reply(200, "{}"); });
  EXPECT_THAT(run({"push", a}).err, HasSubstr("has no Data-Representation that is understood."));
}

TEST_F(Push, FaultIsToldInTheWordsOfTheDaemon) {
  answerPacket(2, [](Exchange& exchange) {
    exchange.reply(
        422, R"({"error":{"code":"fault","message":"The call ended in a fault, 0x1c000007.","status":469762055}})");
  });
  expectFailure(
      run({"push", directory_.writeFile("a", std::string(8193, 'a'))}), 1,
      "a, chunk 2 of 2: The call ended in a fault, 0x1c000007. The file is incomplete on the machine." + again);
}

TEST_F(Push, RefusalsOfTheDaemonAreTold) {
  const std::string a = directory_.writeFile("a", "");
  answerPackets([](Exchange& exchange) { exchange.reply(403, refusal("not_allowed", "Not you.")); });
  VmqctlResult result = run({"push", a});
  EXPECT_EQ(result.code, 4);
  EXPECT_THAT(result.err, HasSubstr("a, chunk 1 of 1: Not you. Nothing of it was stored."));
  answerPackets([](Exchange& exchange) { exchange.reply(404, refusal("not_found", "No such interface.")); });
  result = run({"push", a});
  EXPECT_EQ(result.code, 1);
  EXPECT_THAT(result.err, HasSubstr("a, chunk 1 of 1: No such interface. Nothing of it was stored."));
}

// ---- busy daemons ----

TEST_F(Push, BusyDaemonIsAskedAgain) {
  answerPackets([this](Exchange& exchange) {
    if (packets_.size() <= 3) {
      exchange.reply(503, refusal("busy", "No room."), "Retry-After: 0\r\n");
    } else {
      exchange.replyPacket(statusBytes(0));
    }
  });
  EXPECT_EQ(run({"push", directory_.writeFile("a", std::string(8193, 'a'))}).code, 0);
  ASSERT_THAT(labels(), ElementsAre("a#1", "a#1", "a#1", "a#1", "a#2"));
  EXPECT_EQ(packets_[0], packets_[3]);
}

TEST_F(Push, BusyDaemonNeedNotReadTheBodyToSaySo) {
  service("/depot", 4194304);
  int refusals = 0;
  daemon_.onAsked(rpcRequest, [&](Exchange& exchange) {
    if (++refusals <= 2) {
      exchange.reply(503, refusal("busy", "No room."), "Connection: close\r\nRetry-After: 0\r\n");
    }
  });
  EXPECT_EQ(run({"push", directory_.writeFile("a", std::string(1000000, 'a'))}).code, 0);
  EXPECT_EQ(refusals, 3);
  EXPECT_THAT(labels(), ElementsAre("a#1"));
}

TEST_F(Push, DaemonThatStaysBusyIsWaitedForUntilTheTimeIsOver) {
  answerPackets([](Exchange& exchange) { exchange.reply(503, refusal("busy", "No room."), "Retry-After: 60\r\n"); });
  expectFailure(run({"push", directory_.writeFile("a", ""), "--timeout", "1"}), 6,
                "a, chunk 1 of 1: No room. Nothing of it was stored. Try again when other clients have ended." + again);
  EXPECT_EQ(packets_.size(), 1U);
}

// ---- what ends in the middle ----

TEST_F(Push, DaemonThatGoesIsToldAndNothingIsSentTwice) {
  answerPacket(2, [](Exchange&) {});  // closes the connection without an answer
  const VmqctlResult result = run({"push", directory_.writeFile("a", std::string(3 * 8192, 'a'))});
  expectFailure(result, 7,
                "a, chunk 2 of 3: The daemon on " + daemon_.socket() +
                    " closed the connection before its answer was whole. The file is incomplete on the machine. Check "
                    "that it runs (systemctl status vmqd) and that --socket or VMQ_SOCKET names its socket." +
                    again);
  EXPECT_THAT(labels(), ElementsAre("a#1", "a#2"));
}

TEST_F(Push, LargePacketIsNotSentTwiceEither) {
  service("/depot", 4194304);
  answerPacket(2, [](Exchange&) {});
  EXPECT_EQ(run({"push", directory_.writeFile("a", std::string(2 * 1022 * 4096, 'a'))}).code, 7);
  EXPECT_THAT(labels(), ElementsAre("a#1", "a#2"));
}

TEST_F(Push, AnswerThatDoesNotComeEndsWithTheTime) {
  answerPacket(2, [](Exchange& exchange) { exchange.awaitClose(); });
  expectFailure(
      run({"push", directory_.writeFile("a", std::string(3 * 8192, 'a')), "--timeout", "1"}), 6,
      "The time of --timeout, 1 second, was over at a, chunk 2 of 3. The file is incomplete on the machine. Allow "
      "it more with --timeout." +
          again);
}

TEST_F(Push, CtrlCSaysWhatIsLeft) {
  Gate arrived;
  answerPacket(3, [&](Exchange& exchange) {
    arrived.open();
    exchange.awaitClose();
  });
  VmqctlProcess process(
      line({"push", directory_.writeFile("a", ""), directory_.writeFile("b", std::string(2 * 8192, 'b'))}));
  ASSERT_TRUE(arrived.wait());
  process.signal(SIGINT);
  expectFailure(process.finish(), 130,
                "Interrupted at b, chunk 2 of 2. The file may be incomplete on the machine; 1 of 2 files arrived "
                "before it." +
                    again);
}

TEST_F(Push, FileThatShrinksMeanwhileEndsThePush) {
  const std::string a = directory_.writeFile("a", std::string(3 * 8192, 'a'));
  answerPacket(1, [&](Exchange& exchange) {
    std::filesystem::resize_file(a, 8193);
    exchange.replyPacket(statusBytes(0));
  });
  expectFailure(run({"push", a}), 1,
                "a, chunk 2 of 3: " + a +
                    " has shrunk while it was read. The file is incomplete on the machine. Push it when nothing writes "
                    "to it." +
                    again);
  EXPECT_THAT(labels(), ElementsAre("a#1"));
}

TEST_F(Push, FileThatGrowsMeanwhileEndsThePush) {
  const std::string a = directory_.writeFile("a", std::string(2 * 8192, 'a'));
  answerPacket(1, [&](Exchange& exchange) {
    std::filesystem::resize_file(a, 3 * 8192);
    exchange.replyPacket(statusBytes(0));
  });
  EXPECT_THAT(run({"push", a}).err,
              HasSubstr("a, chunk 2 of 2: " + a + " has changed while it was read. The file is "));
  EXPECT_THAT(labels(), ElementsAre("a#1"));
}

TEST_F(Push, FileThatIsGoneMeanwhileEndsThePush) {
  const std::string b = directory_.writeFile("b", "");
  answerPacket(1, [&](Exchange& exchange) {
    std::filesystem::remove(b);
    exchange.replyPacket(statusBytes(0));
  });
  expectFailure(run({"push", directory_.writeFile("a", ""), b}), 1,
                "b, chunk 1 of 1: Cannot open " + b +
                    ": No such file or directory. Nothing of it was stored; 1 of 2 files arrived before it." + again);
}

// ---- --verify ----

const std::string sha256OfAbc = "ba7816bf8f01cfea414140de5dae2223b00361a396177a9cb410ff61f20015ad";

TEST_F(Push, VerifyComparesWithWhatArrived) {
  inDepot("x/%C3%BC%20a", 3, sha256OfAbc);
  const VmqctlResult result = run({"push", directory_.writeFile("\xC3\xBC a", "abc"), "--to", "x", "--verify"});
  EXPECT_EQ(result.code, 0) << result.err;
  EXPECT_EQ(result.err, "sent and verified x/\xC3\xBC a (3 bytes)\n");
  EXPECT_EQ(daemon_.log().back(), "GET /v1/depot/x/%C3%BC%20a");
}

TEST_F(Push, VerifyExpectsTheConversionOfScripts) {
  inDepot("my_install.sh", 3, sha256OfAbc);
  const std::string file = directory_.writeFile("my_install.sh",
                                                "a\r\x1A"
                                                "bc\r");
  const VmqctlResult result = run({"push", file, "--verify", "-o", "json"});
  EXPECT_EQ(result.code, 0) << result.err;
  EXPECT_EQ(Json::parse(result.out)["files"][0]["sha256"], sha256OfAbc);
  EXPECT_EQ(Json::parse(result.out)["files"][0]["bytes"], 6);
}

TEST_F(Push, VerifyLooksForTheConversionInTheWholePath) {
  service("/depot.mdl", twoBlocks);
  inDepot("a", 3, sha256OfAbc);
  EXPECT_EQ(run({"push", directory_.writeFile("a", "abc\r"), "--verify"}).code, 0);
}

TEST_F(Push, VerifyDigestsEveryChunk) {
  inDepot("a", 10000, "27dd1f61b867b6a0f6e9d8a41c43231de52107e53ae424de8f847b821db4b711");
  EXPECT_EQ(run({"push", directory_.writeFile("a", std::string(10000, 'a')), "--verify"}).code, 0);
}

TEST_F(Push, VerifyFailsOnOtherBytesAndOtherSizesAndWithoutTheFile) {
  const std::string a = directory_.writeFile("a", "abc");
  const std::string zeroes(64, '0');
  inDepot("a", 3, zeroes);
  expectFailure(run({"push", a, "--verify"}), 1,
                "a: What was stored is not what was sent: it has 3 bytes with the SHA-256 " + zeroes +
                    " instead of 3 bytes with " + sha256OfAbc +
                    ". The file was sent, but is not verified. Another client may have pushed the same file." + again);
  inDepot("a", 4, sha256OfAbc);
  EXPECT_EQ(run({"push", a, "--verify"}).code, 1);
  daemon_.on("GET /v1/depot/a", [](Exchange& exchange) { exchange.reply(404, refusal("not_found", "Not here.")); });
  EXPECT_THAT(run({"push", a, "--verify"}).err, HasSubstr("is not what was sent: it is not there instead of 3 bytes"));
}

TEST_F(Push, VerifyTellsThatAConversionMayHaveFailed) {
  inDepot("install.sh", 4, std::string(64, '0'));
  EXPECT_THAT(run({"push", directory_.writeFile("install.sh", "abc\r"), "--verify"}).err,
              HasSubstr("Its line ends are converted on the machine; the daemon's trace log tells when that fails."));
}

TEST_F(Push, VerifyWaitsForABusyDaemon) {
  int asked = 0;
  daemon_.on("GET /v1/depot/a", [&](Exchange& exchange) {
    if (++asked == 1) return exchange.reply(503, refusal("busy", "Later."), "Retry-After: 0\r\n");
    exchange.reply(200, R"({"path":"a","size":3,"sha256":")" + sha256OfAbc + R"("})");
  });
  EXPECT_EQ(run({"push", directory_.writeFile("a", "abc"), "--verify"}).code, 0);
  EXPECT_EQ(asked, 2);
}

// ---- on a terminal ----

TEST_F(Push, BarGrowsOnATerminalAndIsGoneInTheEnd) {
  Gate seen;
  answerPacket(2, [&](Exchange& exchange) {
    (void)seen.wait();
    exchange.replyPacket(statusBytes(0));
  });
  VmqctlOptions options;
  options.terminal = Terminal::ForErrors;
  options.columns = 200;
  VmqctlProcess process(line({"push", directory_.writeFile("a", std::string(2 * 8192, 'a'))}), options);
  process.awaitErrors("\r 50 % [##########----------] 8.0 KiB of 16 KiB, ");
  process.awaitErrors("/s, 0:01 left, file 1 of 1: a\033[K");
  seen.open();
  const VmqctlResult result = process.finish();
  EXPECT_EQ(result.code, 0);
  EXPECT_EQ(result.out, table1 + "done        1  16384      2  /depot/\n");
  EXPECT_THAT(result.err, EndsWith("\r\033[K"));
  EXPECT_THAT(result.err, Not(HasSubstr("\n")));
}

TEST_F(Push, BarNeverWrapsAndHidesNothingInNames) {
  Gate seen;
  answerPacket(1, [&](Exchange& exchange) {
    (void)seen.wait();
    exchange.replyPacket(statusBytes(0));
  });
  VmqctlOptions options;
  options.terminal = Terminal::ForErrors;
  options.columns = 72;
  VmqctlProcess process(line({"push", directory_.writeFile("\x1b[2J" + std::string(200, 'n'), "")}), options);
  process.awaitErrors("0 bytes of 0 bytes, file 1 of 1: \\x1b[2Jnn\033[K");  // 71 columns
  seen.open();
  EXPECT_EQ(process.finish().code, 0);
}

// ---- deploy ----

class Deploy : public Push {
 protected:
  Deploy() {
    daemon_.on(commandRequest, [this](Exchange& exchange) {
      sent_ = exchange.body();
      exchange.reply(200, answer());
    });
    directory_.writeFile("bundle/install.sh", "#!/bin/sh\n");
    directory_.writeFile("bundle/lib/x", "x");
  }
  VmqctlResult deploy(std::vector<std::string> arguments) {
    arguments.insert(arguments.begin(), {"deploy", directory_ / "bundle"});
    arguments.insert(arguments.end(), {"--transid", "t1", "--no-wait"});
    return run(std::move(arguments));
  }

  std::string sent_;
};

TEST_F(Deploy, SendsTheBundleToWhereTheInstallLooksAndInstalls) {
  const VmqctlResult result = deploy({"ux", "--version", "06.20"});
  EXPECT_EQ(result.code, 0);
  EXPECT_THAT(labels(), ElementsAre("ux/06.20/install.sh#1", "ux/06.20/lib/x#1"));
  EXPECT_EQ(sent_, R"({"predicates":{"COMMAND":"INSTALL","TRANSID":"t1","PRODUCT":"ux","VERSION":"06.20",)"
                   R"("CONTEXT":"|DEPLOYDIR|/install.sh |CORVELHOME|"}})");
  EXPECT_EQ(result.out,
            "COMMAND  PRODUCT  TARGETMSN  TRANSID  RESULT    RETVAL  RETMSGID\n"
            "INSTALL  ux                  t1       accepted       0\n");
  EXPECT_EQ(result.err,
            "sent ux/06.20/install.sh (10 bytes)\n"
            "sent ux/06.20/lib/x (1 byte)\n"
            "sent 2 files (11 bytes) to /depot/\n"
            "asking vmqd for INSTALL of ux, transaction t1\n");
}

TEST_F(Deploy, InstallIsAskedForOnAConnectionOfItsOwn) {
  // On the one that was kept for the packets, the library might send the request twice.
  EXPECT_EQ(deploy({"ux", "--version", "1"}).code, 0);
  EXPECT_EQ(daemon_.connections(), 3U);
}

TEST_F(Deploy, ServicesOfTheInstallationLieWithoutAVersion) {
  EXPECT_EQ(deploy({"ci", "--version", "06.20"}).code, 0);
  EXPECT_THAT(labels(), ElementsAre("ci/install.sh#1", "ci/lib/x#1"));
}

TEST_F(Deploy, TakesTheOptionsOfInstall) {
  EXPECT_EQ(deploy({"ux", "--version", "1", "--command", "./setup", "--set-rms"}).code, 0);
  EXPECT_THAT(sent_, HasSubstr(R"("CONTEXT":"./setup","OPTIONAL":"SETRMS")"));
  EXPECT_EQ(deploy({"ux", "--version", "1", "--restart"}).code, 0);
  EXPECT_THAT(sent_, HasSubstr(R"("OPTIONAL":"REQUIRES_RESTART")"));
}

TEST_F(Deploy, WaitsForTheOutcomeOfTheInstall) {
  endRequestsWith(daemon_, statusRow("t1", "INSTALL", 1031, "VMQ1031E", "/depot/ux/1/install.sh,3"));
  const VmqctlResult result =
      run({"deploy", directory_ / "bundle", "ux", "--version", "1", "--transid", "t1", "-o", "json"});
  EXPECT_EQ(result.code, 1);
  const Json told = Json::parse(result.out);
  EXPECT_EQ(told["result"], "failed");
  EXPECT_EQ(told["retval"], 1031);
  EXPECT_EQ(told["push"]["result"], "done");
  EXPECT_EQ(told["push"]["files"][1]["name"], "ux/1/lib/x");
}

TEST_F(Deploy, InstallsNothingThatDidNotArrive) {
  statusForPacket(2, 5);
  const VmqctlResult result = deploy({"ux", "--version", "1"});
  expectFailure(result, 1,
                "ux/1/lib/x, chunk 1 of 1: The machine answers with status 5: a block could not be written, as on a "
                "full disk. The file is incomplete on the machine; 1 of 2 files arrived before it. The install was not "
                "asked for. The daemon's trace log says more." +
                    again);
  EXPECT_EQ(result.out, "");
  EXPECT_EQ(sent_, "");
}

TEST_F(Deploy, BundleWithoutInstallScriptNeedsACommand) {
  std::filesystem::remove(directory_ / "bundle/install.sh");
  expectFailure(deploy({"ux", "--version", "1"}), 2,
                "There is no install.sh in " + directory_ / "bundle" +
                    ". Nothing was sent. Say with --command what installs the product.");
  EXPECT_THAT(daemon_.log(), ElementsAre());
  EXPECT_EQ(deploy({"ux", "--version", "1", "--command", "|DEPLOYDIR|/lib/x"}).code, 0);
}

TEST_F(Deploy, MustStayInTheDepot) {
  EXPECT_EQ(deploy({"..", "--version", "1"}).code, 2);
  EXPECT_EQ(deploy({"ux", "--version", "../../etc"}).code, 2);
  EXPECT_EQ(run({"deploy", directory_ / "bundle/install.sh", "ux", "--version", "1"}).code, 2);  // no folder
  EXPECT_THAT(daemon_.log(), ElementsAre());
}

TEST_F(Deploy, RefusesARequestThatCannotBeSentBeforeItSendsFiles) {
  const std::vector<std::string> cases[] = {{"\xFF", "--version", "1"},
                                            {"ux", "--version", "1", "--transid", "\xFF"},
                                            {"ux", "--version", "1", "--command", std::string(65536, 'x')}};
  for (std::vector<std::string> arguments : cases) {
    VmqctlResult result = deploy(arguments);
    EXPECT_EQ(result.code, 2);
    EXPECT_EQ(result.out, "");
    arguments.emplace_back("--dry-run");
    result = deploy(arguments);
    EXPECT_EQ(result.code, 2);
    EXPECT_EQ(result.out, "");
  }
  EXPECT_THAT(daemon_.log(), ElementsAre());
}

TEST_F(Deploy, DryRunShowsFilesAndRequest) {
  const std::string request = R"({"predicates":{"COMMAND":"INSTALL","TRANSID":"t1","PRODUCT":"ux","VERSION":"1",)"
                              R"("CONTEXT":"|DEPLOYDIR|/install.sh |CORVELHOME|"}})";
  const VmqctlResult result = deploy({"ux", "--version", "1", "--dry-run"});
  EXPECT_EQ(result.code, 0);
  EXPECT_EQ(result.out, "NAME             BYTES  SOURCE\nux/1/install.sh     10  " + directory_ / "bundle/install.sh" +
                            "\nux/1/lib/x           1  " + directory_ / "bundle/lib/x" + "\n" +
                            Json::parse(request).dump(2) + "\n");
  EXPECT_EQ(result.err, "not sent: " + rpcRequest + " for each file\nnot sent: POST /v1/tables/KAGREQT/query\n");
  const Json told = Json::parse(deploy({"ux", "--version", "1", "--dry-run", "-o", "json"}).out);
  EXPECT_EQ(told["request"], Json::parse(request));
  EXPECT_EQ(told["files"][0]["name"], "ux/1/install.sh");
  EXPECT_THAT(daemon_.log(), ElementsAre());
}

}  // namespace

// Registration of interfaces and calls to them.

#include <gmock/gmock.h>
#include <gtest/gtest.h>
#include <iconv.h>

#include <cerrno>
#include <cstdint>
#include <numeric>
#include <stdexcept>
#include <vector>

#include "rpc_client.h"
#include "test_seam.h"
#include "tests/host/sample_interface.h"

namespace {

using vmqhost::labelOf;
using vmqhost::parseLabel;
using vmqhost::parseUuid;
using vmqhost::RpcResult;

uint32_t registerInterface(const rpc__if_spec* interface, const void* manager, const rpc__uuid& type = rpc__nil_type) {
  uint32_t status = 99;
  rpc__register_mgr(&type, interface, manager, &status);
  return status;
}

/// An interface of its own for one test.
struct Registered {
  explicit Registered(SampleRoutine routine) : manager(*new SampleRoutine(std::move(routine))) {
    EXPECT_EQ(registerInterface(&interface, &manager), 0u);
  }
  [[nodiscard]] RpcResult call(const std::string& request = "", uint32_t operation = 0) const {
    return vmqhost::call({interface.id, interface.version, operation, {rpc__big_endian, rpc__ebcdic}, request});
  }
  // Registrations are for the life of the process.
  rpc__if_spec& interface = *new rpc__if_spec(newSampleInterface());
  SampleRoutine& manager;
  Registered(const Registered&) = delete;
};

// ---- registration --------------------------------------------------------------------------------------------------

TEST(RpcRegistration, RefusesWhatCannotBeCalled) {
  const rpc__if_spec interface = newSampleInterface();
  const SampleRoutine manager;
  EXPECT_EQ(registerInterface(nullptr, &manager), unsigned{EINVAL});
  EXPECT_EQ(registerInterface(&interface, nullptr), unsigned{EINVAL});
  EXPECT_EQ(registerInterface(&interface, &manager, interface.id), unsigned{EINVAL}) << "a type that is not nil";
  uint32_t status = 0;
  rpc__register_mgr(nullptr, &interface, &manager, &status);
  EXPECT_EQ(status, unsigned{EINVAL});
  rpc__if_spec empty = interface;
  empty.server_epv_locator = [] { return rpc__server_epv{nullptr, 0}; };
  EXPECT_EQ(registerInterface(&empty, &manager), unsigned{EINVAL});
  empty.server_epv_locator = nullptr;
  EXPECT_EQ(registerInterface(&empty, &manager), unsigned{EINVAL});
  EXPECT_EQ(vmqhost::call({interface.id}).outcome, RpcResult::kUnknownInterface);
}

TEST(RpcRegistration, TakesEachVersionOfAnInterfaceOnce) {
  static const rpc__if_spec first = newSampleInterface(1);
  static rpc__if_spec second = first;
  second.version = 2;
  static const SampleRoutine one = [](const rpc__call& call) { return replyWith(call.offered, "one"); };
  static const SampleRoutine two = [](const rpc__call& call) { return replyWith(call.offered, "two"); };
  EXPECT_EQ(registerInterface(&first, &one), 0u);
  EXPECT_EQ(registerInterface(&first, &two), unsigned{EEXIST});
  EXPECT_EQ(registerInterface(&second, &two), 0u);
  EXPECT_EQ(vmqhost::call({first.id, 1}).reply, "one");
  EXPECT_EQ(vmqhost::call({first.id, 2}).reply, "two");
}

TEST(RpcRegistration, CanBeMadeToFail) {
  const rpc__if_spec interface = newSampleInterface();
  const SampleRoutine manager;
  const TEST_FailCall failing("rpc__register_mgr", 1, 42);
  EXPECT_EQ(registerInterface(&interface, &manager), 42u);
  EXPECT_EQ(vmqhost::call({interface.id}).outcome, RpcResult::kUnknownInterface);
}

// ---- calls ---------------------------------------------------------------------------------------------------------

TEST(RpcCalls, ReachTheStubAndBringItsReply) {
  const Registered registered([](const rpc__call& call) {
    EXPECT_EQ(call.sender, (rpc__drep{rpc__big_endian, rpc__ebcdic}));
    EXPECT_GE(call.offered->body_bytes, 4u);
    return replyWith(call.offered, "<" + bodyOf(*call.request) + ">");
  });
  const RpcResult result = registered.call(std::string("a\0b", 3));
  EXPECT_EQ(result.outcome, RpcResult::kReplied);
  EXPECT_EQ(result.reply, std::string("<a\0b>", 5));
  EXPECT_EQ(result.representation, (rpc__drep{rpc__little_endian, rpc__ascii})) << "of this machine";
  EXPECT_EQ(registered.call("").reply, "<>");
}

TEST(RpcCalls, TakeRepliesInPacketsOfTheStub) {
  const std::string large(100000, 'x');
  const Registered registered(
      [&large](const rpc__call&) { return replyWith(rpc__alloc_pkt(static_cast<uint32_t>(large.size())), large); });
  EXPECT_EQ(registered.call().reply, large);
}

TEST(RpcCalls, KnowWhatThereIsNot) {
  const Registered registered([](const rpc__call& call) { return replyWith(call.offered, ""); });
  const rpc__uuid& id = registered.interface.id;
  EXPECT_EQ(vmqhost::call({{{0x5B}}, 1}).outcome, RpcResult::kUnknownInterface);
  EXPECT_EQ(vmqhost::call({rpc__nil_type, 1}).outcome, RpcResult::kUnknownInterface);
  EXPECT_EQ(vmqhost::call({id, 2}).outcome, RpcResult::kUnknownVersion);
  EXPECT_EQ(vmqhost::call({id, 0}).outcome, RpcResult::kUnknownVersion);
  EXPECT_EQ(vmqhost::call({id, 1, 2}).outcome, RpcResult::kUnknownOperation);
  EXPECT_EQ(vmqhost::call({id, 1, UINT32_MAX}).outcome, RpcResult::kUnknownOperation);
  EXPECT_EQ(vmqhost::call({id, 1, 0}).outcome, RpcResult::kReplied);
}

TEST(RpcCalls, EndWithTheFaultThatIsRaised) {
  const Registered registered([](const rpc__call& call) { return replyWith(call.offered, ""); });
  const RpcResult result = registered.call("", 1);
  EXPECT_EQ(result.outcome, RpcResult::kFault);
  EXPECT_EQ(result.fault, 0x1c00aaaau);
  EXPECT_EQ(PFM1_Thread().innermost, nullptr);
  EXPECT_EQ(registered.call().outcome, RpcResult::kReplied) << "the next call is not affected";
}

TEST(RpcCalls, LetNoExceptionThrough) {
  const Registered broken([](const rpc__call&) -> rpc__reply { throw std::runtime_error("unexpected"); });
  EXPECT_EQ(broken.call().fault, uint32_t{rpc__fault_unspecified});
  const Registered strange([](const rpc__call&) -> rpc__reply { throw 17; });
  EXPECT_EQ(strange.call().fault, uint32_t{rpc__fault_unspecified});
  const Registered hungry([](const rpc__call&) -> rpc__reply { throw std::bad_alloc(); });
  EXPECT_EQ(hungry.call().fault, uint32_t{rpc__fault_no_memory});
  EXPECT_EQ(PFM1_Thread().innermost, nullptr);
}

TEST(RpcCalls, RefuseRepliesThatCannotBe) {
  const Registered nothing([](const rpc__call&) { return rpc__reply{nullptr, 0}; });
  EXPECT_EQ(nothing.call().fault, uint32_t{rpc__fault_unspecified});
  const Registered tooMuch([](const rpc__call& call) {
    return rpc__reply{call.offered, call.offered->body_bytes + 1};
  });
  EXPECT_EQ(tooMuch.call().fault, uint32_t{rpc__fault_unspecified});
  const Registered tooMuchOfItsOwn([](const rpc__call&) { return rpc__reply{rpc__alloc_pkt(4), 5}; });
  EXPECT_EQ(tooMuchOfItsOwn.call().fault, uint32_t{rpc__fault_unspecified});
}

TEST(RpcCalls, MayCallOthers) {
  const Registered inner([](const rpc__call&) -> rpc__reply { PFM1__Raise(0x1c00bbbb); });
  const Registered outer([&inner](const rpc__call& call) {
    return replyWith(call.offered, inner.call().outcome == RpcResult::kFault ? "inner fault" : "?");
  });
  EXPECT_EQ(outer.call().reply, "inner fault");
}

// ---- memory and packets --------------------------------------------------------------------------------------------

TEST(RpcMemory, IsGivenAndTakenBack) {
  void* const nothing = rpc__malloc(0);
  EXPECT_NE(nothing, nullptr);
  rpc__free(nothing);
  rpc__free(nullptr);
  char* const block = static_cast<char*>(rpc__malloc(10));
  rpc__block_copy("012345678", block, 10);
  EXPECT_STREQ(block, "012345678");
  rpc__block_copy("x", block, 0);
  rpc__block_copy(nullptr, nullptr, 0);
  EXPECT_STREQ(block, "012345678");
  rpc__free(block);
}

TEST(RpcMemory, PacketsHaveTheRoomAskedFor) {
  for (const uint32_t bytes : {0u, 1u, 4u, 100000u}) {
    rpc__packet* const packet = rpc__alloc_pkt(bytes);
    ASSERT_NE(packet, nullptr);
    EXPECT_EQ(packet->body_bytes, bytes);
    EXPECT_EQ(reinterpret_cast<uintptr_t>(packet->body) % 8, 0u);
    std::fill_n(packet->body, bytes, 'x');
    rpc__free_pkt(packet);
  }
}

TEST(RpcMemory, CanBeMadeToFail) {
  {
    const TEST_FailCall failing("rpc__malloc", 2, 0);
    void* const block = rpc__malloc(1);
    EXPECT_NE(block, nullptr);
    EXPECT_EQ(rpc__malloc(1), nullptr);
    rpc__free(block);
  }
  const TEST_FailCall failing("rpc__alloc_pkt", 1, 0);
  EXPECT_EQ(rpc__alloc_pkt(1), nullptr);
}

// ---- frames --------------------------------------------------------------------------------------------------------

std::string cleaned;

void clean(void* name) {
  cleaned += static_cast<const char*>(name);
}

TEST(Frames, CleanUpInnermostFirst) {
  cleaned.clear();
  char a[] = "a", b[] = "b", c[] = "c";
  try {
    const PFM1_Frame outermost;
    const PFM1_Frame one(clean, a);
    PFM1_Frame two(clean, b);
    {
      const PFM1_Frame three(clean, c);
      PFM1__Raise(5);
    }
  } catch (const PFM1_Fault& fault) {
    EXPECT_EQ(fault.status, 5u);
  }
  EXPECT_EQ(cleaned, "cba");
  EXPECT_EQ(PFM1_Thread().innermost, nullptr);
}

TEST(Frames, DroppedOnesDoNotCleanUp) {
  cleaned.clear();
  char a[] = "a", b[] = "b";
  try {
    PFM1_Frame one(clean, a);
    PFM1_Frame two(clean, b);
    PFM1__DropFrame(two);
    EXPECT_EQ(PFM1_Thread().innermost, &one);
    PFM1__Raise(5);
  } catch (const PFM1_Fault&) {
  }
  EXPECT_EQ(cleaned, "a");
}

TEST(Frames, CleanUpForOtherExceptionsToo) {
  cleaned.clear();
  char a[] = "a";
  try {
    const PFM1_Frame one(clean, a);
    throw std::runtime_error("unexpected");
  } catch (const std::runtime_error&) {
  }
  EXPECT_EQ(cleaned, "a");
}

TEST(FramesDeathTest, FaultThatNobodyTakesEndsTheProcess) {
  GTEST_FLAG_SET(death_test_style, "threadsafe");
  EXPECT_DEATH(PFM1__Raise(5), "");
}

// ---- marshalling ---------------------------------------------------------------------------------------------------

TEST(Marshalling, KnowsThisMachine) {
  ASSERT_EQ(BSS1_InitializeOnce(&rpc__marshalling_once, rpc__initialize_marshalling), 0);
  const uint16_t one = 1;
  const bool isLittle = *reinterpret_cast<const unsigned char*>(&one) == 1;
  EXPECT_EQ(rpc__marshalling.local, (rpc__drep{isLittle ? rpc__little_endian : rpc__big_endian, rpc__ascii}));
}

TEST(Marshalling, TranslatesEbcdicAsTheSystemDoes) {
  ASSERT_EQ(BSS1_InitializeOnce(&rpc__marshalling_once, rpc__initialize_marshalling), 0);
  const iconv_t converter = iconv_open("ISO-8859-1", "IBM1047");
  ASSERT_NE(converter, iconv_t(-1));
  std::vector<char> ebcdic(256);
  std::iota(ebcdic.begin(), ebcdic.end(), char(0));
  std::vector<char> latin1(256);
  char* in = ebcdic.data();
  char* out = latin1.data();
  size_t left = ebcdic.size();
  size_t room = latin1.size();
  ASSERT_EQ(iconv(converter, &in, &left, &out, &room), 0u);
  iconv_close(converter);
  for (unsigned c = 0; c < 256; ++c) {
    EXPECT_EQ(rpc__marshalling.ascii_from_ebcdic[c], static_cast<unsigned char>(latin1[c])) << c;
  }
}

TEST(Marshalling, TranslatesTheCharactersOfFileNames) {
  ASSERT_EQ(BSS1_InitializeOnce(&rpc__marshalling_once, rpc__initialize_marshalling), 0);
  const unsigned char ebcdic[] = {0x81, 0xC1, 0xF0, 0x61, 0xE0, 0x4B, 0x60, 0x6D, 0x00};
  std::string ascii;
  for (const unsigned char c : ebcdic) ascii += static_cast<char>(rpc__marshalling.ascii_from_ebcdic[c]);
  EXPECT_EQ(ascii, std::string("aA0/\\.-_\0", 9));
}

TEST(Marshalling, SwapsIntegers) {
  EXPECT_EQ(rpc__swap_16(0x1234), 0x3412);
  EXPECT_EQ(rpc__swap_32(0x12345678), 0x78563412u);
}

// ---- identifiers and labels as text --------------------------------------------------------------------------------

TEST(UuidText, IsReadInEitherCase) {
  const rpc__uuid id{{0xd9, 0x8c, 0xf2, 0xa5, 0x2f, 0xae, 0x4d, 0x68, 0xb0, 0x05, 0x64, 0x6f, 0xf8, 0x3e, 0xed, 0x82}};
  EXPECT_TRUE(parseUuid("d98cf2a5-2fae-4d68-b005-646ff83eed82") == id);
  EXPECT_TRUE(parseUuid("D98CF2A5-2FAE-4D68-B005-646FF83EED82") == id);
  for (const char* const text :
       {"", "d98cf2a5", "d98cf2a5-2fae-4d68-b005-646ff83eed8", "d98cf2a5-2fae-4d68-b005-646ff83eed820",
        "d98cf2a52-fae-4d68-b005-646ff83eed82", "d98cf2a5-2fae-4d68-b005-646ff83eed8g",
        "{d98cf2a5-2fae-4d68-b005-646ff83eed8", " d98cf2a5-2fae-4d68-b005-646ff83eed8"}) {
    EXPECT_FALSE(parseUuid(text)) << text;
  }
}

TEST(LabelText, NamesFourRepresentations) {
  EXPECT_EQ(parseLabel("00000000"), (rpc__drep{rpc__big_endian, rpc__ascii}));
  EXPECT_EQ(parseLabel("10000000"), (rpc__drep{rpc__little_endian, rpc__ascii}));
  EXPECT_EQ(parseLabel("01000000"), (rpc__drep{rpc__big_endian, rpc__ebcdic}));
  EXPECT_EQ(parseLabel("11000000"), (rpc__drep{rpc__little_endian, rpc__ebcdic}));
  for (const char* const text : {"00000000", "10000000", "01000000", "11000000"}) {
    EXPECT_EQ(labelOf(*parseLabel(text)), text);
  }
  for (const char* const text : {"", "1", "1000000", "100000000", "20000000", "02000000", "10100000", "f0000000",
                                 "10010000", "10000001", "1000000 ", "-1000000", "x0000000"}) {
    EXPECT_FALSE(parseLabel(text)) << text;
  }
}

}  // namespace

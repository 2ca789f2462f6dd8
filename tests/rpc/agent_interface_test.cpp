#include "rpc/agent_interface.h"

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <string>

#include "rpc/binary_data_transfer_stub.h"
#include "rpc_client.h"
#include "test_seam.h"
#include "tests/rpc/transfer_fixture.h"

namespace {

using vmqhost::RpcResult;

/// A packet that pushes a file of one byte, little-endian.
std::string packetFor(const std::string& name) {
  std::string packet(84, '\0');
  packet += name + std::string(255 - name.size(), '\0');
  packet += '\0';
  packet += std::string(4, '\0');        // first integer
  packet += std::string("\1\0\0\0", 4);  // chunk number
  packet += std::string("\0\0\0\0", 4);  // last block index
  packet += std::string("\1\0\1\0", 4);  // maximum and actual count
  packet += std::string("\1\0\0\0!", 5) + std::string(4095, '\0');
  return packet;
}

vmqhost::RpcCall callFor(const std::string& packet) {
  return {*vmqhost::parseUuid("d98cf2a5-2fae-4d68-b005-646ff83eed82"), 1, 0, {rpc__little_endian, rpc__ascii}, packet};
}

TEST(AgentInterface, HasOneOperation) {
  const rpc__server_epv epv = QOR_Agent_v1_server_epv_locator();
  ASSERT_EQ(epv.operations, 1u);
  EXPECT_EQ(epv.stubs[0], BinaryDataTransfer_ssr);
  EXPECT_EQ(QOR_Agent_v1_if_spec.version, 1u);
}

class RegistrationTest : public TransferTest {};

// In this order, since a registration is for the life of the process.
TEST_F(RegistrationTest, MakesFilesArriveOnceItSucceeds) {
  const std::string packet = packetFor("dir\\file");
  {
    const TEST_FailCall failing("rpc__register_mgr", 1, 77);
    EXPECT_EQ(QOR_NCS_RegisterAgentInterface(), 77u);
  }
  EXPECT_TRUE(trace_.has(RAS1_ERROR, "Files cannot be pushed: the interface is not registered, status 77"));
  EXPECT_EQ(vmqhost::call(callFor(packet)).outcome, RpcResult::kUnknownInterface);

  EXPECT_EQ(QOR_NCS_RegisterAgentInterface(), 0u);
  const RpcResult result = vmqhost::call(callFor(packet));
  EXPECT_EQ(result.outcome, RpcResult::kReplied);
  EXPECT_EQ(result.reply, std::string(4, '\0'));
  EXPECT_EQ(readWholeFile(depot_ + "dir/file"), "!");

  EXPECT_EQ(QOR_NCS_RegisterAgentInterface(), unsigned{EEXIST});
}

}  // namespace

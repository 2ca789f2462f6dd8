// Carries calls to the stubs of registered interfaces.

#include "rpc_client.h"

#include <memory>
#include <new>

#include "rpc_registry.h"

namespace vmqhost {
namespace {

// Most replies are a status.
constexpr uint32_t offeredBytes = 64;

struct FreePacket {
  void operator()(rpc__packet* packet) const { rpc__free_pkt(packet); }
};

RpcResult faultOf(uint32_t status) {
  RpcResult result;
  result.outcome = RpcResult::kFault;
  result.fault = status;
  return result;
}

RpcResult dispatch(rpc__server_stub stub, const RpcCall& call, const void* manager) {
  alignas(8) unsigned char room[offeredBytes];
  rpc__packet offered{room, offeredBytes};
  // Stubs only read it.
  rpc__packet request{reinterpret_cast<unsigned char*>(const_cast<char*>(call.request.data())),
                      static_cast<uint32_t>(call.request.size())};
  const rpc__reply reply = stub({nullptr, &request, call.sender, &offered, manager});
  const std::unique_ptr<rpc__packet, FreePacket> owned(reply.packet == &offered ? nullptr : reply.packet);
  if (reply.packet == nullptr || reply.bytes > reply.packet->body_bytes) return faultOf(rpc__fault_unspecified);
  RpcResult result;
  result.outcome = RpcResult::kReplied;
  result.reply.assign(reinterpret_cast<const char*>(reply.packet->body), reply.bytes);
  (void)BSS1_InitializeOnce(&rpc__marshalling_once, rpc__initialize_marshalling);  // cannot fail
  result.representation = rpc__marshalling.local;
  return result;
}

}  // namespace

RpcResult call(const RpcCall& call) {
  const RegisteredInterface found = findInterface(call.interface, call.version);
  RpcResult result;
  if (found.interface == nullptr) {
    result.outcome = found.known_in_other_version ? RpcResult::kUnknownVersion : RpcResult::kUnknownInterface;
    return result;
  }
  const rpc__server_epv epv = found.interface->server_epv_locator();
  if (call.operation >= epv.operations) {
    result.outcome = RpcResult::kUnknownOperation;
    return result;
  }
  if (call.request.size() > UINT32_MAX) return faultOf(rpc__fault_no_memory);
  try {
    const PFM1_Frame outermost;  // faults of this call end here
    return dispatch(epv.stubs[call.operation], call, found.manager);
  } catch (const PFM1_Fault& fault) {
    return faultOf(fault.status);
  } catch (const std::bad_alloc&) {
    return faultOf(rpc__fault_no_memory);
  } catch (...) {
    return faultOf(rpc__fault_unspecified);
  }
}

}  // namespace vmqhost

#include "rpc/binary_data_transfer_stub.h"

#include <algorithm>
#include <cstring>

#include "rpc/agent_interface.h"
#include "rpc/request_reader.h"
#include "util/trace.h"

using VMQ::RequestReader;
using VMQ::Trace;

namespace {

RAS1_Unit traceUnit{"rpc/binary_data_transfer_stub"};

/// Everything of the request before its blocks.
struct Header {
  char firstText[84];
  char fileName[255];
  int32_t firstInteger;
  int32_t chunkNumber;
  int32_t lastBlockIndex;
  uint16_t maximumCount;
  uint16_t actualCount;
};

void takeHeader(RequestReader& request, Header& header) {
  request.takeText(header.firstText, sizeof header.firstText);
  request.takeText(header.fileName, sizeof header.fileName);
  request.align(4);
  header.firstInteger = request.takeInt32();
  header.chunkNumber = request.takeInt32();
  header.lastBlockIndex = request.takeInt32();
  header.maximumCount = request.takeUint16();
  header.actualCount = request.takeUint16();
}

bool boundsHold(const Header& header, const RequestReader& request) {
  return header.actualCount <= header.maximumCount && header.lastBlockIndex < header.actualCount &&
         size_t{header.actualCount} * sizeof(DataBlock) <= request.remaining();
}

void takeBlocks(RequestReader& request, DataBlock* blocks, unsigned count) {
  for (DataBlock* block = blocks; block != blocks + count; ++block) {
    block->length = request.takeInt32();
    const unsigned char* const data = request.take(sizeof block->data);
    if (request.isLocal()) {
      rpc__block_copy(data, block->data, sizeof block->data);
    } else {
      std::copy_n(data, sizeof block->data, block->data);
    }
  }
}

uint32_t callManager(const rpc__call& call, const Header& header, RequestReader& request) {
  auto* const blocks = static_cast<DataBlock*>(rpc__malloc(header.maximumCount * uint32_t{sizeof(DataBlock)}));
  if (blocks == nullptr) PFM1__Raise(rpc__fault_no_memory);
  PFM1_Frame frame(rpc__free, blocks);
  takeBlocks(request, blocks, header.actualCount);
  uint32_t status = 0;
  static_cast<const QOR_Agent_v1_mgr_epv*>(call.manager)
      ->BinaryDataTransfer(call.binding, header.firstText, header.fileName, header.firstInteger, header.chunkNumber,
                           header.lastBlockIndex, blocks, &status);
  PFM1__DropFrame(frame);
  rpc__free(blocks);
  return status;
}

rpc__reply replyWith(uint32_t status, rpc__packet* offered) {
  rpc__packet* const packet = offered->body_bytes >= sizeof status ? offered : rpc__alloc_pkt(sizeof status);
  if (packet == nullptr) PFM1__Raise(rpc__fault_no_memory);
  std::memcpy(packet->body, &status, sizeof status);
  return {packet, sizeof status};
}

}  // namespace

rpc__reply BinaryDataTransfer_ssr(const rpc__call& call) {
  const Trace trace(traceUnit);
  if (BSS1_InitializeOnce(&rpc__marshalling_once, rpc__initialize_marshalling) != 0)
    PFM1__Raise(rpc__fault_unspecified);
  RequestReader request(*call.request, call.sender);
  Header header;
  takeHeader(request, header);
  if (!boundsHold(header, request)) {
    TRACE_ERROR(trace,
                "A packet is refused: maximum count %u, actual count %u, last block index %d, %zu bytes of blocks",
                header.maximumCount, header.actualCount, header.lastBlockIndex, request.remaining());
    PFM1__Raise(rpc__fault_invalid_bound);
  }
  return replyWith(callManager(call, header, request), call.offered);
}

// The packets of a file transfer, as they come from the network: first how the packet is written and answered, then the
// packet. Zeros may be added for the texts in front and for whole blocks behind, so that a small input says much.

#include <memory>

#include "fuzz/support.h"
#include "fuzz/transfer_model.h"
#include "rpc/binary_data_transfer_stub.h"

namespace {

enum Option : uint8_t { little = 1, ebcdic = 2, roomForTheReply = 4, aligned = 8, managerFails = 16, numbersOnly = 32 };
constexpr size_t textBytes = 340;
constexpr unsigned mostAddedBlocks = 3;

/// In memory that ends with the packet.
class Packet {
 public:
  Packet(size_t zerosInFront, std::string_view bytes, size_t zerosBehind, bool isAligned)
      : offset_(isAligned ? 0 : 1),
        size_(zerosInFront + bytes.size() + zerosBehind),
        memory_(new unsigned char[offset_ + size_]()) {
    bytes.copy(reinterpret_cast<char*>(body()) + zerosInFront, bytes.size());
  }
  unsigned char* body() { return memory_.get() + offset_; }
  rpc__packet packet() { return {body(), static_cast<uint32_t>(size_)}; }
  std::string_view view() { return {reinterpret_cast<char*>(body()), size_}; }

 private:
  const size_t offset_;
  const size_t size_;
  const std::unique_ptr<unsigned char[]> memory_;
};

}  // namespace

int LLVMFuzzerTestOneInput(const uint8_t* data, size_t size) {
  fuzz::Input input(data, size);
  const uint8_t options = input.byte();
  const size_t added = input.below(mostAddedBlocks + 1) * sizeof(DataBlock);
  const uint32_t status = input.byte();
  Packet packet((options & numbersOnly) != 0 ? textBytes : 0, input.rest(), added, (options & aligned) != 0);
  const rpc__packet request = packet.packet();
  unsigned char room[64];
  rpc__packet offered{room, (options & roomForTheReply) != 0 ? uint32_t{sizeof room} : 3};
  const rpc__drep sender{(options & little) != 0 ? rpc__little_endian : rpc__big_endian,
                         (options & ebcdic) != 0 ? rpc__ebcdic : rpc__ascii};
  fuzz::transfer = {packet.view(), sender, status, (options & managerFails) != 0 ? 0x1c00beef : 0u};
  uint32_t fault = 0;
  try {
    const PFM1_Frame outermost;
    const rpc__reply reply = BinaryDataTransfer_ssr({nullptr, &request, sender, &offered, &fuzz::checkingManager});
    fuzz::require(reply.bytes == 4 && *reply.packet->body == status, "the reply is the status");
    fuzz::require((reply.packet == &offered) == (offered.body_bytes >= 4),
                  "the offered packet is taken when it will do");
    if (reply.packet != &offered) rpc__free_pkt(reply.packet);
  } catch (const PFM1_Fault& raised) {
    fault = raised.status;
  }
  fuzz::require(fault == fuzz::expectedFault(), "a packet raises the fault that it has to");
  fuzz::require(fuzz::transfer.called == fuzz::expectsCall(), "the manager is called when it has to be");
  fuzz::require(PFM1_Thread().innermost == nullptr, "no frame stays behind");
  return 0;
}

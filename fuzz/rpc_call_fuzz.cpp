// A remote call as the daemon carries it: label, interface, version and operation as texts and numbers, then the
// packet.

#include <algorithm>
#include <cctype>
#include <cstdio>
#include <string>

#include "fuzz/support.h"
#include "fuzz/transfer_model.h"
#include "rpc_client.h"

namespace {

enum Option : uint8_t { known = 1, knownVersion = 2, knownOperation = 4, managerFails = 8, little = 16, ebcdic = 32 };
constexpr size_t labelBytes = 8;
constexpr size_t uuidBytes = 36;

std::string textOf(const rpc__uuid& id) {
  std::string text;
  char digits[3];
  for (size_t index = 0; index < sizeof id.bytes; ++index) {
    if (index == 4 || index == 6 || index == 8 || index == 10) text += '-';
    (void)std::snprintf(digits, sizeof digits, "%02x", id.bytes[index]);
    text += digits;
  }
  return text;
}

std::string inLowerCase(std::string text) {
  std::transform(text.begin(), text.end(), text.begin(), [](unsigned char c) { return std::tolower(c); });
  return text;
}

void registerOnce() {
  static const uint32_t status = [] {
    uint32_t failure = 1;
    rpc__register_mgr(&rpc__nil_type, &QOR_Agent_v1_if_spec, &fuzz::checkingManager, &failure);
    return failure;
  }();
  fuzz::require(status == 0, "the interface can be registered");
}

vmqhost::RpcResult::Outcome expectedOutcome(const vmqhost::RpcCall& call) {
  using vmqhost::RpcResult;
  if (!(call.interface == QOR_Agent_v1_if_spec.id)) return RpcResult::kUnknownInterface;
  if (call.version != QOR_Agent_v1_if_spec.version) return RpcResult::kUnknownVersion;
  if (call.operation != 0) return RpcResult::kUnknownOperation;
  return fuzz::expectedFault() == 0 ? RpcResult::kReplied : RpcResult::kFault;
}

}  // namespace

int LLVMFuzzerTestOneInput(const uint8_t* data, size_t size) {
  registerOnce();
  fuzz::Input input(data, size);
  const uint8_t options = input.byte();
  const uint8_t number = input.byte();
  const std::string_view label = input.take(labelBytes);
  const std::string_view name = input.take(uuidBytes);

  const auto labelled = vmqhost::parseLabel(label);
  fuzz::require(!labelled || vmqhost::labelOf(*labelled) == label, "a label that is read is written likewise");
  const auto named = vmqhost::parseUuid(name);
  fuzz::require(!named || textOf(*named) == inLowerCase(std::string(name)),
                "an identifier is the one that was written");

  const rpc__drep otherwise{(options & little) != 0 ? rpc__little_endian : rpc__big_endian,
                            (options & ebcdic) != 0 ? rpc__ebcdic : rpc__ascii};
  const std::string packet(input.rest());
  const vmqhost::RpcCall call{(options & known) != 0 ? QOR_Agent_v1_if_spec.id : named.value_or(rpc__uuid{}),
                              (options & knownVersion) != 0 ? 1u : number,
                              (options & knownOperation) != 0 ? 0u : number, labelled.value_or(otherwise), packet};
  // cppcheck-suppress danglingLifetime ; not used after the call below
  fuzz::transfer = {packet, call.sender, number, (options & managerFails) != 0 ? 0x1c00beef : 0u};

  const vmqhost::RpcResult result = vmqhost::call(call);
  fuzz::require(result.outcome == expectedOutcome(call), "the call ends as it has to");
  if (result.outcome == vmqhost::RpcResult::kFault) {
    fuzz::require(result.fault == fuzz::expectedFault(), "with the fault of its packet");
  }
  if (result.outcome == vmqhost::RpcResult::kReplied) {
    fuzz::require(result.reply == std::string({static_cast<char>(number), 0, 0, 0}), "or the status");
    fuzz::require(result.representation == rpc__marshalling.local, "in this machine's representation");
  }
  fuzz::require(PFM1_Thread().innermost == nullptr, "no frame stays behind");
  return 0;
}

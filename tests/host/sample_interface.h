#pragma once
// Interfaces that do what a test tells them to.

#include <atomic>
#include <functional>
#include <string>

#include "rpc_client.h"

/// What the one manager routine of a sample interface does with a request; it may raise, throw, or fill in the reply.
using SampleRoutine = std::function<rpc__reply(const rpc__call&)>;

inline rpc__reply callSampleRoutine(const rpc__call& call) {
  return (*static_cast<const SampleRoutine*>(call.manager))(call);
}
inline rpc__reply refuseSampleCall(const rpc__call&) {
  PFM1__Raise(0x1c00aaaa);
}
/// Operation 0 calls the manager, operation 1 raises.
inline rpc__server_epv sampleEpv() {
  static constexpr rpc__server_stub stubs[] = {callSampleRoutine, refuseSampleCall};
  return {stubs, 2};
}

inline rpc__if_spec newSampleInterface(uint32_t version = 1) {
  static std::atomic<uint8_t> count{0};
  return {"sample", {{0x5A, ++count}}, version, sampleEpv};
}

inline std::string bodyOf(const rpc__packet& packet) {
  return {reinterpret_cast<const char*>(packet.body), packet.body_bytes};
}

inline rpc__reply replyWith(rpc__packet* packet, const std::string& text) {
  text.copy(reinterpret_cast<char*>(packet->body), text.size());
  return {packet, static_cast<uint32_t>(text.size())};
}

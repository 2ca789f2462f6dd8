#pragma once
// The other side of the remote-procedure runtime: how the process that owns the host library (daemon, tests) carries
// calls to the interfaces that are registered. The component does not use this header.
// Every function may be called from any thread.

#include <optional>
#include <span>
#include <string>
#include <string_view>

#include "rpc.h"

namespace vmqhost {

/// An identifier from its text, "d98cf2a5-2fae-4d68-b005-646ff83eed82", in letters of either case; nothing for any
/// other text.
std::optional<rpc__uuid> parseUuid(std::string_view text);

/// The data-representation label of a packet as 8 hexadecimal digits. The first says how integers are written (0
/// big-endian, 1 little-endian), the second the characters (0 ASCII, 1 EBCDIC); the third and fourth stand for IEEE
/// floating-point numbers, and the rest is reserved: all 0. Nothing for any other text.
std::optional<rpc__drep> parseLabel(std::string_view text);
std::string labelOf(const rpc__drep& representation);

/// How a call ended.
struct RpcResult {
  enum Outcome {
    kReplied,
    kFault,             ///< see `fault`; what the manager had done until then is done
    kUnknownInterface,  ///< these three: nothing was done
    kUnknownVersion,
    kUnknownOperation
  } outcome = kUnknownInterface;
  std::string reply;           ///< for kReplied: the body of the reply
  rpc__drep representation{};  ///< how it is written
  uint32_t fault = 0;
};

struct RpcCall {
  rpc__uuid interface;
  uint32_t version = 1;
  uint32_t operation = 0;
  rpc__drep sender{};
  std::string_view request{};  ///< the body of the packet; not copied
};

/// Makes the call on the calling thread; it may take long. An exception of a stub is the fault rpc__fault_unspecified,
/// a lack of memory rpc__fault_no_memory.
RpcResult call(const RpcCall& call);

}  // namespace vmqhost

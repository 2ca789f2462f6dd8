#pragma once
// Remote-procedure runtime of the host agent, as the servers of interfaces see it. Every function may be called from
// any thread.
//
// A server registers an interface: an identifier, a version, one stub for each operation, and the manager routines that
// do the work. For each call the runtime finds the stub by interface, version and operation number and runs it, several
// calls at a time on several threads. The stub takes the request packet apart, calls the manager routine and fills in
// the reply packet. What is wrong with a packet it raises as a fault, which the runtime hands to the caller.

#include <cstdint>
#include <cstring>

#include "bss1.h"

// ---- identifiers and codes -----------------------------------------------------------------------------------------

/// Identifies an interface or a type; the bytes in the order in which its text names them.
struct rpc__uuid {
  uint8_t bytes[16];
};
inline bool operator==(const rpc__uuid& one, const rpc__uuid& other) {
  return std::memcmp(one.bytes, other.bytes, sizeof one.bytes) == 0;
}

/// The nil type identifier: the manager serves every object.
inline constexpr rpc__uuid rpc__nil_type{};

/// Faults that a caller is told.
enum rpc__fault : uint32_t {
  rpc__fault_invalid_bound = 0x1c000007,  ///< a count or an index does not fit its array, or the array not the packet
  rpc__fault_unspecified = 0x1c000012,    ///< the server failed in a way that has no code of its own
  rpc__fault_no_memory = 0x1c00001b,      ///< the server has no memory for the call
};

// ---- data representation -------------------------------------------------------------------------------------------

enum rpc__integers : uint8_t { rpc__big_endian = 0, rpc__little_endian = 1 };
enum rpc__characters : uint8_t { rpc__ascii = 0, rpc__ebcdic = 1 };

/// How a packet was written. The label of a packet in network form has one more property, floating-point numbers, which
/// no interface here uses.
struct rpc__drep {
  rpc__integers integers;
  rpc__characters characters;
  bool operator==(const rpc__drep&) const = default;
};

/// What marshalling needs to know on this machine.
struct rpc__marshalling_data {
  rpc__drep local;                       ///< how this machine writes
  unsigned char ascii_from_ebcdic[256];  ///< code page 1047 to ISO 8859-1, which begins with ASCII
};

extern "C" {

/// Constant once rpc__initialize_marshalling has run; not to be read before.
extern struct rpc__marshalling_data rpc__marshalling;

/// Fills in rpc__marshalling. Every stub sees to it with BSS1_InitializeOnce and this one object before it unmarshals.
void rpc__initialize_marshalling(void);
extern struct BSS1_Once rpc__marshalling_once;

}  // extern "C"

/// Integers of the other byte order.
inline uint16_t rpc__swap_16(uint16_t value) {
  return __builtin_bswap16(value);
}
inline uint32_t rpc__swap_32(uint32_t value) {
  return __builtin_bswap32(value);
}

// ---- calls ---------------------------------------------------------------------------------------------------------

/// The caller at the other end of a call; the runtime's own. Manager routines receive it and may ignore it.
struct rpc__binding;

/// The body of a packet, of the runtime's making.
struct rpc__packet {
  unsigned char* body;  ///< aligned to 8
  uint32_t body_bytes;  ///< of a request: what arrived; of a reply packet: what it has room for
};

/// What a stub is given for one call.
struct rpc__call {
  rpc__binding* binding;
  const rpc__packet* request;
  rpc__drep sender;      ///< how the request was written
  rpc__packet* offered;  ///< for the reply
  const void* manager;   ///< the manager entry-point vector that was registered
};

/// What a stub gives back: the offered packet or one of rpc__alloc_pkt (which the runtime frees), and how many bytes of
/// it are the reply, written in the server's representation.
struct rpc__reply {
  rpc__packet* packet;
  uint32_t bytes;
};

/// A server stub. Raises a fault (PFM1__Raise) instead of returning when the call cannot be made.
typedef rpc__reply (*rpc__server_stub)(const rpc__call& call);

/// The server entry-point vector of an interface: one stub for each operation, by number.
struct rpc__server_epv {
  const rpc__server_stub* stubs;
  uint32_t operations;
};

/// An interface. Lives as long as the process once it is registered.
struct rpc__if_spec {
  const char* name;
  rpc__uuid id;
  uint32_t version;
  rpc__server_epv (*server_epv_locator)(void);
};

extern "C" {

/// Registers the manager of an interface: `manager` is its entry-point vector, of a shape that its stubs know.
/// `*status` becomes 0, EINVAL (null, no operations, or a type other than nil, which this runtime does not serve),
/// EEXIST (the interface is registered in this version), or ENOMEM.
void rpc__register_mgr(const struct rpc__uuid* type, const struct rpc__if_spec* interface, const void* manager,
                       uint32_t* status);

/// Memory for the arrays of a call, aligned for every type; null without memory, never null for 0 bytes otherwise.
/// Freed with rpc__free, which takes null too.
void* rpc__malloc(uint32_t bytes);
void rpc__free(void* memory);

/// Copies a block; the two must not overlap.
void rpc__block_copy(const void* from, void* to, uint32_t bytes);

/// A packet with room for a body of so many bytes, or null without memory. The runtime frees it as the packet of a
/// reply; anybody else with rpc__free_pkt.
struct rpc__packet* rpc__alloc_pkt(uint32_t body_bytes);
void rpc__free_pkt(struct rpc__packet* packet);

}  // extern "C"

// ---- exception frames ----------------------------------------------------------------------------------------------

class PFM1_Frame;

/// The calling thread's frames.
struct PFM1_ThreadData {
  PFM1_Frame* innermost;  ///< null: nobody would take a fault
};
PFM1_ThreadData& PFM1_Thread();

/// A fault on its way to the frame of the runtime. Code in between lets it pass.
struct PFM1_Fault {
  uint32_t status;
};

/// Raises a fault: every frame up to the runtime's runs its clean-up, innermost first. REQUIRES: a call under way on
/// this thread; without a frame the process ends.
[[noreturn]] void PFM1__Raise(uint32_t status);

/// A frame on the calling thread's stack. What leaves its block by a fault (or by any other exception) runs the
/// clean-up; a frame that was dropped has none. Frames nest like the blocks that they live in.
class PFM1_Frame {
 public:
  /// Without a clean-up it only takes part in the nesting.
  explicit PFM1_Frame(void (*cleanUp)(void*) = nullptr, void* argument = nullptr);
  ~PFM1_Frame();
  PFM1_Frame(const PFM1_Frame&) = delete;
  PFM1_Frame& operator=(const PFM1_Frame&) = delete;

 private:
  friend void PFM1__DropFrame(PFM1_Frame& frame);
  PFM1_ThreadData& thread_;
  PFM1_Frame* const outer_;
  void (*clean_up_)(void*);
  void* const argument_;
};

/// Takes the innermost frame off without running its clean-up. REQUIRES: `frame` is it.
void PFM1__DropFrame(PFM1_Frame& frame);

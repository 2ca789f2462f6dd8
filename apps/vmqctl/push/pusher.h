#pragma once
// Sends files to the depot, piece by piece, and says how far it came.

#include <chrono>
#include <cstdint>
#include <string>
#include <vector>

#include "apps/vmqctl/push/packet.h"
#include "apps/vmqctl/push/push_plan.h"
#include "apps/vmqctl/push/source_file.h"
#include "apps/vmqctl/push/transfer_line.h"
#include "apps/vmqctl/settings.h"

namespace vmqctl {

/// One push. One thread. The session's progress is its own while it lives.
class Pusher {
 public:
  /// Asks the daemon how it takes files, and checks that it takes these. Throws a Failure; nothing has been sent then.
  Pusher(Session& session, const PushPlan& plan, bool verify);
  ~Pusher();
  Pusher(const Pusher&) = delete;
  Pusher& operator=(const Pusher&) = delete;

  /// Sends one file after the other, and with `verify` compares each with what has arrived. Throws a Failure that says
  /// where it stopped and what is left on the machine.
  void run();

  /// What has been sent so far: result ("done" or "failed"), depot, bytes, calls, seconds, files, stopped_at.
  [[nodiscard]] Json report() const;

  /// The same for a person, in one line: "sent 3 files (12 KiB) to /opt/mon/depot/".
  [[nodiscard]] std::string summary() const;

 private:
  enum class Stage {
    Reading,    ///< nothing of the chunk has gone out
    Sending,    ///< the machine may have taken the chunk
    Refused,    ///< the machine has not taken the chunk
    Broken,     ///< the machine may have stored a part of the chunk
    Verifying,  ///< the whole file has been stored
  };
  /// How the daemon takes files.
  struct Service {
    std::string depot;  ///< ends with "/"
    std::size_t maximumPacketBytes;
  };
  struct Sent {
    const PlannedFile& file;
    std::uint64_t bytes = 0;  ///< when it was sent
    std::uint64_t chunks = 0;
    std::string sha256;  ///< as it arrived; "" when that was not checked
  };

  Pusher(Session& session, const PushPlan& plan, bool verify, const Service& service);

  static Service askForService(Session& session);
  void send(const PlannedFile& file);
  void sendPacket();
  void verify(const PlannedFile& file, std::uint64_t bytes, const std::string& sha256);

  [[nodiscard]] const PlannedFile& current() const { return plan_.files()[sent_.size()]; }
  [[nodiscard]] double seconds() const;
  [[nodiscard]] std::string where() const;
  [[nodiscard]] std::string whatIsLeft() const;
  [[nodiscard]] TransferState state() const;

  Session& session_;
  const PushPlan& plan_;
  const bool verify_;
  const std::chrono::steady_clock::time_point begun_ = std::chrono::steady_clock::now();
  const std::string depot_;  // ends with "/"
  Packet packet_;

  std::vector<Sent> sent_;
  std::uint64_t bytes_ = 0;  // taken by the machine
  std::uint64_t calls_ = 0;
  std::uint64_t chunk_ = 1;   // of the current file
  std::uint64_t chunks_ = 1;  // of the current file
  Stage stage_ = Stage::Reading;
};

}  // namespace vmqctl

#pragma once
// Ctrl-C as something that can be waited for together with sockets.

namespace vmqctl {

/// While it lives, SIGINT and SIGTERM no longer end the process but are told here. A signal that was ignored when the
/// process started (a job in the background, nohup) stays ignored. One per process, made before other threads.
class Interrupts {
 public:
  Interrupts();
  ~Interrupts();
  Interrupts(const Interrupts&) = delete;
  Interrupts& operator=(const Interrupts&) = delete;

  /// Readable from the first signal on, for good. Owned by this object.
  [[nodiscard]] int descriptor() const { return descriptor_; }

  [[nodiscard]] bool arrived() const;

 private:
  int descriptor_;
};

}  // namespace vmqctl

#pragma once
// Ends the connections of clients that take too long.

#include <chrono>
#include <condition_variable>
#include <list>
#include <mutex>
#include <thread>

namespace vmqd {

/// Any thread.
class ClientDeadlines {
 public:
  /// How long each client has.
  explicit ClientDeadlines(std::chrono::seconds limit);
  ~ClientDeadlines();
  ClientDeadlines(const ClientDeadlines&) = delete;
  ClientDeadlines& operator=(const ClientDeadlines&) = delete;

  /// One client's. When its time is up, its socket is shut down: whoever reads or writes on it finds it closed.
  /// One thread at a time.
  class Client {
   public:
    /// `descriptor` stays open as long as the object. No time runs yet.
    Client(ClientDeadlines& deadlines, int descriptor) : deadlines_(deadlines), descriptor_(descriptor) {}
    ~Client() { proceed(); }
    Client(const Client&) = delete;
    Client& operator=(const Client&) = delete;

    /// From now on the daemon waits for the client, which has the whole time.
    void await() noexcept;
    /// The client has done its part.
    void proceed() noexcept;

   private:
    friend class ClientDeadlines;

    ClientDeadlines& deadlines_;
    const int descriptor_;
    std::list<Client*> resting_{
        this};  // holds this client while no time runs; guarded by deadlines_.mutex_, like deadline_
    const std::list<Client*>::iterator place_ = resting_.begin();
    std::chrono::steady_clock::time_point deadline_;
  };

 private:
  void run();
  void rest(Client& client) noexcept;

  const std::chrono::seconds limit_;
  std::mutex mutex_;
  std::condition_variable changed_;
  std::list<Client*> awaited_;  // in the order of their deadlines; guarded by mutex_, like what follows. Clients move
                                // between the lists, which takes no memory
  bool ending_ = false;
  std::thread thread_;
};

}  // namespace vmqd

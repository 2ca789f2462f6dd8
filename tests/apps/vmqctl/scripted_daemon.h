#pragma once
// A stand-in for vmqd that says whatever a test wants: wrong, too late, or cut off in the middle.

#include <condition_variable>
#include <functional>
#include <map>
#include <mutex>
#include <string>
#include <thread>
#include <vector>

#include "tests/support/temporary_directory.h"

/// Something that one thread lets others wait for. Waiting gives up after 20 seconds and says so by false.
class Gate {
 public:
  void open();
  [[nodiscard]] bool wait();

 private:
  std::mutex mutex_;
  std::condition_variable changed_;
  bool open_ = false;
};

/// One request and the way to answer it. Used by the thread that serves it only.
class Exchange {
 public:
  Exchange(int descriptor, std::string target, std::string body)
      : descriptor_(descriptor), target_(std::move(target)), body_(std::move(body)) {}

  [[nodiscard]] const std::string& target() const { return target_; }  ///< "/v1/health"
  [[nodiscard]] const std::string& body() const { return body_; }

  /// Sends bytes as they are. False when the client has gone.
  bool send(const std::string& bytes) const;
  /// A whole answer.
  void reply(int status, const std::string& json) const;
  /// The head of an event stream and its open event.
  void openStream() const;
  bool event(const std::string& name, const std::string& data) const;
  /// Returns when the client has closed the connection, or the daemon is destroyed.
  void awaitClose() const;

 private:
  int descriptor_;
  std::string target_;
  std::string body_;
};

/// Listens on a socket of its own; each connection has a thread, which closes it when its handler returns.
class ScriptedDaemon {
 public:
  using Handler = std::function<void(Exchange&)>;

  ScriptedDaemon();
  ~ScriptedDaemon();
  ScriptedDaemon(const ScriptedDaemon&) = delete;
  ScriptedDaemon& operator=(const ScriptedDaemon&) = delete;

  /// For requests that begin so: "POST /v1/tables/KAGREQT/query". Without a handler the answer is 404.
  void on(const std::string& request, Handler handler);

  [[nodiscard]] const std::string& socket() const { return socket_; }

  /// What happened, in order: each request's first line, "GET /v1", and whatever handlers add.
  [[nodiscard]] std::vector<std::string> log();
  void note(const std::string& text);

 private:
  void accept();
  void serve(int connection);

  TemporaryDirectory directory_;
  const std::string socket_;
  int listener_;
  std::mutex mutex_;  // guards what follows
  std::map<std::string, Handler> handlers_;
  std::vector<std::string> log_;
  std::vector<int> connections_;
  std::vector<std::thread> threads_;
  std::thread acceptor_;
};

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
  Exchange(int descriptor, std::string head, std::string body)
      : descriptor_(descriptor), head_(std::move(head)), body_(std::move(body)) {}

  [[nodiscard]] std::string target() const;                        ///< "/v1/health"
  [[nodiscard]] const std::string& head() const { return head_; }  ///< its first line and its headers
  [[nodiscard]] const std::string& body() const { return body_; }

  /// Sends bytes as they are. False when the client has gone.
  bool send(const std::string& bytes) const;
  /// A whole answer. The connection stays open for the next request. `headers`: whole lines, each with "\r\n".
  void reply(int status, const std::string& json, const std::string& headers = "");
  /// The whole answer of a remote procedure, in this representation.
  void replyPacket(const std::string& bytes, const std::string& representation = "10000000");
  /// Closes the connection behind the answer.
  void hangUp() { kept_ = false; }
  /// The head of an event stream and its open event.
  void openStream() const;
  bool event(const std::string& name, const std::string& data) const;
  /// Returns when the client has closed the connection, or the daemon is destroyed.
  void awaitClose() const;

  /// True when the connection is good for one more request.
  [[nodiscard]] bool kept() const { return kept_; }

 private:
  void reply(int status, const std::string& type, const std::string& headers, const std::string& body);

  int descriptor_;
  std::string head_;
  std::string body_;
  bool kept_ = false;
};

/// Listens on a socket of its own; each connection has a thread, which closes it when a handler returns that has not
/// sent a whole answer by reply().
class ScriptedDaemon {
 public:
  using Handler = std::function<void(Exchange&)>;

  ScriptedDaemon();
  ~ScriptedDaemon();
  ScriptedDaemon(const ScriptedDaemon&) = delete;
  ScriptedDaemon& operator=(const ScriptedDaemon&) = delete;

  /// For requests that begin so: "POST /v1/tables/KAGREQT/query". Without a handler the answer is 404.
  void on(const std::string& request, Handler handler);

  /// For such requests whose client asks first whether it may send the body: instead of saying that it may.
  void onAsked(const std::string& request, Handler handler);

  [[nodiscard]] const std::string& socket() const { return socket_; }

  /// What happened, in order: each request's first line, "GET /v1", and whatever handlers add.
  [[nodiscard]] std::vector<std::string> log();
  void note(const std::string& text);
  /// How many connections have been made.
  [[nodiscard]] std::size_t connections();

 private:
  void accept();
  void serve(int connection);
  bool serveOne(int connection, std::string& received);
  [[nodiscard]] Handler handlerFor(const std::map<std::string, Handler>& handlers, const std::string& line);

  TemporaryDirectory directory_;
  const std::string socket_;
  int listener_;
  std::mutex mutex_;  // guards what follows
  std::map<std::string, Handler> handlers_;
  std::map<std::string, Handler> asked_;
  std::vector<std::string> log_;
  std::vector<int> connections_;
  std::vector<std::thread> threads_;
  std::thread acceptor_;
};

#pragma once
// HTTP over a Unix socket: exchanges that go on side by side, and one place that waits for them, for Ctrl-C and for the
// time to run out.

#include <curl/curl.h>

#include <chrono>
#include <functional>
#include <memory>
#include <optional>
#include <string>
#include <string_view>
#include <vector>

#include "apps/vmqctl/interrupts.h"
#include "apps/vmqctl/progress.h"

namespace vmqctl {

struct HttpRequest {
  std::string target;                              ///< path and query, encoded
  std::optional<std::string> body = std::nullopt;  ///< JSON to post; a GET without it
  /// Posted in place of body. Not copied: it must stay until the transfer has ended.
  std::optional<std::string_view> packet = std::nullopt;
  std::vector<std::string> headers = {};  ///< further ones: "NAME: VALUE"
  bool keepsConnection = false;           ///< for the next request that does, too
};

class HttpLoop;

/// One exchange, going on whenever the loop waits for anything. Ended at the latest when the object goes.
class Transfer {
 public:
  Transfer(HttpLoop& loop, const HttpRequest& request);
  ~Transfer();
  Transfer(const Transfer&) = delete;
  Transfer& operator=(const Transfer&) = delete;

  [[nodiscard]] bool ended() const { return result_.has_value(); }
  /// How it ended. REQUIRES: ended().
  [[nodiscard]] CURLcode result() const { return *result_; }
  /// The system's error number behind a failed connect; 0 when there is none.
  [[nodiscard]] int systemError() const;
  /// The HTTP status; 0 before it has come.
  [[nodiscard]] long status() const;
  /// What has arrived of the body and was not taken yet.
  [[nodiscard]] const std::string& body() const { return body_; }
  std::string takeBody();
  /// The value of a header of the answer, "" without it.
  [[nodiscard]] std::string header(const char* name) const;
  /// How long the answer asks to wait before the next try.
  [[nodiscard]] std::chrono::seconds retryAfter() const;

 private:
  friend class HttpLoop;
  struct HandleDeleter {
    void operator()(CURL* handle) const { curl_easy_cleanup(handle); }
  };
  struct ListDeleter {
    void operator()(curl_slist* list) const { curl_slist_free_all(list); }
  };
  static std::size_t write(char* data, std::size_t size, std::size_t count, void* self) noexcept;
  static std::size_t readPacket(char* to, std::size_t size, std::size_t count, void* self) noexcept;
  static int rewindPacket(void* self, curl_off_t offset, int origin) noexcept;

  void addHeader(const std::string& header);
  void post(const std::string& json);
  void post(std::string_view packet);

  HttpLoop& loop_;
  std::string body_;
  std::string_view unsent_;  // of a packet
  bool begun_ = false;       // a part of the packet has been handed out
  std::optional<CURLcode> result_;
  std::unique_ptr<curl_slist, ListDeleter> headers_;
  std::unique_ptr<CURL, HandleDeleter> handle_;
};

/// One thread. Must outlive its transfers.
class HttpLoop {
 public:
  /// seconds: how long all waits together may take from now on; 0 for no limit.
  HttpLoop(std::string socket, unsigned seconds, Progress& progress);
  ~HttpLoop();
  HttpLoop(const HttpLoop&) = delete;
  HttpLoop& operator=(const HttpLoop&) = delete;

  /// Lets the transfers go on until done() says so. Throws Interrupted or TimedOut when that comes first.
  void until(const std::function<bool()>& done);

  /// Lets time pass. Throws as until() does.
  void pause(std::chrono::milliseconds time);

  /// True once the time is up. until() still lets pass what has come by then.
  [[nodiscard]] bool expired() const { return end_ && Clock::now() >= *end_; }

  [[nodiscard]] const std::string& socket() const { return socket_; }

 private:
  friend class Transfer;
  using Clock = std::chrono::steady_clock;

  void step();
  void until(const std::function<bool()>& done, Clock::time_point wake);
  /// Up to what comes first: the next tick, the end of the time, `wake`.
  [[nodiscard]] int pollMilliseconds(Clock::time_point wake) const;

  const std::string socket_;
  Progress& progress_;
  const Interrupts interrupts_;
  const std::optional<Clock::time_point> end_;
  CURLM* const multi_;
};

}  // namespace vmqctl

#pragma once
// HTTP over a Unix socket: exchanges that go on side by side, and one place that waits for them, for Ctrl-C and for the
// time to run out.

#include <curl/curl.h>

#include <chrono>
#include <functional>
#include <memory>
#include <optional>
#include <string>

#include "apps/vmqctl/interrupts.h"
#include "apps/vmqctl/progress.h"

namespace vmqctl {

struct HttpRequest {
  std::string target;               ///< path and query, encoded
  std::optional<std::string> body;  ///< JSON to post; a GET without it
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

 private:
  friend class HttpLoop;
  struct HandleDeleter {
    void operator()(CURL* handle) const { curl_easy_cleanup(handle); }
  };
  struct ListDeleter {
    void operator()(curl_slist* list) const { curl_slist_free_all(list); }
  };
  static std::size_t write(char* data, std::size_t size, std::size_t count, void* self) noexcept;

  HttpLoop& loop_;
  std::string body_;
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

  /// True once the time is up. until() still lets pass what has come by then.
  [[nodiscard]] bool expired() const { return end_ && Clock::now() >= *end_; }

  [[nodiscard]] const std::string& socket() const { return socket_; }

 private:
  friend class Transfer;
  using Clock = std::chrono::steady_clock;

  void step();
  [[nodiscard]] int pollMilliseconds() const;

  const std::string socket_;
  Progress& progress_;
  const Interrupts interrupts_;
  const std::optional<Clock::time_point> end_;
  CURLM* const multi_;
};

}  // namespace vmqctl

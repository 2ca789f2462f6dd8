// HTTP over a Unix socket.

#include "apps/vmqctl/http_loop.h"

#include <algorithm>
#include <new>
#include <stdexcept>

#include "apps/vmqctl/failure.h"

namespace vmqctl {
namespace {

/// What can only fail for want of memory or of the feature in the library.
template <typename Code>
void check(Code code) {
  if (code != Code{}) throw std::runtime_error("the HTTP library refuses: " + std::to_string(code));
}

/// Sets the library up once; it is told to leave when the process ends.
struct Library {
  Library() { check(curl_global_init(CURL_GLOBAL_DEFAULT)); }
  ~Library() { curl_global_cleanup(); }
};

CURLM* makeMulti() {
  static const Library library;
  CURLM* multi = curl_multi_init();
  if (multi == nullptr) throw std::bad_alloc();
  return multi;
}

}  // namespace

Transfer::Transfer(HttpLoop& loop, const HttpRequest& request) : loop_(loop), handle_(curl_easy_init()) {
  if (handle_ == nullptr) throw std::bad_alloc();
  CURL* const handle = handle_.get();
  check(curl_easy_setopt(handle, CURLOPT_UNIX_SOCKET_PATH, loop.socket_.c_str()));
  check(curl_easy_setopt(handle, CURLOPT_URL, ("http://localhost" + request.target).c_str()));
  check(curl_easy_setopt(handle, CURLOPT_PROTOCOLS_STR, "http"));
  check(curl_easy_setopt(handle, CURLOPT_PROXY, ""));  // whatever the environment says: the daemon is on this machine
  check(curl_easy_setopt(handle, CURLOPT_PATH_AS_IS, 1L));
  check(curl_easy_setopt(handle, CURLOPT_HTTP_VERSION, long{CURL_HTTP_VERSION_1_1}));
  // On a connection used before, the library would send a request a second time when the first got no answer.
  check(curl_easy_setopt(handle, CURLOPT_FORBID_REUSE, 1L));
  check(curl_easy_setopt(handle, CURLOPT_NOSIGNAL, 1L));
  check(curl_easy_setopt(handle, CURLOPT_USERAGENT, "vmqctl/" VMQ_VERSION));
  check(curl_easy_setopt(handle, CURLOPT_WRITEFUNCTION, &Transfer::write));
  check(curl_easy_setopt(handle, CURLOPT_WRITEDATA, this));
  check(curl_easy_setopt(handle, CURLOPT_PRIVATE, this));
  if (request.body) {
    // No "Expect": the daemon is asked at once, not first whether it would listen.
    for (const char* header : {"Content-Type: application/json", "Expect:"}) {
      curl_slist* const longer = curl_slist_append(headers_.get(), header);
      if (longer == nullptr) throw std::bad_alloc();
      (void)headers_.release();  // now part of the longer one
      headers_.reset(longer);
    }
    check(curl_easy_setopt(handle, CURLOPT_HTTPHEADER, headers_.get()));
    check(curl_easy_setopt(handle, CURLOPT_POSTFIELDSIZE_LARGE, static_cast<curl_off_t>(request.body->size())));
    check(curl_easy_setopt(handle, CURLOPT_COPYPOSTFIELDS, request.body->c_str()));
  }
  check(curl_multi_add_handle(loop.multi_, handle));
}

Transfer::~Transfer() {
  (void)curl_multi_remove_handle(loop_.multi_, handle_.get());
}

int Transfer::systemError() const {
  long number = 0;
  return curl_easy_getinfo(handle_.get(), CURLINFO_OS_ERRNO, &number) == CURLE_OK ? static_cast<int>(number) : 0;
}

long Transfer::status() const {
  long number = 0;
  return curl_easy_getinfo(handle_.get(), CURLINFO_RESPONSE_CODE, &number) == CURLE_OK ? number : 0;
}

std::string Transfer::takeBody() {
  std::string taken;
  taken.swap(body_);
  return taken;
}

std::size_t Transfer::write(char* data, std::size_t size, std::size_t count, void* self) noexcept {
  static_cast<Transfer*>(self)->body_.append(data, size * count);
  return size * count;
}

HttpLoop::HttpLoop(std::string socket, unsigned seconds, Progress& progress)
    : socket_(std::move(socket)),
      progress_(progress),
      end_(seconds == 0 ? std::nullopt : std::optional(Clock::now() + std::chrono::seconds(seconds))),
      multi_(makeMulti()) {}

HttpLoop::~HttpLoop() {
  (void)curl_multi_cleanup(multi_);
}

void HttpLoop::step() {
  int running = 0;
  check(curl_multi_perform(multi_, &running));
  int left = 0;
  while (const CURLMsg* message = curl_multi_info_read(multi_, &left)) {
    void* transfer = nullptr;
    check(curl_easy_getinfo(message->easy_handle, CURLINFO_PRIVATE, &transfer));
    static_cast<Transfer*>(transfer)->result_ = message->data.result;
  }
}

int HttpLoop::pollMilliseconds() const {
  using std::chrono::milliseconds;
  milliseconds longest = std::min<milliseconds>(progress_.interval(), std::chrono::hours(1));
  if (end_) {
    // Rounded up, or the last millisecond would be spent in a busy loop.
    longest = std::min(longest, std::chrono::ceil<milliseconds>(*end_ - Clock::now()));
  }
  return static_cast<int>(std::max(longest, milliseconds(0)).count());
}

void HttpLoop::until(const std::function<bool()>& done) {
  for (;;) {
    step();
    if (interrupts_.arrived()) throw Interrupted();
    if (done()) return;
    if (expired()) throw TimedOut();
    progress_.tick();
    curl_waitfd interrupt = {interrupts_.descriptor(), CURL_WAIT_POLLIN, 0};
    check(curl_multi_poll(multi_, &interrupt, 1, pollMilliseconds(), nullptr));
  }
}

}  // namespace vmqctl

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

constexpr std::size_t sentUnasked = std::size_t{64} * 1024;  // less than a socket takes at once
constexpr long uploadBufferBytes = long{256} * 1024;

/// Sets the library up once; it is told to leave when the process ends.
struct Library {
  Library() { check(curl_global_init(CURL_GLOBAL_DEFAULT)); }
  ~Library() { curl_global_cleanup(); }
  Library(const Library&) = delete;
  Library& operator=(const Library&) = delete;
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
  if (!request.keepsConnection) {
    // On a connection used before, the library would send a request a second time when the first got no answer.
    check(curl_easy_setopt(handle, CURLOPT_FRESH_CONNECT, 1L));
    check(curl_easy_setopt(handle, CURLOPT_FORBID_REUSE, 1L));
  }
  check(curl_easy_setopt(handle, CURLOPT_NOSIGNAL, 1L));
  check(curl_easy_setopt(handle, CURLOPT_USERAGENT, "vmqctl/" VMQ_VERSION));
  check(curl_easy_setopt(handle, CURLOPT_WRITEFUNCTION, &Transfer::write));
  check(curl_easy_setopt(handle, CURLOPT_WRITEDATA, this));
  check(curl_easy_setopt(handle, CURLOPT_PRIVATE, this));
  for (const std::string& line : request.headers) addHeader(line);
  if (request.packet) {
    post(*request.packet);
  } else if (request.body) {
    post(*request.body);
  }
  if (headers_) check(curl_easy_setopt(handle, CURLOPT_HTTPHEADER, headers_.get()));
  check(curl_multi_add_handle(loop.multi_, handle));
}

void Transfer::addHeader(const std::string& header) {
  curl_slist* const longer = curl_slist_append(headers_.get(), header.c_str());
  if (longer == nullptr) throw std::bad_alloc();
  (void)headers_.release();  // now part of the longer one
  headers_.reset(longer);
}

void Transfer::post(const std::string& json) {
  CURL* const handle = handle_.get();
  addHeader("Content-Type: application/json");
  addHeader("Expect:");  // the daemon is asked at once, not first whether it would listen
  check(curl_easy_setopt(handle, CURLOPT_POSTFIELDSIZE_LARGE, static_cast<curl_off_t>(json.size())));
  check(curl_easy_setopt(handle, CURLOPT_COPYPOSTFIELDS, json.c_str()));
}

void Transfer::post(std::string_view packet) {
  CURL* const handle = handle_.get();
  addHeader("Content-Type: application/octet-stream");
  // A large one only after the daemon has said that it listens: one that has no room for it hangs up, and a client that
  // is still sending might not get to read why.
  addHeader(packet.size() > sentUnasked ? "Expect: 100-continue" : "Expect:");
  unsent_ = packet;
  check(curl_easy_setopt(handle, CURLOPT_POST, 1L));
  check(curl_easy_setopt(handle, CURLOPT_POSTFIELDSIZE_LARGE, static_cast<curl_off_t>(packet.size())));
  check(curl_easy_setopt(handle, CURLOPT_UPLOAD_BUFFERSIZE, uploadBufferBytes));
  check(curl_easy_setopt(handle, CURLOPT_READFUNCTION, &Transfer::readPacket));
  check(curl_easy_setopt(handle, CURLOPT_READDATA, this));
  check(curl_easy_setopt(handle, CURLOPT_SEEKFUNCTION, &Transfer::rewindPacket));
  check(curl_easy_setopt(handle, CURLOPT_SEEKDATA, this));
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

std::string Transfer::header(const char* name) const {
  curl_header* found = nullptr;
  return curl_easy_header(handle_.get(), name, 0, CURLH_HEADER, -1, &found) == CURLHE_OK ? found->value : "";
}

std::chrono::seconds Transfer::retryAfter() const {
  curl_off_t seconds = 0;
  return std::chrono::seconds(curl_easy_getinfo(handle_.get(), CURLINFO_RETRY_AFTER, &seconds) == CURLE_OK ? seconds
                                                                                                           : 0);
}

std::size_t Transfer::readPacket(char* to, std::size_t size, std::size_t count, void* self) noexcept {
  auto* const transfer = static_cast<Transfer*>(self);
  const std::size_t copied = transfer->unsent_.copy(to, size * count);
  transfer->unsent_.remove_prefix(copied);
  transfer->begun_ = true;
  return copied;
}

/// The library asks for this before it sends a request again. What has gone out in part may have been taken as a whole.
int Transfer::rewindPacket(void* self, curl_off_t offset, int) noexcept {
  return offset == 0 && !static_cast<Transfer*>(self)->begun_ ? CURL_SEEKFUNC_OK : CURL_SEEKFUNC_FAIL;
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

int HttpLoop::pollMilliseconds(Clock::time_point wake) const {
  using std::chrono::milliseconds;
  milliseconds longest = std::min<milliseconds>(progress_.interval(), std::chrono::hours(1));
  const Clock::time_point now = Clock::now();
  // Rounded up, or the last millisecond would be spent in a busy loop.
  if (end_) longest = std::min(longest, std::chrono::ceil<milliseconds>(*end_ - now));
  if (wake != Clock::time_point::max()) longest = std::min(longest, std::chrono::ceil<milliseconds>(wake - now));
  return static_cast<int>(std::max(longest, milliseconds(0)).count());
}

void HttpLoop::until(const std::function<bool()>& done) {
  until(done, Clock::time_point::max());
}

void HttpLoop::pause(std::chrono::milliseconds time) {
  const Clock::time_point wake = Clock::now() + time;
  until([&] { return Clock::now() >= wake; }, wake);
}

void HttpLoop::until(const std::function<bool()>& done, Clock::time_point wake) {
  for (;;) {
    step();
    if (interrupts_.arrived()) throw Interrupted();
    if (done()) return;
    if (expired()) throw TimedOut();
    progress_.tick();
    curl_waitfd interrupt = {interrupts_.descriptor(), CURL_WAIT_POLLIN, 0};
    check(curl_multi_poll(multi_, &interrupt, 1, pollMilliseconds(wake), nullptr));
  }
}

}  // namespace vmqctl

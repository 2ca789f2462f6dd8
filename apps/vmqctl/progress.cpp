// The turning line.

#include "apps/vmqctl/progress.h"

#include <utility>

namespace vmqctl {
namespace {

using std::chrono::milliseconds;

constexpr milliseconds turning{100};
constexpr milliseconds moment{200};  // what is done sooner would only flicker
constexpr std::string_view wheel = "|/-\\";

}  // namespace

void Progress::turn(const std::string& text) {
  clear();
  text_ = text;
  followed_ = nullptr;
  since_ = Clock::now();
}

void Progress::tell(const std::string& text) {
  turn(text);
  if (!console_.err().sequences) console_.line(text);
}

void Progress::follow(std::function<std::string()> text) {
  turn("");
  followed_ = std::move(text);
}

void Progress::tick() {
  const Stream& err = console_.err();
  if (!err.sequences || (text_.empty() && !followed_)) return;
  const Clock::time_point now = Clock::now();
  const auto lasted = std::chrono::duration_cast<milliseconds>(now - since_);
  if (lasted < moment || (shown_ && now - drawn_ < turning / 2)) return;

  std::string line;
  if (followed_) {
    line = escaped(followed_(), err.charset);
  } else {
    const char spoke = wheel[static_cast<std::size_t>(lasted / turning) % wheel.size()];
    line = std::string(1, spoke) + " " + escaped(text_, err.charset) + " (" + std::to_string(lasted.count() / 1000) +
           " s)";
  }
  const std::size_t width = err.width();
  if (width > 1) line.resize(within(line, width - 1).bytes);  // a line that wraps could not be taken back
  (void)std::fputs(("\r" + line + "\033[K").c_str(), err.file);
  (void)std::fflush(err.file);
  shown_ = true;
  drawn_ = now;
}

milliseconds Progress::interval() const {
  return console_.err().sequences ? turning : milliseconds::max();
}

void Progress::clear() {
  if (!shown_) return;
  (void)std::fputs("\r\033[K", console_.err().file);
  (void)std::fflush(console_.err().file);
  shown_ = false;
}

}  // namespace vmqctl

#pragma once
// Tells a person that something goes on: a turning or growing line on a terminal, which leaves nothing behind, plain
// lines elsewhere.

#include <chrono>
#include <functional>
#include <string>

#include "apps/vmqctl/console.h"

namespace vmqctl {

/// One thread at a time. Everything goes to standard error.
class Progress {
 public:
  explicit Progress(const Console& console) : console_(console) {}
  ~Progress() { clear(); }
  Progress(const Progress&) = delete;
  Progress& operator=(const Progress&) = delete;

  /// What goes on from now on. Shown on a terminal only, and only once it has lasted for a moment.
  void turn(const std::string& text);

  /// The same, and worth a line of its own where there is no terminal.
  void tell(const std::string& text);

  /// What goes on from now on is asked for each time the line is drawn. Shown on a terminal only.
  void follow(std::function<std::string()> text);

  /// To be called every interval() or more often: draws the line anew when it is time to.
  void tick();

  /// How long to wait between two ticks; the longest time there is where nothing turns.
  [[nodiscard]] std::chrono::milliseconds interval() const;

  /// Takes the turning line off the terminal. A later tick would bring it back, unless the text is "".
  void clear();

 private:
  using Clock = std::chrono::steady_clock;

  const Console& console_;
  std::string text_;
  std::function<std::string()> followed_;  // in place of text_
  Clock::time_point since_;
  Clock::time_point drawn_;
  bool shown_ = false;
};

}  // namespace vmqctl

#pragma once
// Where output goes: data to standard output, everything that is told to a person to standard error.

#include <cstdio>
#include <string>
#include <string_view>

#include "apps/vmqctl/text.h"

namespace vmqctl {

/// One of the two, and what it can show.
struct Stream {
  std::FILE* file = nullptr;
  bool terminal = false;
  bool sequences = false;           ///< a terminal that understands escape sequences
  bool colour = false;              ///< the same, and NO_COLOR is not set
  Charset charset = Charset::Utf8;  ///< Ascii on a terminal whose locale is not UTF-8

  /// The width of the terminal now, in columns; 0 when it is none or does not tell.
  [[nodiscard]] std::size_t width() const;
};

/// What a run of this program says and to whom.
class Console {
 public:
  /// Looks at standard output and standard error, TERM, NO_COLOR and the locale. To be called once, before threads.
  static Console ofThisProcess();

  Console(const Stream& out, const Stream& err) : out_(out), err_(err) {}

  [[nodiscard]] const Stream& out() const { return out_; }
  [[nodiscard]] const Stream& err() const { return err_; }

  /// Writes data as it is, and at once. Throws a Failure when it cannot be written.
  void data(std::string_view text) const;

  /// "vmqctl: SENTENCE NEXT", escaped, on standard error; next may be empty.
  void error(std::string_view sentence, std::string_view next) const;

  /// A line on standard error, escaped.
  void line(std::string_view text) const;

 private:
  Stream out_;
  Stream err_;
};

}  // namespace vmqctl

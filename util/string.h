#pragma once
// The component's text.

#include <iosfwd>
#include <string>

#include "nls2.h"
#include "util/array.h"
#include "util/char_star.h"
#include "util/index_out_of_bounds_exception.h"

namespace VMQ {

/// The locale of every conversion; null until the first one. Written by String::initialize() only.
extern NLS2_Locale* glbLocale;

/// Text as UTF-16 code units. Positions and lengths count units; a surrogate pair is two of them.
///
/// A position or length outside its range is traced and throws IndexOutOfBoundsException, and nothing is changed;
/// ranges are compared without wrapping. Pieces of a text may be appended, assigned or inserted into the text itself.
///
/// Narrow text is text in the code page of the process's locale; a byte that it cannot decode is one unit of the same
/// value. Null pointers count as empty text.
///
/// A text is used by one thread at a time. The FIRST conversion of the process, which chooses the locale, must happen
/// at start-up on one thread, before other threads convert anything (a failed choice is made again by the next
/// conversion); from then on any thread may convert.
class String {
 public:
  /// "Not found".
  static constexpr unsigned int NPOS = 0xFFFFFFFF;

  // NOLINTBEGIN(google-explicit-constructor): literals and narrow texts are passed wherever a text is wanted
  String() noexcept : units_(Units::SharedZero()) {}
  String(const String& s) = default;
  /// Leaves `s` empty.
  String(String&& s) noexcept : String() { units_.swap(s.units_); }
  /// The first `n` units, or all of them when there are fewer.
  String(const String& s, unsigned int n) : String() { assign(s, n); }
  String(const char* s) : String() { assign(s); }
  /// The first `n` bytes, up to the NUL.
  String(const char* s, unsigned int n) : String() { assign(s, n); }
  /// Up to the 0 unit.
  String(const unsigned short* s) : String() { assign(s); }
  String(std::nullptr_t) noexcept : String() {}
  // NOLINTEND(google-explicit-constructor)
  virtual ~String() = default;

  String& operator=(const String& s) { return assign(s); }  // NOLINT(misc-unconventional-assign-operator): assign does
  String& operator=(String&& s) noexcept;
  String& operator=(const unsigned short* s) { return assign(s); }  // NOLINT(misc-unconventional-assign-operator)
  String& assign(const String& s);
  String& assign(const String& s, unsigned int n);  ///< at most the length of `s`
  String& assign(const unsigned short* s);
  String& assign(const unsigned short* s, unsigned int n);  ///< exactly `n` units, zeros among them too
  String& assign(const char* s);
  String& assign(const char* s, unsigned int n);
  void clear() noexcept { units_ = Units(Units::SharedZero()); }

  [[nodiscard]] unsigned int length() const { return units_.getSize() - 1; }
  [[nodiscard]] unsigned int size() const { return length(); }
  /// The units, a 0 behind them. Valid until the text changes.
  [[nodiscard]] const unsigned short* getData() const { return units_.getData(); }

  /// The text in the narrow code page, CUT before the first character that does not fit when every unit has one byte.
  /// For trace lines and names only: use toNarrow() for whatever must arrive whole.
  [[nodiscard]] CharStar c_str() const;
  /// The whole text in the narrow code page. A unit that has no place in it is a byte of the same value, or "?".
  [[nodiscard]] std::string toNarrow() const;

  /// Valid for i <= length(); the unit at length() is 0.
  unsigned short operator[](unsigned int i) const {
    if (i > length()) [[unlikely]]
      throwIndexOutOfBounds(__LINE__);
    return getData()[i];
  }

  String& append(unsigned short c) {
    units_.grow(1);
    unsigned short* end = units_.data_ + length();
    end[-1] = c;
    end[0] = 0;
    return *this;
  }
  String& append(const String& s) { return appendUnits(s.getData(), s.length()); }
  String& append(const String& s, unsigned int n);  ///< valid for n <= s.length()

  /// Erases from `pos` to the end. There must be something to erase: erase(length()) throws.
  String& erase(unsigned int pos) { return erase(pos, pos < length() ? length() - pos : 1); }
  /// Valid when n >= 1 and pos + n <= length(): erasing nothing throws, on purpose.
  String& erase(unsigned int pos, unsigned int n);
  /// Removes white space of the locale at both ends.
  String& trim();
  String& toUpper();
  String& toLower();
  /// Puts `esc` before every unit that is one of `chars`.
  String& insertEscapes(unsigned short esc, const String& chars);
  /// Removes a lone `esc`; of two in a row the second.
  String& removeEscapes(unsigned short esc);

  // Searches return a position, or NPOS.

  /// Valid for start < length(): even a search in an empty text throws.
  [[nodiscard]] unsigned int find(unsigned short c, unsigned int start) const;
  /// The char is sign-extended: bytes from 0x80 never find a Latin-1 letter.
  [[nodiscard]] unsigned int find(char c, unsigned int start) const {
    return find(static_cast<unsigned short>(static_cast<signed char>(c)), start);
  }
  /// The first `c` that no `esc` escapes; one at `start` counts whatever precedes it. Valid for start < length().
  [[nodiscard]] unsigned int find(unsigned short c, unsigned short esc, unsigned int start) const;
  /// Any `start` will do, nothing is thrown. An empty `s` is never found.
  [[nodiscard]] unsigned int find(const String& s, unsigned int start) const;
  /// The last `c`, but position 0 is never looked at: a `c` that stands only there is not found. Callers rely on it.
  [[nodiscard]] unsigned int rfind(unsigned short c) const;
  /// Valid when n >= 1 and pos + n <= length(): asking for no units throws, on purpose.
  [[nodiscard]] String substr(unsigned int pos, unsigned int n) const;
  /// The rest; valid for pos < length().
  [[nodiscard]] String substr(unsigned int pos) const;

  /// Chooses the locale (again): the process's current one, with 932 in place of 943 and 1208 (UTF-8) in place of
  /// 33722. True when there is one. A handle that is replaced so is never released. REQUIRES: no other thread converts
  /// meanwhile.
  static bool initialize();
  /// Negative, 0 or positive, in the order of the code units, each text ending at its first 0. Only the sign counts.
  [[nodiscard]] static int compare(const String& a, const String& b) { return compare(a.getData(), b.getData()); }
  [[nodiscard]] static int compare(const unsigned short* a, const unsigned short* b);
  /// `str` with each `from` replaced by `to`, from left to right, never looking at what was put in.
  [[nodiscard]] static String replace(const String& str, const String& from, const String& to);
  /// Converted to a new 0-terminated buffer, which the caller frees with releaseUnicodeString; null for null.
  [[nodiscard]] static unsigned short* createUnicodeString(const char* s);
  /// Of the first `n` bytes, up to the NUL.
  [[nodiscard]] static unsigned short* createUnicodeString(const char* s, unsigned int n);
  /// A copy in a new buffer, freed likewise; null for null.
  [[nodiscard]] static unsigned short* copyUnicodeString(const unsigned short* s);
  static void releaseUnicodeString(unsigned short* s);
  [[nodiscard]] static bool isWhiteSpace(unsigned short c);
  /// A decimal integer of 64 bits, but neither 2147483647 nor -2147483648. An empty text is one; white space and a sign
  /// may stand before the digits, nothing behind them.
  [[nodiscard]] static bool isNumber(const String& s);
  /// The low 32 bits of such a number. Else, false, traced, and `*out` is 0.
  static bool convertToInt(const String& s, int* out);

 private:
  using Units = Array<unsigned short>;

  [[noreturn]] static void throwIndexOutOfBounds(int line, const char* function = __builtin_FUNCTION());

  /// `count` units from `p`, which may be units of this text.
  String& appendUnits(const unsigned short* p, unsigned int count) {
    if (!units_.hasRoom(count)) [[unlikely]]
      return appendInLargerBlock(p, count);
    unsigned short* end = units_.data_ + length();
    std::copy_n(p, count, end);
    end[count] = 0;
    units_.size_ += count;
    return *this;
  }
  String& appendInLargerBlock(const unsigned short* p, unsigned int count);

  static void ensureLocale();
  static bool _initialized;

  /// Always ends with a 0. The empty text is a block that texts share: never write to it.
  Units units_;
};

inline String operator+(const String& a, const String& b) {
  String sum(a);
  sum.append(b);
  return sum;
}

[[nodiscard]] bool operator==(const String& a, const String& b);
inline bool operator==(const String& a, const char* b) {
  return a == String(b);
}
inline bool operator==(const char* a, const String& b) {
  return String(a) == b;
}
inline bool operator!=(const String& a, const String& b) {
  return !(a == b);
}
inline bool operator!=(const String& a, const char* b) {
  return !(a == b);
}
inline bool operator!=(const char* a, const String& b) {
  return !(a == b);
}

/// ASCII as it is, everything else as \xHHHH. For diagnostic output.
std::ostream& operator<<(std::ostream& out, const String& s);

}  // namespace VMQ

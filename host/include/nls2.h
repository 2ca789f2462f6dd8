#pragma once
// Code-page conversion of the host agent. Locale handles may be shared by threads once they exist.

#include <cstdint>

extern "C" {

struct NLS2_Locale;

/// Code pages with an id of their own; an unknown code set of the C library has the id 0 and is converted by iconv.
enum NLS2_CodePage : int32_t {
  NLS2_CP_ASCII = 367,
  NLS2_CP932 = 932,
  NLS2_CP943 = 943,
  NLS2_CP_LATIN1 = 819,
  NLS2_CP_UTF8 = 1208,
  NLS2_CP_EUCJP = 33722,
};

/// Selects the process's current locale as setlocale(LC_CTYPE) has set it; `codePage` is not looked at.
inline constexpr uint32_t NLS2_CURRENT_LOCALE = 0;
/// Selects the code page given by number.
inline constexpr uint32_t NLS2_BY_CODEPAGE = 0x0188000B;

/// A new handle, or null when the code page is not known here. The caller frees it with NLS2_ReleaseLocale.
struct NLS2_Locale* NLS2_GetLocale(uint32_t selector, int32_t codePage);
void NLS2_ReleaseLocale(struct NLS2_Locale* locale);
int32_t NLS2_GetLocaleCodepageId(const struct NLS2_Locale* locale);

/// Converts `byteCount` bytes to at most `unitCapacity` UTF-16 code units (a NUL among the bytes is converted like any
/// character). A byte that the code page cannot decode becomes the one unit of the same value. Returns the number of
/// units stored; `*status` is 0, or ENOBUFS when the output was cut before the first character that did not fit.
/// A null locale converts as Latin-1.
uint32_t NLS2_toUTF16(struct NLS2_Locale* locale, const char* bytes, uint32_t byteCount, unsigned short* units,
                      uint32_t unitCapacity, int32_t* status);

/// Converts `unitCount` UTF-16 code units (a 0 unit at their end is taken for the terminator) to at most `byteCapacity`
/// bytes. A unit that the code page cannot encode becomes the byte of the same value when it is below 0x100, else "?".
/// When the output does not fit it is cut before the first character that does not, and always ends with a NUL (when
/// `byteCapacity` is not 0). Returns the number of bytes stored, the NUL included; `*status` is 0 or ENOBUFS. A null
/// locale converts as Latin-1.
uint32_t NLS2_fromUTF16(struct NLS2_Locale* locale, const unsigned short* units, uint32_t unitCount, char* bytes,
                        uint32_t byteCapacity, int32_t* status);

/// The most bytes that one code unit can become in this locale.
uint32_t NLS2_MaximumBytesPerUnit(const struct NLS2_Locale* locale);

}  // extern "C"

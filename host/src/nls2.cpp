// Locale handles and the choice of their code page.

#include "nls2.h"

#include <langinfo.h>

#include <algorithm>
#include <cerrno>
#include <cstdlib>
#include <memory>
#include <new>
#include <string_view>

#include "nls2_converter.h"
#include "seam.h"

struct NLS2_Locale {
  int32_t codePage;
  std::unique_ptr<vmqhost::Converter> converter;
};

namespace {

using vmqhost::Converted;
using vmqhost::Converter;

struct CodePage {
  int32_t id;
  uint32_t maximumBytesPerUnit;
  const char* name;  // as iconv knows it; null: converted here
};

/// 943 goes by the table of 932, which has all its characters: the C library's own table for 943 exchanges some control
/// characters, which no text here means.
constexpr CodePage kCodePages[] = {
    {NLS2_CP_ASCII, 1, nullptr}, {NLS2_CP_LATIN1, 1, nullptr}, {NLS2_CP_UTF8, 3, nullptr},
    {NLS2_CP932, 2, "CP932"},    {NLS2_CP943, 2, "CP932"},     {NLS2_CP_EUCJP, 3, "EUC-JP"},
};

/// What nl_langinfo calls them.
constexpr struct {
  std::string_view name;
  int32_t id;
} kCodeSets[] = {
    {"ANSI_X3.4-1968", NLS2_CP_ASCII},
    {"US-ASCII", NLS2_CP_ASCII},
    {"ISO-8859-1", NLS2_CP_LATIN1},
    {"UTF-8", NLS2_CP_UTF8},
    {"SHIFT_JIS", NLS2_CP932},
    {"WINDOWS-31J", NLS2_CP932},
    {"CP932", NLS2_CP932},
    {"IBM-943", NLS2_CP943},
    {"IBM943", NLS2_CP943},
    {"EUC-JP", NLS2_CP_EUCJP},
};

std::unique_ptr<Converter> newConverter(const CodePage& page) {
  if (page.name != nullptr) return vmqhost::newIconvConverter(page.name, page.maximumBytesPerUnit);
  return page.id == NLS2_CP_UTF8 ? vmqhost::newUtf8Converter() : vmqhost::newLatin1Converter();
}

NLS2_Locale* newLocale(int32_t id, std::unique_ptr<Converter> converter) {
  return converter ? new NLS2_Locale{id, std::move(converter)} : nullptr;
}

NLS2_Locale* localeByCodePage(int32_t id) {
  for (const CodePage& page : kCodePages) {
    if (page.id == id) return newLocale(id, newConverter(page));
  }
  return nullptr;
}

NLS2_Locale* currentLocale() {
  const char* const name = nl_langinfo(CODESET);
  for (const auto& known : kCodeSets) {
    if (known.name == name) return localeByCodePage(known.id);
  }
  return newLocale(0, vmqhost::newIconvConverter(name, static_cast<uint32_t>(std::max<size_t>(MB_CUR_MAX, 1))));
}

/// Made when the library is loaded, so that no conversion can fail for want of memory.
// NOLINTNEXTLINE(cert-err58-cpp): without that little memory the program had better not start
const Converter& latin1 = *vmqhost::newLatin1Converter().release();

const Converter& converterOf(const NLS2_Locale* locale) {
  return locale == nullptr ? latin1 : *locale->converter;
}

uint32_t report(Converted result, int32_t* status) {
  if (status != nullptr) *status = result.cut ? ENOBUFS : 0;
  return static_cast<uint32_t>(result.stored);
}

}  // namespace

NLS2_Locale* NLS2_GetLocale(uint32_t selector, int32_t codePage) try {
  if (int status; vmqhost::seam::fails("NLS2_GetLocale", &status)) return nullptr;
  if (selector == NLS2_CURRENT_LOCALE) return currentLocale();
  return selector == NLS2_BY_CODEPAGE ? localeByCodePage(codePage) : nullptr;
} catch (const std::bad_alloc&) {
  return nullptr;
}

void NLS2_ReleaseLocale(NLS2_Locale* locale) {
  delete locale;
}

int32_t NLS2_GetLocaleCodepageId(const NLS2_Locale* locale) {
  return locale == nullptr ? 0 : locale->codePage;
}

uint32_t NLS2_toUTF16(NLS2_Locale* locale, const char* bytes, uint32_t byteCount, unsigned short* units,
                      uint32_t unitCapacity, int32_t* status) {
  const auto* const in = reinterpret_cast<const unsigned char*>(bytes);
  return report(converterOf(locale).toUnits(in, byteCount, units, unitCapacity), status);
}

uint32_t NLS2_fromUTF16(NLS2_Locale* locale, const unsigned short* units, uint32_t unitCount, char* bytes,
                        uint32_t byteCapacity, int32_t* status) {
  if (byteCapacity == 0) return report({0, true}, status);
  // A terminator among the units is the output's own.
  if (unitCount > 0 && units[unitCount - 1] == 0) --unitCount;
  Converted result =
      converterOf(locale).fromUnits(units, unitCount, reinterpret_cast<unsigned char*>(bytes), byteCapacity - 1);
  bytes[result.stored++] = '\0';
  return report(result, status);
}

uint32_t NLS2_MaximumBytesPerUnit(const NLS2_Locale* locale) {
  return converterOf(locale).maximumBytesPerUnit();
}

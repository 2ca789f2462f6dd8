#include "tasks/product_arch.h"

#include <algorithm>

#include "tasks/inventory_listing.h"
#include "util/corvel_home.h"
#include "util/string_tokenizer.h"
#include "util/trace.h"
#include "util/util.h"

using VMQ::String;
using VMQ::Trace;
using VMQ::Util;

namespace {

RAS1_Unit traceUnit{"tasks/product_arch"};

constexpr const char* ARCHITECTURES_WITHOUT_AX[] = {"aix433", "hp102", "sol273", "sol276", "sol278", "sol288"};
constexpr char PLATFORM_MARKER[] = "Platform codes:";

/// What the inventory tool prints; false when it cannot be started or exits non-zero.
bool askInventoryTool(const Trace& trace, const String& command, String& listing) {
  int exitCode = 0;
  String err;
  if (Util::runCommand(command, exitCode, listing, err, "", /*nonBlocking=*/false) && exitCode == 0) return true;
  TRACE_ERROR(trace, "Bad return code from Util::runCommand");
  return false;
}

bool hasLibrariesFor(const String& productCode, const String& platform) {
  return productCode != "ax" || std::none_of(std::begin(ARCHITECTURES_WITHOUT_AX), std::end(ARCHITECTURES_WITHOUT_AX),
                                             [&](const char* skipped) { return platform == skipped; });
}

bool matchesHint(const String& platform, const String& hint) {
  const unsigned length = hint.length();
  return length >= 2 && platform.length() == length && platform[length - 1] == hint[length - 1] &&
         platform[length - 2] == hint[length - 2];
}

String architectureDirectory(const String& arch, const String& leaf) {
  return String(VMQ_CORVELHOME) + "/" + "zlpqor6" + "/" + arch + "/" + leaf;
}

/// The architecture in a line "<arch> Product (<code>)"; empty when the line is another.
String platformOfProduct(const String& line, const String& productCode) {
  StringTokenizer tokens(line, "\n :");
  if (tokens.countTokens() != 3) return String();
  const String arch = tokens.nextToken();
  if (tokens.nextToken() != "Product") return String();
  return tokens.nextToken() == String("(") + productCode + ")" ? arch : String();
}

}  // namespace

bool isProductInStandardInventory(const String& productCode) {
  const Trace trace(traceUnit);
  TRACE_DETAIL(trace, "Looking for product code %s", productCode.c_str().get());
  const String command = inventoryCommand("-d ");
  String listing;
  if (!askInventoryTool(trace, command, listing)) return false;
  bool found = false;
  forEachInventoryRecord(listing, InventoryFields::kExactlyFive, [&](const InventoryRecord& record) {
    found = record.product_code == productCode;
    return !found;
  });
  if (found) {
    TRACE_DETAIL(trace, "product code [%s] found with [%s]", productCode.c_str().get(), command.c_str().get());
  } else {
    TRACE_DETAIL(trace, "product code [%s] is not found with [%s]", productCode.c_str().get(), command.c_str().get());
  }
  return found;
}

String getSharedLibArch(const String& productCode, const String& hint) {
  const Trace trace(traceUnit);
  TRACE_DETAIL(trace, "Looking for product code %s", productCode.c_str().get());
  String arch;
  String listing;
  if (!askInventoryTool(trace, inventoryCommand("-d "), listing)) return arch;
  forEachInventoryRecord(listing, InventoryFields::kExactlyFive, [&](const InventoryRecord& record) {
    if (record.product_code != productCode || !hasLibrariesFor(productCode, record.platform)) return true;
    arch = record.platform;
    return hint.length() != 0 && !matchesHint(arch, hint);
  });
  TRACE_DETAIL(trace, "Architecture for product code [%s] is [%s]", productCode.c_str().get(), arch.c_str().get());
  return arch;
}

String getProductArch(const String& productCode) {
  const Trace trace(traceUnit);
  TRACE_DETAIL(trace, "Looking for product code %s", productCode.c_str().get());
  String arch;
  String listing;
  if (!askInventoryTool(trace, inventoryCommand("-p ") + productCode, listing)) return arch;
  const unsigned marker = listing.find(String(PLATFORM_MARKER), 0);
  if (marker == String::NPOS) {
    TRACE_ERROR(trace, "Product header string %s, not found", PLATFORM_MARKER);
    return arch;
  }
  TRACE_DETAIL(trace, "Index of inventory header is %d", static_cast<int>(marker));
  const unsigned newline = listing.find(static_cast<unsigned short>('\n'), marker);
  if (newline == String::NPOS) {
    TRACE_ERROR(trace, "No newline character '%c' found after Product header", '\n');
    return arch;
  }
  TRACE_DETAIL(trace, "Index of newline after product header is : %d", static_cast<int>(newline));
  StringTokenizer lines(listing.substr(newline), "\n");
  while (arch.length() == 0 && lines.hasMoreTokens()) {
    const String line = lines.nextToken();
    TRACE_DETAIL(trace, "Found product line: %s", line.c_str().get());
    arch = platformOfProduct(line, productCode);
  }
  TRACE_DETAIL(trace, "Architecture for product code [%s] is [%s]", productCode.c_str().get(), arch.c_str().get());
  return arch;
}

String getProductArchDir(const String& arch, const String& productCode) {
  const Trace trace(traceUnit);
  String directory;
  if (arch.length() != 0 && productCode.length() != 0)
    directory = architectureDirectory(arch, productCode == "ax" ? String("bin") : productCode);
  TRACE_DETAIL(trace, "Architecture directory for architecture [%s] product code [%s] is [%s]", arch.c_str().get(),
               productCode.c_str().get(), directory.c_str().get());
  return directory;
}

String getSharedLibArchDir() {
  const Trace trace(traceUnit);
  const String arch = getSharedLibArch("ax", getSharedLibArch("ux", ""));
  String directory = arch.length() == 0 ? String() : architectureDirectory(arch, "bin");
  TRACE_DETAIL(trace, "Architecture directory for Shared Lib [%s] is is [%s]", arch.c_str().get(),
               directory.c_str().get());
  return directory;
}

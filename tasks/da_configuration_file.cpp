#include "tasks/da_configuration_file.h"

#include <sys/stat.h>

#include <cstring>

#include "tasks/file_helpers.h"
#include "util/corvel_home.h"
#include "util/string_tokenizer.h"
#include "util/trace.h"
#include "util/util.h"

using VMQ::String;
using VMQ::Trace;
using VMQ::Util;

namespace {

RAS1_Unit traceUnit{"tasks/da_configuration_file"};

constexpr unsigned short LINE_FEED = '\n';

/// The contents with every line that holds the key replaced, each line ended by a line feed.
String withReplacedLine(const String& contents, const String& key, const String& parameters) {
  String result;
  unsigned start = 0;
  while (start < contents.length()) {
    unsigned end = contents.find(LINE_FEED, start);
    if (end == String::NPOS) end = contents.length();
    const String line = end == start ? String() : contents.substr(start, end - start);
    result.append(line.find(key, 0) == String::NPOS ? line : key + parameters + "|");
    result.append(LINE_FEED);
    start = end + 1;
  }
  return result;
}

/// The new file gets the old one's mode, which a plain copy would lose.
void keepMode(const Trace& trace, const String& copy, const mode_t mode) {
  if (chmod(copy.toNarrow().c_str(), mode) != 0)
    TRACE_ERROR(trace, "Failed to set permissions on file [%s] to [%d]", copy.c_str().get(), static_cast<int>(mode));
}

}  // namespace

String getDaConfigFileName(const String& instance) {
  const Trace trace(traceUnit);
  String file = String(VMQ_CORVELHOME) + "/" + "config" + "/" + "um";
  if (instance.length() != 0) file.append(String("_") + instance);
  file.append(String(".config"));
  TRACE_DETAIL(trace, "DA Configuration file is \"%s\", instance (optional) is \"%s\"", file.c_str().get(),
               instance.c_str().get());
  return file;
}

void populateHashMapFromFile(const String& file, char commentCharacter, VMQ::StrStrMap& map) {
  const Trace trace(traceUnit);
  StringTokenizer lines(::readFile(file), "\n");
  while (lines.hasMoreTokens()) {
    String line = lines.nextToken();
    line.trim();
    if (line.length() == 0 || line[0] == static_cast<unsigned char>(commentCharacter)) continue;
    const unsigned equals = line.find(static_cast<unsigned short>('='), 0);
    if (equals == String::NPOS || equals == 0 || equals + 1 == line.length()) continue;
    map.put(line.substr(0, equals), line.substr(equals + 1));
  }
}

bool changeDaStartupParms(const String& parameters, const String& file, const String& instance) {
  const Trace trace(traceUnit);
  TRACE_DETAIL(trace, "Writing startup parms [%s] to config file [%s] instance [%s]", parameters.c_str().get(),
               file.c_str().get(), instance.c_str().get());
  const String contents = ::readFile(file);
  if (contents.length() == 0) {
    TRACE_ERROR(trace, "Contents of config file [%s] was empty", file.c_str().get());
    return false;
  }
  struct stat status = {};
  const bool modeKnown = stat(file.toNarrow().c_str(), &status) == 0;

  const String copy = file + ".copy";
  const String key = instance + "|" + "DATAPROVIDER" + "|";
  if (!::writeFile(copy, withReplacedLine(contents, key, parameters))) {
    TRACE_ERROR(trace, "Failed to write to file %s", file.c_str().get());
    return false;
  }
  if (!::deleteFile(file)) return false;
  String directory;
  if (!::getDirectoryFromPath(file, directory)) return false;
  if (Util::copyFile(copy, directory, ::getFilenameFromPath(file)) != 0) return false;
  if (modeKnown) keepMode(trace, file, status.st_mode & 07777);
  (void)::deleteFile(copy);  // traced there; the new contents are in place
  return true;
}

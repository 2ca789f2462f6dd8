#include "util/log_pruning.h"

#include <cstring>
#include <string>
#include <utility>

#include "fsi1.h"
#include "util/trace.h"
#include "util/util.h"

namespace VMQ {
namespace {

RAS1_Unit traceUnit{"util/log_pruning"};

// The files of one listing whose names begin with a prefix: how many, and which changed longest ago.
struct Matches {
  int count = 0;
  std::string oldest;  // a path; empty while there is none
  std::pair<int64_t, int32_t> oldest_time;

  void add(const FSI1_Entry& entry) {
    const std::pair<int64_t, int32_t> time(entry.modified_seconds, entry.modified_nanoseconds);
    if (count == 0 || time < oldest_time) {
      oldest = entry.path;
      oldest_time = time;
    }
    ++count;
  }
};

// Returns the code that ended the listing.
int findMatches(FSI1_List* list, const char* prefix, Matches& matches) {
  const Trace trace(traceUnit);
  const size_t prefix_length = std::strlen(prefix);
  FSI1_Entry entry{};
  int rc;
  while ((rc = FSI1_FetchList(list, &entry)) == 0) {
    if (entry.kind != FSI1_PLAIN_FILE) continue;
    const char* const name = getFileName(entry.path);
    if (name != nullptr && std::strncmp(name, prefix, prefix_length) == 0) matches.add(entry);
  }
  return rc;
}

}  // namespace

const char* getFileName(const char* path) {
  const Trace trace(traceUnit);
  const char* name = path;
  for (const char* c = path; *c != '\0'; ++c) {
    if (*c == '/' || *c == '\\') name = c + 1;
  }
  return *name == '\0' && name != path ? nullptr : name;
}

void pruneLogs(const char* directory, const char* prefix, int keep) {
  const Trace trace(traceUnit);
  FSI1_List* list = nullptr;
  if (const int rc = FSI1_NewList(directory, &list); rc != 0) {
    TRACE_ERROR(trace, "FSI1_NewList error %d\n", rc);
    return;
  }
  Matches matches;
  const int fetched = findMatches(list, prefix, matches);
  if (matches.count > 0 && matches.count >= keep) {
    TRACE_DETAIL(trace, "deleting file: %s\n", matches.oldest.c_str());
    (void)Util::deleteFile(String(matches.oldest.c_str()));  // has traced its failure; the log is created in any case
  }
  if (fetched != FSI1_END_OF_LIST) TRACE_ERROR(trace, "FSI1_FetchList error %d\n", fetched);
  if (const int rc = FSI1_DeleteList(list); rc != 0) TRACE_ERROR(trace, "FSI1_DeleteList error %d\n", rc);
}

}  // namespace VMQ

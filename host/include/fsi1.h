#pragma once
// File lists of the host agent. A list belongs to one thread at a time.

#include <cstdint>

extern "C" {

struct FSI1_List;

enum FSI1_Kind : uint32_t { FSI1_PLAIN_FILE, FSI1_DIRECTORY, FSI1_OTHER };

/// One directory entry.
struct FSI1_Entry {
  const char* path;          ///< directory as given, "/", name; valid until the next call on the list
  FSI1_Kind kind;            ///< symbolic links are FSI1_OTHER
  int64_t modified_seconds;  ///< time of the last change of the contents, since 1970
  int32_t modified_nanoseconds;
};

/// What the calls below return beside 0 and FSI1_END_OF_LIST: FSI1_SYSTEM_ERROR + errno.
enum : int { FSI1_END_OF_LIST = 9, FSI1_SYSTEM_ERROR = 1000 };

/// Opens a listing of `directory` into `*list`; the caller closes it with FSI1_DeleteList.
int FSI1_NewList(const char* directory, struct FSI1_List** list);

/// The next entry ("." and ".." left out, entries that vanish meanwhile too), or FSI1_END_OF_LIST.
int FSI1_FetchList(struct FSI1_List* list, struct FSI1_Entry* entry);

int FSI1_DeleteList(struct FSI1_List* list);

}  // extern "C"

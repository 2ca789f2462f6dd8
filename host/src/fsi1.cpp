// File lists over readdir.

#include "fsi1.h"

#include <dirent.h>
#include <fcntl.h>
#include <sys/stat.h>

#include <cerrno>
#include <cstring>
#include <new>
#include <string>

#include "seam.h"

struct FSI1_List {
  DIR* stream;
  std::string directory;
  std::string path;  // of the entry handed out last
};

namespace {

int systemError(int error) {
  return FSI1_SYSTEM_ERROR + error;
}

FSI1_Kind kindOf(mode_t mode) {
  if (S_ISREG(mode)) return FSI1_PLAIN_FILE;
  return S_ISDIR(mode) ? FSI1_DIRECTORY : FSI1_OTHER;
}

bool isDirectoryItself(const char* name) {
  return std::strcmp(name, ".") == 0 || std::strcmp(name, "..") == 0;
}

}  // namespace

int FSI1_NewList(const char* directory, FSI1_List** list) try {
  if (int status; vmqhost::seam::fails("FSI1_NewList", &status)) return status;
  if (directory == nullptr || list == nullptr) return systemError(EINVAL);
  auto* const opened = new FSI1_List{nullptr, directory, {}};
  opened->stream = opendir(directory);
  if (opened->stream == nullptr) {
    const int error = errno;
    delete opened;
    return systemError(error);
  }
  *list = opened;
  return 0;
} catch (const std::bad_alloc&) {
  return systemError(ENOMEM);
}

int FSI1_FetchList(FSI1_List* list, FSI1_Entry* entry) try {
  if (int status; vmqhost::seam::fails("FSI1_FetchList", &status)) return status;
  if (list == nullptr || entry == nullptr) return systemError(EINVAL);
  while (true) {
    errno = 0;
    // cppcheck-suppress readdirCalled ; a list belongs to one thread, and so does its stream
    const dirent* const found = readdir(list->stream);
    if (found == nullptr) return errno == 0 ? FSI1_END_OF_LIST : systemError(errno);
    if (isDirectoryItself(found->d_name)) continue;
    struct stat attributes {};
    if (fstatat(dirfd(list->stream), found->d_name, &attributes, AT_SYMLINK_NOFOLLOW) != 0) {
      if (errno == ENOENT) continue;  // gone meanwhile
      return systemError(errno);
    }
    list->path = list->directory + "/" + found->d_name;
    entry->path = list->path.c_str();
    entry->kind = kindOf(attributes.st_mode);
    entry->modified_seconds = attributes.st_mtim.tv_sec;
    entry->modified_nanoseconds = static_cast<int32_t>(attributes.st_mtim.tv_nsec);
    return 0;
  }
} catch (const std::bad_alloc&) {
  return systemError(ENOMEM);
}

int FSI1_DeleteList(FSI1_List* list) {
  if (list == nullptr) return systemError(EINVAL);
  const int result = closedir(list->stream) == 0 ? 0 : systemError(errno);
  delete list;
  if (int status; vmqhost::seam::fails("FSI1_DeleteList", &status)) return status;
  return result;
}

// Looks through folders and settles what is sent.

#include "apps/vmqctl/push/push_plan.h"

#include <sys/stat.h>
#include <unistd.h>

#include <algorithm>
#include <cerrno>
#include <cstring>
#include <filesystem>
#include <map>

#include "apps/vmqctl/failure.h"
#include "apps/vmqctl/push/packet.h"

namespace vmqctl {
namespace {

namespace fs = std::filesystem;

constexpr std::size_t maximumDestinationCharacters = 1024;

[[noreturn]] void refuse(const std::string& sentence, const std::string& next = "") {
  throw Failure(ExitCode::Usage, sentence + " Nothing was sent.", next);
}

[[noreturn]] void refuseUnreadable(const std::string& source, int error) {
  refuse("Cannot read " + source + ": " + std::strerror(error) + ".");
}

std::string joined(const std::string& folder, const std::string& name) {
  return folder.empty() ? name : folder + "/" + name;
}

struct stat look(const std::string& source) {
  struct stat found = {};
  if (stat(source.c_str(), &found) != 0) refuseUnreadable(source, errno);
  return found;
}

bool isLink(const std::string& path) {
  struct stat found = {};
  return lstat(path.c_str(), &found) == 0 && S_ISLNK(found.st_mode);
}

/// The names in a folder, by their bytes.
std::vector<std::string> namesIn(const std::string& source) {
  std::error_code error;
  std::vector<std::string> names;
  fs::directory_iterator entry(source, error);
  for (; !error && entry != fs::directory_iterator(); entry.increment(error)) {
    names.push_back(entry->path().filename().string());
  }
  if (error) refuseUnreadable(source, error.value());
  std::sort(names.begin(), names.end());
  return names;
}

/// The last name of a path, also of "." and of "folder/".
std::string ownName(const std::string& source) {
  std::error_code error;
  fs::path path = fs::absolute(source, error).lexically_normal();
  if (error) refuseUnreadable(source, error.value());
  if (!path.has_filename()) path = path.parent_path();
  std::string name = path.filename().string();
  if (name.empty()) refuse(source + " has no name of its own.", "Name what is in it.");
  return name;
}

/// Characters of UTF-8 as the machine counts them, in units of 16 bits. A byte that is not UTF-8 counts as one or none.
std::size_t characters(std::string_view text) {
  std::size_t count = 0;
  for (const char c : text) {
    const auto byte = static_cast<unsigned char>(c);
    if ((byte & 0xC0U) != 0x80) count += byte >= 0xF0 ? 2 : 1;
  }
  return count;
}

void checkName(const std::string& source, const std::string& name) {
  if (name.find('\\') != std::string::npos) {
    refuse("The name of " + source + " holds a backslash, which the machine would take for a \"/\".");
  }
  if (name.size() > Packet::maximumNameBytes) {
    refuse("The name " + name + " has " + std::to_string(name.size()) + " bytes; at most " +
           std::to_string(Packet::maximumNameBytes) + " can be sent.");
  }
}

}  // namespace

std::string cleanFolder(std::string_view folder) {
  std::string clean;
  while (!folder.empty()) {
    const std::string component(folder.substr(0, folder.find('/')));
    folder.remove_prefix(std::min(folder.size(), component.size() + 1));
    if (component == "..") refuse("A folder of the depot may not hold \"..\".");
    if (!component.empty() && component != ".") clean = joined(clean, component);
  }
  return clean;
}

std::uint64_t chunksOf(std::uint64_t bytes, std::size_t chunkBytes) {
  return bytes == 0 ? 1 : bytes / chunkBytes + (bytes % chunkBytes == 0 ? 0 : 1);
}

void PushPlan::add(const std::string& source, const std::string& folder) {
  const std::string name = joined(folder, ownName(source));
  const struct stat found = look(source);
  if (S_ISDIR(found.st_mode)) {
    addFolder(source, name);
  } else if (S_ISREG(found.st_mode)) {
    addFile(source, name, static_cast<std::uint64_t>(found.st_size));
  } else {
    refuse(source + " is neither a file nor a folder.");
  }
}

void PushPlan::addContents(const std::string& directory, const std::string& folder) {
  if (!S_ISDIR(look(directory).st_mode)) refuse(directory + " is no folder.");
  addFolder(directory, folder);
}

void PushPlan::addFile(const std::string& source, const std::string& name, std::uint64_t bytes) {
  checkName(source, name);
  if (access(source.c_str(), R_OK) != 0) refuseUnreadable(source, errno);
  files_.push_back({source, name, bytes});
  bytes_ += bytes;
}

void PushPlan::addFolder(const std::string& source, const std::string& folder) {
  const std::vector<std::string> entries = namesIn(source);
  if (entries.empty()) emptyFolders_.push_back(source);
  for (const std::string& entry : entries) {
    std::string path = source;
    if (path.back() != '/') path += '/';
    path += entry;
    const bool link = isLink(path);
    struct stat found = {};
    if (stat(path.c_str(), &found) != 0) {
      if (link) refuse(path + " is a link that leads nowhere: " + std::strerror(errno) + ".");
      refuseUnreadable(path, errno);
    }
    if (S_ISREG(found.st_mode)) {
      addFile(path, joined(folder, entry), static_cast<std::uint64_t>(found.st_size));
    } else if (S_ISDIR(found.st_mode) && !link) {
      addFolder(path, joined(folder, entry));
    } else if (S_ISDIR(found.st_mode)) {
      // It may lead back to where it is.
      refuse(path + " is a link to a folder.", "Put the folder itself in its place.");
    } else {
      refuse(path + " is neither a file nor a folder.");
    }
  }
}

void PushPlan::check() const {
  if (files_.empty()) refuse("There is no file to send.");
  std::map<std::string_view, const PlannedFile*> byName;
  for (const PlannedFile& file : files_) {
    const auto [other, isNew] = byName.emplace(file.name, &file);
    if (!isNew) refuse(other->second->source + " and " + file.source + " would both become " + file.name + ".");
  }
  for (const PlannedFile& file : files_) {
    const std::string_view name = file.name;
    for (std::size_t end = name.find('/'); end != std::string_view::npos; end = name.find('/', end + 1)) {
      const auto other = byName.find(name.substr(0, end));
      if (other == byName.end()) continue;
      refuse(other->second->source + " would become the file " + other->second->name + ", and " + file.source +
             " would be in a folder of that name.");
    }
  }
}

void PushPlan::checkFits(const std::string& depot, std::size_t chunkBytes) const {
  for (const PlannedFile& file : files_) {
    const std::string destination = depot + file.name;
    if (characters(destination) > maximumDestinationCharacters) {
      refuse("The path " + destination + " has " + std::to_string(characters(destination)) + " characters; at most " +
             std::to_string(maximumDestinationCharacters) + " are possible.");
    }
    if (chunksOf(file.bytes, chunkBytes) > INT32_MAX) {
      refuse(file.source + " has more than " + std::to_string(INT32_MAX) + " pieces of " + std::to_string(chunkBytes) +
                 " bytes, which cannot be numbered.",
             "Raise maximum_packet_bytes in the daemon's configuration.");
    }
  }
}

}  // namespace vmqctl

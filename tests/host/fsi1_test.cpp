// File lists of real directories.

#include "fsi1.h"

#include <fcntl.h>
#include <gmock/gmock.h>
#include <gtest/gtest.h>
#include <sys/stat.h>
#include <unistd.h>

#include <cerrno>
#include <filesystem>
#include <map>
#include <string>

#include "tests/support/process_resources.h"
#include "tests/support/temporary_directory.h"

namespace {

using testing::ElementsAre;
using testing::Pair;
using testing::UnorderedElementsAre;

struct Found {
  FSI1_Kind kind;
  int64_t seconds;
  int32_t nanoseconds;
};

/// Lists a directory to its end, by path.
std::map<std::string, Found> listAll(const std::string& directory) {
  FSI1_List* list = nullptr;
  EXPECT_EQ(FSI1_NewList(directory.c_str(), &list), 0);
  std::map<std::string, Found> found;
  FSI1_Entry entry{};
  int status;
  while ((status = FSI1_FetchList(list, &entry)) == 0) {
    found[entry.path] = {entry.kind, entry.modified_seconds, entry.modified_nanoseconds};
  }
  EXPECT_EQ(status, FSI1_END_OF_LIST);
  EXPECT_EQ(FSI1_FetchList(list, &entry), FSI1_END_OF_LIST);
  EXPECT_EQ(FSI1_DeleteList(list), 0);
  return found;
}

MATCHER_P(IsKind, kind, "") {
  return arg.kind == kind;
}

TEST(FileList, EndsWithCodeNine) {
  EXPECT_EQ(FSI1_END_OF_LIST, 9);
  const TemporaryDirectory folder;
  EXPECT_TRUE(listAll(folder.path().string()).empty());
}

TEST(FileList, GivesEachEntryByPathAndKind) {
  const TemporaryDirectory folder;
  folder.writeFile("plain", "");
  folder.writeFile(".hidden", "");
  folder.writeFile("below/deeper", "");
  ASSERT_EQ(symlink("plain", (folder / "link").c_str()), 0);
  ASSERT_EQ(symlink("nowhere", (folder / "dangling").c_str()), 0);
  ASSERT_EQ(mkfifo((folder / "pipe").c_str(), 0600), 0);
  EXPECT_THAT(listAll(folder.path().string()),
              UnorderedElementsAre(
                  Pair(folder / "plain", IsKind(FSI1_PLAIN_FILE)), Pair(folder / ".hidden", IsKind(FSI1_PLAIN_FILE)),
                  Pair(folder / "below", IsKind(FSI1_DIRECTORY)), Pair(folder / "link", IsKind(FSI1_OTHER)),
                  Pair(folder / "dangling", IsKind(FSI1_OTHER)), Pair(folder / "pipe", IsKind(FSI1_OTHER))));
}

TEST(FileList, PutsASlashBetweenTheDirectoryAsGivenAndTheName) {
  const TemporaryDirectory folder;
  folder.writeFile("x", "");
  EXPECT_THAT(listAll(folder.path().string() + "/."), ElementsAre(Pair(folder.path().string() + "/./x", testing::_)));
}

TEST(FileList, TellsTheTimeOfTheLastChange) {
  const TemporaryDirectory folder;
  const std::string path = folder.writeFile("old", "");
  const timespec times[2] = {{1, 2}, {987654321, 123456789}};
  ASSERT_EQ(utimensat(AT_FDCWD, path.c_str(), times, 0), 0);
  const Found found = listAll(folder.path().string()).at(path);
  EXPECT_EQ(found.seconds, 987654321);
  EXPECT_EQ(found.nanoseconds, 123456789);
}

TEST(FileList, OfADirectoryThatIsNotThereIsAnError) {
  FSI1_List* list = nullptr;
  EXPECT_EQ(FSI1_NewList("/nowhere/at/all", &list), FSI1_SYSTEM_ERROR + ENOENT);
  const TemporaryDirectory folder;
  EXPECT_EQ(FSI1_NewList(folder.writeFile("file", "").c_str(), &list), FSI1_SYSTEM_ERROR + ENOTDIR);
  EXPECT_EQ(list, nullptr);
}

TEST(FileList, RefusesNull) {
  FSI1_List* list = nullptr;
  FSI1_Entry entry{};
  EXPECT_EQ(FSI1_NewList(nullptr, &list), FSI1_SYSTEM_ERROR + EINVAL);
  EXPECT_EQ(FSI1_NewList("/", nullptr), FSI1_SYSTEM_ERROR + EINVAL);
  EXPECT_EQ(FSI1_FetchList(nullptr, &entry), FSI1_SYSTEM_ERROR + EINVAL);
  EXPECT_EQ(FSI1_DeleteList(nullptr), FSI1_SYSTEM_ERROR + EINVAL);
}

TEST(FileList, LeavesOutEntriesThatVanishMeanwhile) {
  const TemporaryDirectory folder;
  for (int i = 0; i < 20; ++i) folder.writeFile("file" + std::to_string(i), "");
  FSI1_List* list = nullptr;
  ASSERT_EQ(FSI1_NewList(folder.path().c_str(), &list), 0);
  FSI1_Entry entry{};
  ASSERT_EQ(FSI1_FetchList(list, &entry), 0);  // the system has handed out all names by now
  for (int i = 0; i < 20; ++i) std::filesystem::remove(folder / ("file" + std::to_string(i)));
  EXPECT_EQ(FSI1_FetchList(list, &entry), FSI1_END_OF_LIST);
  EXPECT_EQ(FSI1_DeleteList(list), 0);
}

TEST(FileList, LeavesNoDescriptorBehind) {
  const TemporaryDirectory folder;
  const ProcessResources before = ProcessResources::now();
  for (int i = 0; i < 10; ++i) {
    listAll(folder.path().string());
    FSI1_List* list = nullptr;
    (void)FSI1_NewList("/nowhere", &list);
  }
  EXPECT_EQ(ProcessResources::now(), before);
}

}  // namespace

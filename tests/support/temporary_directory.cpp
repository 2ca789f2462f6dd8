#include "tests/support/temporary_directory.h"

#include <gtest/gtest.h>

#include <cstdlib>
#include <fstream>
#include <sstream>
#include <stdexcept>

namespace fs = std::filesystem;

TemporaryDirectory::TemporaryDirectory() {
  std::string name = (fs::temp_directory_path() / "vmq-test-XXXXXX").string();
  if (mkdtemp(name.data()) == nullptr) throw std::runtime_error("no temporary directory: " + name);
  path_ = name;
}

TemporaryDirectory::~TemporaryDirectory() {
  std::error_code ignored;  // a test that made something undeletable has already said so
  fs::remove_all(path_, ignored);
}

std::string TemporaryDirectory::writeFile(const std::string& name, const std::string& text) const {
  const fs::path file = path_ / name;
  fs::create_directories(file.parent_path());
  std::ofstream stream(file, std::ios::binary);
  stream << text;
  stream.close();
  if (!stream) throw std::runtime_error("cannot write " + file.string());
  return file.string();
}

std::string TemporaryDirectory::writeScript(const std::string& name, const std::string& body) const {
  const std::string file = writeFile(name, "#!/bin/sh\n" + body);
  fs::permissions(file, fs::perms::owner_all | fs::perms::group_read | fs::perms::group_exec | fs::perms::others_read |
                            fs::perms::others_exec);
  return file;
}

std::string readWholeFile(const std::string& path) {
  std::ifstream stream(path, std::ios::binary);
  EXPECT_TRUE(stream) << "cannot read " << path;
  std::ostringstream text;
  text << stream.rdbuf();
  return text.str();
}

#pragma once
// The vocabulary of the tests that start children.

#include <gtest/gtest.h>

#include <optional>
#include <string>

#include "process/process.h"
#include "tests/support/eventually.h"
#include "tests/support/nothing_left_behind.h"
#include "tests/support/scoped_variable.h"
#include "tests/support/temporary_directory.h"

/// Children written as shell scripts in a directory of the test's own; nothing of them is left behind.
class ChildFixture : public testing::Test {
 protected:
  /// A command that runs `body` in a shell. $1 and further are what a test appends; the directory is the script's own.
  std::string script(const std::string& body) {
    return directory.writeScript("script" + std::to_string(++scripts_),
                                 "cd " + directory.path().string() + "\n" + body);
  }
  /// A script that waits until the test calls letGo().
  std::string scriptThatWaits(const std::string& before = "", const std::string& after = "") {
    return script(before + "\nwhile [ ! -e go ] && [ -e $0 ]; do sleep 0.01; done\n" + after);
  }
  void letGo() const { directory.writeFile("go", ""); }

  /// Everything that the child prints until it and its children have closed the stream.
  static std::string readAll(VMQ::ProcessInputStream* stream) {
    std::string text;
    char buffer[4096];
    for (ssize_t count; (count = stream->read(buffer, sizeof buffer)) > 0;)
      text.append(buffer, static_cast<size_t>(count));
    EXPECT_GE(stream->descriptor(), 0);
    return text;
  }
  /// What a command prints; it must start and exit with 0.
  static std::string outputOf(const std::string& command, const char** env = nullptr) {
    VMQ::Process process(command.c_str(), env);
    if (!process.start()) {
      ADD_FAILURE() << "not started: " << command;
      return "";
    }
    process.getStdIn()->close();
    const std::string output = readAll(process.getStdOut());
    int rc = -1;
    EXPECT_TRUE(process.wait(&rc));
    EXPECT_EQ(rc, 0) << command;
    return output;
  }

  const ScopedVariable noTimeout{"TIMEOUT", std::nullopt};
  const ScopedVariable noChildTrace{"KBB_RAS1", std::nullopt};
  const TemporaryDirectory directory;
  const NothingLeftBehind check;

 private:
  int scripts_ = 0;
};

#pragma once
// An installation home whose agent control script a test writes.

#include <map>
#include <string>
#include <vector>

#include "test_seam.h"
#include "tests/support/temporary_directory.h"

/// The installation home and the depot of this process while it lives; nothing is set afterwards.
class InstallationHome {
 public:
  InstallationHome();
  ~InstallationHome();
  InstallationHome(const InstallationHome&) = delete;
  InstallationHome& operator=(const InstallationHome&) = delete;

  [[nodiscard]] const std::string& path() const { return path_; }
  /// The depot directory, ending in "/".
  [[nodiscard]] std::string depot() const { return path_ + "/depot/"; }

  /// bin/CorvelAgent. Writes its arguments down, one line for each run, and its environment, then does `body`.
  void controlScript(const std::string& body) const;
  void removeControlScript() const;
  /// The arguments of each run of the control script, joined by single blanks.
  [[nodiscard]] std::vector<std::string> runs() const;
  /// The environment of the last run.
  [[nodiscard]] std::map<std::string, std::string> environment() const;

  /// The run-as database of this host, whatever is in it; empty removes it.
  void runAsFile(const std::string& text) const;
  /// Its text with one user for one instance of one product.
  static std::string runAs(const std::string& product, const std::string& instance, const std::string& user);

  /// Another tool of the installation, such as "bin/qinfo": a shell script that does `body`.
  void tool(const std::string& name, const std::string& body) const;
  /// Any file of the installation or its depot.
  void file(const std::string& name, const std::string& text) const;

  /// Removes everything but the empty depot.
  void clear() const;

 private:
  TemporaryDirectory directory_;
  const std::string path_;
};

/// The command lines that were run, in order, as the trace tells them.
std::vector<std::string> commandLines(const TEST_TraceCapture& trace);

#pragma once
// VMQ::Util: where things are on this machine, and what is done with files. What it does with child processes
// (running commands, asking for Java and the depot of the server) is defined in process/.

#include <cstdint>

#include "util/string.h"

namespace VMQ {

/// Static helpers, for any thread. The computed directories are cached behind one lock; a failed computation is tried
/// again by the next call. Directories end in "/".
class Util {
 public:
  Util() = delete;

  // ---- util/installation.cpp: directories of the installation --------------------------------------------------

  /// The installation directory, from CORVELHOME. False, and `dir` empty, when it is unset or does not exist.
  static bool getCorvelHomeDir(String& dir);
  /// Its "config" directory; fails likewise.
  static bool getCorvelConfigDir(String& dir);
  /// The agent depot: QORDEPLOY_AGENTDEPOT, or the installation directory itself; created when missing. False, and `dir`
  /// empty, when there is none, it cannot be created, or its path holds white space or a shell metacharacter (generated
  /// scripts remove directories under it by unquoted names).
  static bool getAgentDepotDir(String& dir);
  /// The host's name, cut at the first ".".
  static String getHostName();

  // ---- util/files.cpp ------------------------------------------------------------------------------------------

  static bool pathExists(const String& path);
  /// Makes a directory and all missing parents, each with mode 0770 before the umask. 0, or an errno value (-1 when there
  /// is nothing to create).
  static int createDir(char* path);
  /// Reads a whole file into a new buffer with a 0 byte behind it, which the caller frees with free(). 0, or an errno
  /// value; an empty file is 0 with a null buffer. `size`, when given, receives the bytes read.
  static int readFile(const char* path, char** contents, unsigned long* size = nullptr);
  /// Removes one file. Failures are traced, never thrown.
  static bool deleteFile(const String& path);
  /// Copies a file into a directory, keeping its name. 0, or an errno value.
  static int copyFile(const String& source, const String& directory);
  /// Copies a file into a directory under the name given.
  static int copyFile(const String& source, const String& directory, const String& name);
  /// Copies one file onto another path; onto itself leaves it whole. 0, or an errno value.
  static int _copyFile(const String& source, const String& destination);
  /// Strips double quotes around the path and separators behind it (in place), then: 2 no such path, 0 a directory,
  /// 1 anything else.
  static int fso_test(char* path);

  // ---- process/java_home.cpp, process/depot_home.cpp, util/reserved.cpp ------------------------------------------

  /// The Java installation that `homeDir`'s location script names, else JAVA_HOME when it is a directory.
  static bool getJavaHome(const String& homeDir, String& javaHome);
  /// The depot of the management server's tables, for the installation directory in `home` (ending in "/"), which it
  /// replaces. 0 on success; else not, and `home` stays. `packages` appends "/PACKAGES/"; `create` makes the directory
  /// when it is missing, which is a failure otherwise.
  static int getDepotHome(String& home, bool packages, bool create);
  static int getDepotHome_UNIX(String& home, bool packages, bool create);
  /// Takes apart "A=level:arch;C=version:arch;G=version:arch", in any order; the dots of the last two versions are
  /// dropped. False when it is not of that form; some of the texts may then be set.
  static bool parseReserved(const String& reserved, String& agentLevel, String& agentArch, String& axVersion,
                            String& axArch, String& commonVersion);

  // ---- process/command_runner.cpp --------------------------------------------------------------------------------

  /// Runs a shell-free command line (words as process/argv.h splits them; the first names the program by a path) and
  /// collects what it prints. True when the command was started and waited for: `rc` is then its exit code, 128 + the
  /// signal that ended it, or 255 when it could not be reaped, and a non-zero `rc` is not a failure of the call. False
  /// when it could not be started; `out` and `err` are then unchanged.
  /// `in` is written to the command's standard input as it is and the input is closed; an empty text closes it at once.
  /// A command line that contains "CorvelAgent" anywhere is not read while it runs: only what is left in the pipes
  /// afterwards is returned (16384 bytes of each at most). Kept on purpose: an agent script may leave the agent behind as
  /// a child that holds the pipes.
  /// `nonBlocking` switches the streams to non-blocking before what is left is read.
  /// A set TIMEOUT (seconds, environment) bounds the whole run; unset, reading is not bounded.
  static bool runCommand(const String& command, int& rc, String& out, String& err, const String& in, bool nonBlocking);
  static bool runCommand(const String& command, int& rc, String& out, String& err, bool nonBlocking);
  /// The same with additions to the child's environment: "NAME=VALUE" texts, ended by null; null for none.
  static bool runCommandEnv(const String& command, char** env, int& rc, String& out, String& err, const String& in,
                            bool nonBlocking);
  static bool runCommandEnv(const String& command, char** env, int& rc, String& out, String& err, bool nonBlocking);

  /// Keeps the first line of a command's output: cuts at the first carriage return, then at the first line feed.
  /// REQUIRES: a text that is not empty and does not begin with a carriage return; otherwise
  /// IndexOutOfBoundsException is thrown. Kept on purpose; callers guard.
  static void stripNewlineCharsFromOutput(String& text);

  /// Forgets the cached directories.
  static void TEST_forgetDirectories();

 private:
  static bool initCorvelHomeDir(String& dir);
  static bool initCorvelConfigDir(String& dir);
  static bool initAgentDepotDir(String& dir);
};

}  // namespace VMQ

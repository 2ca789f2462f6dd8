#include "process/process.h"

#include <unistd.h>

#include <cstdlib>
#include <utility>

#include "bss1.h"
#include "process/argv.h"
#include "process/pipes.h"
#include "process/spawn.h"
#include "util/trace.h"

namespace VMQ {
namespace {

RAS1_Unit traceUnit{"process/process"};

constexpr int kDefaultTimeoutSeconds = 300;

const char* firstOf(const char** list) {
  return list != nullptr ? list[0] : nullptr;
}

int countWords(char* const* argv) {
  int words = 0;
  while (argv[words] != nullptr) ++words;
  return words;
}

struct FreeArgv {
  void operator()(char** argv) const { freeArgv(argv); }
};

}  // namespace

void Process::FreeToken::operator()(user_s_t* token) const {
  free(token);
}

Process::Process(const String& command) : Process(command, nullptr, nullptr, nullptr) {}

Process::Process(const String& command, const char** env) : Process(command, env, nullptr, nullptr) {}

Process::Process(const String& command, const char** env, const char** second, const char** third) {
  const Trace trace(traceUnit);
  init(command, env, second, third);
  createStreams();
}

Process::Process(const Process& other)
    : command_(other.command_),
      environment_(other.environment_),
      timeout_(other.timeout_),
      timeoutIsSet_(other.timeoutIsSet_) {
  const Trace trace(traceUnit);
  if (other.userToken_ != nullptr) {
    userToken_.reset(static_cast<user_s_t*>(malloc(sizeof(user_s_t))));
    if (userToken_ != nullptr) *userToken_ = *other.userToken_;
  }
  createStreams();
}

Process::~Process() {
  const Trace trace(traceUnit);
  stdIn_->close();
  stdOut_->close();
  stdErr_->close();
  destroyProcessData();
}

void Process::init(String command, const char** env, const char** second, const char** third) {
  const Trace trace(traceUnit);
  command_ = std::move(command);
  environment_.clear();
  for (; env != nullptr && *env != nullptr; ++env) environment_.emplace_back(*env);
  const char* const timeout = BSS1_GetEnv("TIMEOUT", nullptr);
  timeout_ = kDefaultTimeoutSeconds;
  timeoutIsSet_ = false;
  int seconds = 0;
  // An empty text would convert to 0.
  if (timeout != nullptr && *timeout != '\0' && String::convertToInt(String(timeout), &seconds)) {
    timeout_ = seconds;
    timeoutIsSet_ = true;
    TRACE_DETAIL(trace, "Set timeout to %d seconds", timeout_);
  }
  userToken_.reset(create_user_token(firstOf(second), firstOf(third), nullptr));
}

void Process::createStreams() {
  const Trace trace(traceUnit);
  stdIn_ = std::make_unique<ProcessOutputStream>();
  stdOut_ = std::make_unique<ProcessInputStream>();
  stdErr_ = std::make_unique<ProcessInputStream>();
}

bool Process::start() {
  const Trace trace(traceUnit);
  if (processData_ == nullptr && startChild()) return true;
  TRACE_ERROR(trace, "Unable to execute command: %s", command_.c_str().get());
  return false;
}

bool Process::startChild() {
  const Trace trace(traceUnit);
  auto processData = std::make_shared<ProcessData>();
  if (!processData->initialize()) return false;
  processData->timeout = timeout_;

  Pipe stdinPipe, stdoutPipe, stderrPipe;
  if (!createPipes(stdinPipe, stdoutPipe, stderrPipe)) return false;

  TRACE_DETAIL(trace, "creating argument array");
  char** words = nullptr;
  (void)MakeArgv(&command_, &words);  // both arguments are there, and its count is counted again below
  const std::unique_ptr<char*, FreeArgv> argv(words);
  if (countWords(argv.get()) > kMaximumWords) return false;
  // Not the search of PATH that the execution itself would make: commands name their program by a path.
  if (access(words[0], X_OK) != 0) return false;

  std::vector<const char*> environment;
  for (const std::string& entry : environment_) environment.push_back(entry.c_str());
  environment.push_back(nullptr);

  startedAtMilliseconds_ = BSS1_GetElapsed();
  if (!forkAndExecute(words, environment.data(), processData, stdinPipe, stdoutPipe, stderrPipe, userToken_.get(),
                      this)) {
    return false;
  }
  processData_ = std::move(processData);
  stdIn_->attach(stdinPipe.writeEnd.release());
  stdOut_->attach(stdoutPipe.readEnd.release());
  stdErr_->attach(stderrPipe.readEnd.release());
  return true;
}

bool Process::running() {
  const Trace trace(traceUnit);
  if (processData_ == nullptr || pthread_mutex_lock(&processData_->mutex) != 0) return false;
  const bool completed = processData_->completed;
  (void)pthread_mutex_unlock(&processData_->mutex);  // just locked by this thread
  return !completed;
}

ProcessOutputStream* Process::getStdIn() {
  return stdIn_.get();
}
ProcessInputStream* Process::getStdOut() {
  return stdOut_.get();
}
ProcessInputStream* Process::getStdErr() {
  return stdErr_.get();
}

void Process::destroyProcessData() {
  const Trace trace(traceUnit);
  if (processData_ == nullptr) return;
  if (processData_->joinable) (void)pthread_detach(processData_->thread);  // joinable, so it cannot fail
  processData_.reset();
}

}  // namespace VMQ

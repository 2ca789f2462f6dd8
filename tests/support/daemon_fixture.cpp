#include "tests/support/daemon_fixture.h"

#include <gtest/gtest.h>

#include <csignal>
#include <filesystem>
#include <stdexcept>

DaemonFixture::DaemonFixture(Options options) : home_(options.home.empty() ? directory_ / "home" : options.home) {
  if (options.home.empty()) std::filesystem::create_directories(home_ + "/tmp");
  std::filesystem::create_directories(depot());
  std::string text = "socket = " + socket() + "\nhome = " + home_ + "\ndepot = " + depot() + "\nnode = " + node + "\n";
  if (!options.library.empty()) text += "library = " + options.library + "\n";
  for (const std::string& line : options.lines) text += line + "\n";
  directory_.writeFile("vmqd.conf", text);
  if (options.start) start();
}

DaemonFixture::~DaemonFixture() {
  if (!process_ || process_->ended()) return;
  try {
    EXPECT_EQ(0, stop()) << log();
  } catch (const std::exception& error) {
    ADD_FAILURE() << error.what() << "\n" << log();
  }
}

void DaemonFixture::launch() {
  process_ = std::make_unique<DaemonProcess>(std::vector<std::string>{"--config", config()}, directory_ / "vmqd.log");
}

void DaemonFixture::start() {
  launch();
  if (process_->waitUntilReady()) return;
  const int exit_code = process_->wait();
  throw std::runtime_error("vmqd ended with " + std::to_string(exit_code) + ":\n" + log());
}

void DaemonFixture::kill() {
  process_->signal(SIGKILL);
  (void)process_->wait();
}

std::string DaemonFixture::log() const {
  return readWholeFile(directory_ / "vmqd.log");
}

#pragma once
// An installation home and a depot for pushed files, and what is pushed into it.

#include <gtest/gtest.h>

#include <string>
#include <vector>

#include "rpc/data_block.h"
#include "test_seam.h"
#include "tests/support/scoped_variable.h"
#include "tests/support/temporary_directory.h"

/// A block for each text; texts have at most 4096 bytes.
std::vector<DataBlock> blocksOf(const std::vector<std::string>& texts);

/// One call of the manager routine, with a name that has nothing behind its end (and no end at 255 bytes). Returns the
/// status.
uint32_t transfer(const std::string& name, int32_t chunk, const std::vector<DataBlock>& blocks, int32_t lastBlockIndex);
/// Of all the texts.
uint32_t transfer(const std::string& name, int32_t chunk, const std::vector<std::string>& texts);

class TransferTest : public testing::Test {
 protected:
  TransferTest();
  ~TransferTest() override;

  /// Lets pushed files arrive in another directory.
  void moveDepot(const std::string& path);

  TemporaryDirectory directory_;
  const std::string home_ = directory_ / "home";
  std::string depot_ = directory_ / "depot/";
  /// As its name is traced.
  const std::string work_file_ = home_ + "//tmp/.vmqtemp";
  ScopedVariable home_variable_{"CORVELHOME", home_};
  ScopedVariable depot_variable_{"QORDEPLOY_AGENTDEPOT", depot_};
  TEST_TraceCapture trace_;
};

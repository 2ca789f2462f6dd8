#include "tests/rpc/transfer_fixture.h"

#include <sys/stat.h>

#include <algorithm>
#include <cstring>
#include <filesystem>
#include <memory>

#include "rpc/binary_data_transfer.h"
#include "util/util.h"

std::vector<DataBlock> blocksOf(const std::vector<std::string>& texts) {
  std::vector<DataBlock> blocks(texts.size());
  for (size_t index = 0; index < texts.size(); ++index) {
    blocks[index].length = static_cast<int32_t>(texts[index].size());
    std::memcpy(blocks[index].data, texts[index].data(), texts[index].size());
  }
  return blocks;
}

uint32_t transfer(const std::string& name, int32_t chunk, const std::vector<DataBlock>& blocks,
                  int32_t lastBlockIndex) {
  // On the heap and no longer than the field, so that a sanitizer sees who reads on.
  const auto field = std::make_unique<char[]>(255);
  std::copy_n(name.begin(), std::min<size_t>(name.size(), 255), field.get());
  const std::string ignored(84, '?');
  uint32_t status = 999;
  BinaryDataTransfer(nullptr, ignored.data(), field.get(), -1, chunk, lastBlockIndex, blocks.data(), &status);
  return status;
}

uint32_t transfer(const std::string& name, int32_t chunk, const std::vector<std::string>& texts) {
  return transfer(name, chunk, blocksOf(texts), static_cast<int32_t>(texts.size()) - 1);
}

TransferTest::TransferTest() {
  std::filesystem::create_directories(home_ + "/tmp");
  std::filesystem::create_directories(depot_);
  VMQ::Util::TEST_forgetDirectories();
  (void)VMQ::String("first").c_str();  // chooses the conversions' locale while there is one thread only
}

TransferTest::~TransferTest() {
  VMQ::Util::TEST_forgetDirectories();
}

void TransferTest::moveDepot(const std::string& path) {
  depot_ = path.back() == '/' ? path : path + "/";
  depot_variable_.put(path);
  VMQ::Util::TEST_forgetDirectories();
}

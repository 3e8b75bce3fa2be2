// SPDX-License-Identifier: Apache-2.0
// Files that other processes hold, and resources that ran out: neither reads as absent.
#include <gtest/gtest.h>

#include <string>
#include <vector>

#include <vesk2/limits.h>

#include "src/platform/file.h"
#include "tests/support/held_file.h"
#include "tests/support/temp_dir.h"

namespace ZVsysutil {
namespace {

using vesk2test::HeldFiles;
using vesk2test::OnDemand;
using vesk2test::TempDir;

struct Codes {
  int opened, read, listed;
};

Codes TryAll(const std::string& path) {
  Codes codes{};
  ZvFileOwner file;
  codes.opened = zv_open(file, path.c_str(), ZV_READ);
  std::unique_ptr<unsigned char[]> bytes;
  size_t size = 0;
  const ZvPlace place = {kZvNoDirectory, path.c_str(), true};
  codes.read = zv_read_whole(bytes, &size, place, ZvVesk2::Limits::kMaxFile);
  ZvDir dir;
  codes.listed = dir.open(path.substr(0, path.rfind('/')).c_str(), "*");
  ZvBuffer* const buffer = zv_buffer_wrap_file(path.c_str());
  EXPECT_EQ(buffer == nullptr, codes.read != 0);
  zv_buffer_free(buffer);
  return codes;
}

TEST(HeldFile, IsNotAbsentAndOneWaitIsForAll) {
  const TempDir dir;
  std::vector<std::string> paths;
  for (int i = 0; i < 100; ++i) paths.push_back(dir.Write(std::to_string(i), "abc"));
  const HeldFiles held(paths);
  ZvCall call;
  for (const std::string& path : paths) {
    const Codes codes = TryAll(path);
    EXPECT_EQ(codes.opened, VESK2_ERR_READ_FILE);
    EXPECT_EQ(codes.read, VESK2_ERR_READ_FILE);
    EXPECT_EQ(codes.listed, 0);
  }
  EXPECT_EQ(call.Waited(), HeldFiles::kWait);
}

TEST(HeldFile, IsReadWhenItIsGivenBack) {
  const TempDir dir;
  const std::string path = dir.Write("file", "abc");
  const HeldFiles held({path}, OnDemand::kGiveBack);
  ZvFileOwner file;
  ASSERT_EQ(zv_open(file, path.c_str(), ZV_READ), 0);
  unsigned char bytes[4];
  EXPECT_EQ(zv_read(file.get(), bytes, sizeof bytes), 3u);
}

// Whoever waits by opening it with blocking waits for ever.
TEST(HeldFile, IsNotOpenedWhenAFifoTookItsPlace) {
  const TempDir dir;
  const std::string path = dir.Write("file", "abc");
  const HeldFiles held({path}, OnDemand::kPutFifo);
  ZvFileOwner file;
  EXPECT_EQ(zv_open(file, path.c_str(), ZV_READ), VESK2_ERR_FILE_OPEN);
}

TEST(HeldFile, NoDescriptorIsNoAbsence) {
  const TempDir dir;
  const std::string path = dir.Write("file", "abc");
  Codes codes{};
  {
    const vesk2test::NoDescriptors none;
    codes = TryAll(path);
  }
  for (const int code : {codes.opened, codes.read, codes.listed}) {
    EXPECT_EQ(code, VESK2_ERR_MEM_ALLOC);
  }
}

}  // namespace
}  // namespace ZVsysutil

// SPDX-License-Identifier: Apache-2.0
// A whole manifest file, read with the chain's verification against empty stores: never accepted,
// never a crash.
#include <sys/mman.h>
#include <unistd.h>

#include "fuzz/fuzz_support.h"

using namespace ZvVesk2;
using namespace vesk2fuzz;

extern "C" int LLVMFuzzerTestOneInput(const uint8_t* data, size_t size) {
  const int fd = memfd_create("manifest", MFD_CLOEXEC);
  FUZZ_CHECK(fd >= 0);
  FUZZ_CHECK(write(fd, data, size) == static_cast<ssize_t>(size));
  const std::string path = "/proc/self/fd/" + std::to_string(fd);
  Manifest manifest(nullptr);
  FUZZ_CHECK(manifest.Initialize("/nonexistent", path.c_str(), "(install)") == 0);
  ZvBuffer* body = nullptr;
  const int rc = manifest.ReadManifest(false, 0, 0, &body);
  FUZZ_CHECK((rc == 0) == (body != nullptr));
  FUZZ_CHECK((rc == 0) == (manifest.GetSigningTime() != nullptr));
  ZVsysutil::zv_buffer_free(body);
  FUZZ_CHECK(manifest.VerifyManifest(0, 0) != 0);
  close(fd);
  return 0;
}

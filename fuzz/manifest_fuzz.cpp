// SPDX-License-Identifier: Apache-2.0
// A whole manifest, beside a store that trusts the key which signs what is mutated: forms,
// signatures, authority, content and the tree are all reached. Evidence and explanation change no
// answer.
#include <fcntl.h>
#include <sys/mman.h>
#include <unistd.h>

#include <cstring>
#include <filesystem>
#include <fstream>

#include "fuzz/fuzz_support.h"
#include "fuzz/oracle/signing.h"

using namespace ZvVesk2;
using namespace vesk2fuzz;

namespace {

// A store and a small tree, for the time of the process.
class Machine {
 public:
  Machine() : root_((std::filesystem::temp_directory_path() / "vesk2-fuzz-XXXXXX").string()) {
    FUZZ_CHECK(mkdtemp(root_.data()) != nullptr);
    std::filesystem::create_directories(root_ + "/acl");
    std::filesystem::create_directories(root_ + "/tree/sub");
    const std::string subject = "(7:subject" + SignersKey() + ")";
    Write("/acl/all.acl", "(5:entry" + subject + "(9:propagate)(3:tag(7:install)))");
    Write("/acl/lists.acl", "(5:entry" + subject + "(3:tag4:calc(6:revoke3:all)))");
    Write("/tree/a", "a");
    Write("/tree/sub/b", "b");
    VeskConf::SetGlobalDirectory(root_.c_str());
    file_ = memfd_create("manifest", MFD_CLOEXEC);
    FUZZ_CHECK(file_ >= 0);
  }
  Machine(const Machine&) = delete;
  ~Machine() { std::filesystem::remove_all(root_); }

  std::string Tree() const { return root_ + "/tree"; }
  // A file that holds the input.
  std::string PathOf(std::string_view input) const {
    FUZZ_CHECK(ftruncate(file_, 0) == 0);
    FUZZ_CHECK(pwrite(file_, input.data(), input.size(), 0) == static_cast<ssize_t>(input.size()));
    return "/proc/self/fd/" + std::to_string(file_);
  }

 private:
  void Write(const std::string& name, const std::string& contents) const {
    std::ofstream(root_ + name) << contents;
  }

  std::string root_;
  int file_ = -1;
};

// The first answer of a manifest that was read alone.
int Read(Manifest& manifest) {
  ZvBuffer* body = nullptr;
  const int code = manifest.ReadManifest(true, 0, 0, &body);
  const Buffer owned(body);
  FUZZ_CHECK((code == 0) == (body != nullptr));
  FUZZ_CHECK((code == 0) == (manifest.GetSigningTime() != nullptr));
  if (code != 0) return code;
  Manifest other(nullptr);
  const int compared = other.Compare(
      body, Wrap({reinterpret_cast<const char*>(body->Data()), body->Remaining()}).get());
  FUZZ_CHECK(other.GetInvalid() == nullptr && other.GetMissing() == nullptr);
  static_cast<void>(compared);
  return 0;
}

void Explain(const Evidence& evidence, int code, SExpression* tag) {
  Explanation explanation(nullptr);
  FUZZ_CHECK(explanation.Explain(evidence, code, tag) == 0);
  for (size_t i = 0; i < explanation.CountReasons(); ++i) {
    const char* text = explanation.GetReason(i).text;
    FUZZ_CHECK(code != 0 && *text != '\0');
    for (; *text != '\0'; ++text) FUZZ_CHECK(*text >= ' ' && *text <= '~');
  }
  FUZZ_CHECK(code != 0 || explanation.GetEntry() == nullptr || evidence.CountCerts() > 1);
}

}  // namespace

FUZZ_TARGET(manifest) {
  static const Machine machine;
  const std::string path = machine.PathOf(input);
  const std::string tree = machine.Tree();
  Manifest manifest(nullptr);
  constexpr char kTag[] = "(install (app calc))";
  FUZZ_CHECK(manifest.Initialize(tree.c_str(), path.c_str(), kTag) == 0);
  manifest.SetStoreUpdate(false);
  const int code = Read(manifest);

  Evidence evidence(nullptr);
  manifest.SetEvidence(&evidence);
  const int verified = manifest.VerifyManifest(0, 0);
  FUZZ_CHECK(code == 0 || verified == code);
  for (size_t i = 0; code == 0 && i < evidence.CountCerts(); ++i) {
    FUZZ_CHECK(evidence.GetSignatureCode(i) == 0);
  }
  Explain(evidence, code, manifest.GetTag());
}

#ifndef VESK2_REPLAY
extern "C" size_t LLVMFuzzerMutate(uint8_t* data, size_t size, size_t max_size);

// One in eight stays as it came, with signatures that do not hold.
extern "C" size_t LLVMFuzzerCustomMutator(uint8_t* data, size_t size, size_t max_size,
                                          unsigned int seed) {
  const size_t mutated = LLVMFuzzerMutate(data, size, max_size);
  if (seed % 8 == 0) return mutated;
  const std::string text = SignedAgain({reinterpret_cast<const char*>(data), mutated});
  if (text.empty() || text.size() > max_size) return mutated;
  std::memcpy(data, text.data(), text.size());
  return text.size();
}
#endif

// What a comparison found: one record an entry, and the code that a set of findings amounts to.
#ifndef VESK2_SRC_MANIFEST_FINDINGS_H
#define VESK2_SRC_MANIFEST_FINDINGS_H

#include <memory>

#include <vesk2/manifest_body.h>

namespace ZvVesk2 {

// The statuses found in one directory, or in all; and why that directory was not searched, or 0.
class StatusSet {
 public:
  int reason = 0;

  void Add(uint32_t status) { statuses_ |= status; }
  // The worst finding decides: VESK2_ERR_HASH_MISMATCH over VESK2_ERR_FILE_NOT_FOUND over
  // VESK2_ERR_EXTRA_FILES over 0.
  [[nodiscard]] int Code() const;

 private:
  uint32_t statuses_ = 0;
};

// One found entry.
class Finding : public BodyObject {
 public:
  explicit Finding(Vesk2ContextStruct* ctx) : BodyObject(ctx) {}
  ~Finding() override;
  // See Manifest::GetReason.
  int reason = 0;
};

class Findings {
 public:
  explicit Findings(Vesk2ContextStruct* context) : context_(context) {}

  // Each records an entry and adds its status to `statuses`, the directory's. `reason`: see
  // Manifest::GetReason. 0 or VESK2_ERR_MEM_ALLOC.
  [[nodiscard]] int AddFile(const BodyDirectory& directory, const char* name, uint32_t status,
                            StatusSet& statuses, int reason = 0);
  [[nodiscard]] int AddDirectory(const char* path, uint32_t status, StatusSet& statuses,
                                 int reason = 0);

  uint32_t Count() const { return records_.GetCount(); }
  Finding& At(uint32_t index) { return static_cast<Finding&>(*records_.at(index)); }

 private:
  [[nodiscard]] int Add(std::unique_ptr<char[]> name, bool isDirectory, uint32_t status,
                        StatusSet& statuses, int reason);

  Vesk2ContextStruct* context_;
  PointerArray<BodyObject> records_;  // each a Finding
};

}  // namespace ZvVesk2

#endif  // VESK2_SRC_MANIFEST_FINDINGS_H

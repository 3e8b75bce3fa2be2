// SPDX-License-Identifier: Apache-2.0
// The comparison of two bodies, without the disk. Both bodies are sorted, so that one pass over the
// two tells what is in both, and the cost is that of reading them. The ignored names are read by
// the same pass (ignore.h).
#include <vesk2/manifest.h>
#include <vesk2/manifest_body.h>

#include "src/frame/check.h"
#include "src/manifest/findings.h"
#include "src/manifest/ignore.h"

namespace ZvVesk2 {
namespace {

// Which of the two next entries comes first: negative a, positive b, 0 both. An exhausted side
// comes last.
[[nodiscard]] int Order(BodyObject* a, BodyObject* b) {
  if (a == nullptr) return 1;
  if (b == nullptr) return -1;
  return BodyObject::Cmp(&a, &b);
}

// The code of the whole comparison is that of the two roots: a difference further down makes the
// directory that holds it invalid, whatever the difference is. It recurses as deeply as the bodies
// nest, which their reader bounds (Limits::kMaxDepth).
class BodyComparison {
 public:
  explicit BodyComparison(Findings& findings) : findings_(findings) {}

  // Compares a directory of the reference with one of the other body; returns trouble only.
  [[nodiscard]] int Directories(BodyDirectory& a, BodyDirectory& b, StatusSet& statuses) {
    VESK2_TRY(Files(a, b, statuses));
    return Subdirectories(a, b, statuses);
  }

 private:
  [[nodiscard]] int Files(BodyDirectory& a, BodyDirectory& b, StatusSet& statuses);
  [[nodiscard]] int Subdirectories(BodyDirectory& a, BodyDirectory& b, StatusSet& statuses);
  [[nodiscard]] int Pair(BodyDirectory& a, BodyDirectory& b, StatusSet& statuses);
  [[nodiscard]] int Subtree(BodyDirectory& directory, uint32_t status, StatusSet& statuses);

  Findings& findings_;
};

// Files and directories are kept in two lists, so that a file and a directory of one name never
// meet: the one is missing and the other extra.
int BodyComparison::Files(BodyDirectory& a, BodyDirectory& b, StatusSet& statuses) {
  // Each side was read with the same list, and each walk serves one sequence of names.
  IgnoreWalk ignoreOfA(a.GetIgnored());
  IgnoreWalk ignoreOfB(b.GetIgnored());
  BodyObject* fileA = a.GetFiles().begin();
  BodyObject* fileB = b.GetFiles().begin();
  while (fileA != nullptr || fileB != nullptr) {
    // As long as both sides have files, the reference's list decides for both.
    IgnoreWalk& ignore = fileA != nullptr ? ignoreOfA : ignoreOfB;
    // The smaller name is the one that the other side does not have.
    const int order = Order(fileA, fileB);
    const char* const name = order <= 0 ? fileA->GetName() : fileB->GetName();
    // Alone in the reference: missing. Alone in the other: extra.
    uint32_t status = order < 0 ? BodyObject::Missing : BodyObject::Extra;
    if (order == 0) {
      const bool same = static_cast<const BodyFile*>(fileA)->Equal(fileB);
      status = same ? BodyObject::Valid : BodyObject::Invalid;
    }
    if (!ignore.Ignores(name)) VESK2_TRY(findings_.AddFile(a, name, status, statuses));
    if (order <= 0) fileA = a.GetFiles().next();
    if (order >= 0) fileB = b.GetFiles().next();
  }
  return 0;
}

// Here each side's own list decides: a path below is collected by the directory that has it.
int BodyComparison::Subdirectories(BodyDirectory& a, BodyDirectory& b, StatusSet& statuses) {
  IgnoreWalk ignoreOfA(a.GetIgnored());
  IgnoreWalk ignoreOfB(b.GetIgnored());
  auto* inA = static_cast<BodyDirectory*>(a.GetSubdirectories().begin());
  auto* inB = static_cast<BodyDirectory*>(b.GetSubdirectories().begin());
  while (inA != nullptr || inB != nullptr) {
    const int order = Order(inA, inB);
    if (order == 0 && !ignoreOfA.Ignores(inA->GetName())) VESK2_TRY(Pair(*inA, *inB, statuses));
    if (order < 0 && !ignoreOfA.Ignores(inA->GetName())) {
      VESK2_TRY(Subtree(*inA, BodyObject::Missing, statuses));
    }
    if (order > 0 && !ignoreOfB.Ignores(inB->GetName())) {
      VESK2_TRY(Subtree(*inB, BodyObject::Extra, statuses));
    }
    if (order <= 0) inA = static_cast<BodyDirectory*>(a.GetSubdirectories().next());
    if (order >= 0) inB = static_cast<BodyDirectory*>(b.GetSubdirectories().next());
  }
  return 0;
}

// The directory stands in the results behind what is in it, as whoever prints them expects.
int BodyComparison::Pair(BodyDirectory& a, BodyDirectory& b, StatusSet& statuses) {
  StatusSet inside;
  VESK2_TRY(Directories(a, b, inside));
  const uint32_t status = inside.Code() == 0 ? BodyObject::Valid : BodyObject::Invalid;
  return findings_.AddDirectory(a.GetName(), status, statuses);
}

// Records a directory and all that is below it. Ignored names below are not looked for: the
// reference says nothing of this directory, and a directory that is ignored as a whole did not come
// here.
int BodyComparison::Subtree(BodyDirectory& directory, uint32_t status, StatusSet& statuses) {
  VESK2_TRY(findings_.AddDirectory(directory.GetName(), status, statuses));
  PointerArray<BodyObject>& files = directory.GetFiles();
  for (const BodyObject* file = files.begin(); file != nullptr; file = files.next()) {
    VESK2_TRY(findings_.AddFile(directory, file->GetName(), status, statuses));
  }
  PointerArray<BodyObject>& below = directory.GetSubdirectories();
  for (BodyObject* entry = below.begin(); entry != nullptr; entry = below.next()) {
    VESK2_TRY(Subtree(static_cast<BodyDirectory&>(*entry), status, statuses));
  }
  return 0;
}

}  // namespace

// Nothing here is proved: the caller has read both bodies from manifests, or has them from
// anywhere. The findings are published when all of them are made, so that no list shows half a
// comparison.
int Manifest::Compare(ZvBuffer* body1, ZvBuffer* body2) {
  VESK2_REQUIRE(body1 != nullptr && body2 != nullptr, VESK2_ERR_PARAM_NULL);
  PointerArray<char> ignoreList;
  VESK2_TRY(BuildIgnoreList(nullptr, ignoreList));
  BodyDirectory reference(context);
  BodyDirectory other(context);
  VESK2_TRY(reference.ParseBody(body1, &ignoreList));
  VESK2_TRY(other.ParseBody(body2, &ignoreList));

  Findings findings;
  StatusSet statuses;
  VESK2_TRY(BodyComparison(findings).Directories(reference, other, statuses));
  VESK2_TRY(Publish(findings));
  return statuses.Code();
}

}  // namespace ZvVesk2

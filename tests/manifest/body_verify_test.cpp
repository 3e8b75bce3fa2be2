// Bodies against real trees and against each other: every row gives the exact lists.
#include <gtest/gtest.h>
#include <sys/stat.h>

#include <filesystem>
#include <functional>
#include <string>
#include <vector>

#include <vesk2/manifest.h>

#include "tests/manifest/result_text.h"
#include "tests/support/temp_dir.h"
#include "tests/support/test_manifest.h"
#include "tests/support/test_object.h"

using namespace vesk2test;
using ZvVesk2::Manifest;
namespace fs = std::filesystem;

namespace {

// The tree a, b, sub/f, sub/deep/g and its body.
struct Tree {
  Tree() {
    for (const char* name : {"a", "b", "sub/f", "sub/deep/g"}) dir.Write(name, name);
    body = BodyOf(dir.Path());
  }
  TempDir dir;
  std::string body;
};

struct DiskCase {
  const char* what;
  std::function<void(Tree&)> change;
  std::vector<const char*> ignored;
  int code;
  const char* findings;
};

void Special(Tree& tree, const char* name, mode_t type) {
  fs::remove(tree.dir.File(name));
  ASSERT_EQ(mknod(tree.dir.File(name).c_str(), type | 0600, 0), 0);
}

const std::vector<DiskCase>& DiskCases() {
  static const std::vector<DiskCase> cases = {
      {"nothing changed", [](Tree&) {}, {}, 0, "V:sub/ sub/deep/ sub/deep/g sub/f b a I: M: X:"},
      {"the root is not searched for extra entries",
       [](Tree& t) {
         t.dir.Write("x", "");
         t.dir.Write("new/y", "");
       },
       {},
       0,
       "V:sub/ sub/deep/ sub/deep/g sub/f b a I: M: X:"},
      {"extra entries make the directories above extra",
       [](Tree& t) {
         t.dir.Write("sub/deep/x", "");
         t.dir.Write("sub/deep/q/y", "");
       },
       {},
       VESK2_ERR_EXTRA_FILES,
       "V:sub/deep/g sub/f b a I: M: X:sub/ sub/deep/ sub/deep/x sub/deep/q/"},
      {"missing in the root outranks extra",
       [](Tree& t) {
         fs::remove(t.dir.File("a"));
         t.dir.Write("sub/x", "");
       },
       {},
       VESK2_ERR_FILE_NOT_FOUND,
       "V:sub/deep/ sub/deep/g sub/f b I: M:a X:sub/ sub/x"},
      {"missing below the root makes the directory invalid",
       [](Tree& t) { fs::remove(t.dir.File("sub/f")); },
       {},
       VESK2_ERR_HASH_MISMATCH,
       "V:sub/deep/ sub/deep/g b a I:sub/ M:sub/f X:"},
      {"changed outranks missing",
       [](Tree& t) {
         fs::remove(t.dir.File("a"));
         t.dir.Write("b", "B");
       },
       {},
       VESK2_ERR_HASH_MISMATCH,
       "V:sub/ sub/deep/ sub/deep/g sub/f I:b M:a X:"},
      {"a missing directory is recorded by itself and by its parent",
       [](Tree& t) { fs::remove_all(t.dir.File("sub/deep")); },
       {},
       VESK2_ERR_HASH_MISMATCH,
       "V:sub/f b a I:sub/ sub/deep/ sub/deep/ M:sub/deep/g X:"},
      {"contents count, not links",
       [](Tree& t) {
         fs::rename(t.dir.File("a"), t.dir.File("elsewhere"));
         fs::create_symlink("elsewhere", t.dir.File("a"));
         fs::rename(t.dir.File("sub/deep"), t.dir.File("moved"));
         fs::create_directory_symlink("../moved", t.dir.File("sub/deep"));
       },
       {},
       0,
       "V:sub/ sub/deep/ sub/deep/g sub/f b a I: M: X:"},
      {"special files count as missing and do not block",
       [](Tree& t) {
         Special(t, "a", S_IFIFO);
         Special(t, "b", S_IFSOCK);
         Special(t, "sub/f", S_IFIFO);
         Special(t, "sub/x", S_IFIFO);
       },
       {},
       VESK2_ERR_HASH_MISMATCH,
       "V:sub/deep/ sub/deep/g I:sub/ M:sub/f b a X:sub/x"},
      {"a directory or a dangling link where a file is listed",
       [](Tree& t) {
         fs::remove(t.dir.File("a"));
         fs::create_directory(t.dir.File("a"));
         fs::remove(t.dir.File("b"));
         fs::create_symlink("nowhere", t.dir.File("b"));
       },
       {},
       VESK2_ERR_FILE_NOT_FOUND,
       "V:sub/ sub/deep/ sub/deep/g sub/f I: M:b a X:"},
      {"a file where a directory is listed",
       [](Tree& t) {
         fs::remove_all(t.dir.File("sub/deep"));
         t.dir.Write("sub/deep", "");
       },
       {},
       VESK2_ERR_HASH_MISMATCH,
       "V:sub/f b a I:sub/ sub/deep/ sub/deep/ M:sub/deep/g X:sub/deep"},
      {"ignored entries count for their directory only",
       [](Tree& t) {
         for (const char* name : {"a", "sub/f", "sub/x", "sub/a"}) t.dir.Write(name, "changed");
       },
       {"a", "sub/x", "sub/f", "f", "x"},
       VESK2_ERR_EXTRA_FILES,
       "V:sub/deep/ sub/deep/g b I: M: X:sub/ sub/a"},
      {"ignored files stay ignored behind directories of larger names",
       [](Tree& t) {
         t.dir.Write("sub/a0", "");
         t.dir.Write("sub/zz/y", "");
       },
       {"sub/a0", "sub/zz"},
       0,
       "V:sub/ sub/deep/ sub/deep/g sub/f b a I: M: X:"},
      {"an ignored directory is not looked into",
       [](Tree& t) { fs::remove_all(t.dir.File("sub")); },
       {"sub"},
       0,
       "V:b a I: M: X:"},
      {"duplicates are recorded each, and an entry ignores one of them",
       [](Tree& t) {
         t.body = Body(FileEntry("a", "a") + FileEntry("a", "x") + FileEntry("b", "b") +
                       FileEntry("b", "b"));
       },
       {"b"},
       VESK2_ERR_HASH_MISMATCH,
       "V:b a I:a M: X:"},
  };
  return cases;
}

TEST(BodyVerify, FindsWhatDiffers) {
  for (const DiskCase& row : DiskCases()) {
    Tree tree;
    row.change(tree);
    // A separator at the end must not switch the ignored names off.
    for (const std::string& end : {std::string(), std::string("/"), std::string("//")}) {
      Manifest manifest(nullptr);
      Ignore(manifest, row.ignored);
      const std::string directory = tree.dir.Path() + end;
      EXPECT_EQ(manifest.Verify(Wrap(tree.body).get(), directory.c_str()), row.code) << row.what;
      std::string root = directory;
      if (!end.empty()) root.pop_back();
      EXPECT_EQ(Findings(manifest, root), row.findings) << row.what << " " << directory;
    }
  }
}

TEST(BodyVerify, RefusesNull) {
  Manifest manifest(nullptr);
  EXPECT_EQ(manifest.Verify(nullptr, "/"), VESK2_ERR_PARAM_NULL);
  EXPECT_EQ(manifest.Verify(Wrap(Body("")).get(), nullptr), VESK2_ERR_PARAM_NULL);
  EXPECT_EQ(manifest.Compare(nullptr, Wrap(Body("")).get()), VESK2_ERR_PARAM_NULL);
  EXPECT_EQ(manifest.Compare(Wrap(Body("")).get(), nullptr), VESK2_ERR_PARAM_NULL);
  EXPECT_EQ(manifest.Compare(Wrap(Body("")).get(), Wrap("(4:body").get()), VESK2_ERR_PARSE_FILE);
}

TEST(BodyCompare, FindsWhatDiffers) {
  const std::string a = FileEntry("a", "a"), b = FileEntry("b", "b"), c = FileEntry("c", "c");
  const std::string changed = FileEntry("b", "B");
  const std::string sub = DirEntry("s", a + DirEntry("t", b));
  struct Case {
    std::string reference, other;
    std::vector<const char*> ignored;
    int code;
    const char* findings;
  };
  const std::vector<Case> cases = {
      {a + sub, sub + a, {}, 0, "V:s/ s/t/ s/t/b s/a a I: M: X:"},
      {a + b, changed + c, {}, VESK2_ERR_HASH_MISMATCH, "V: I:b M:a X:c"},
      {a, a + b, {}, VESK2_ERR_EXTRA_FILES, "V:a I: M: X:b"},
      {a + b, a, {}, VESK2_ERR_FILE_NOT_FOUND, "V:a I: M:b X:"},
      // Whole subtrees, the directory first; nothing inside is ignored.
      {sub, a, {"s/a"}, VESK2_ERR_FILE_NOT_FOUND, "V: I: M:s/t/b s/t/ s/a s/ X:a"},
      {a, sub + a, {}, VESK2_ERR_EXTRA_FILES, "V:a I: M: X:s/t/b s/t/ s/a s/"},
      // Any difference inside makes both directories of that name invalid, also extra files.
      {DirEntry("s", a), DirEntry("s", a + b), {}, VESK2_ERR_HASH_MISMATCH, "V:s/a I:s/ M: X:s/b"},
      {sub, a, {"s"}, VESK2_ERR_EXTRA_FILES, "V: I: M: X:a"},
      {a, sub + a, {"s"}, 0, "V:a I: M: X:"},
      {a + b, changed + c, {"a", "b", "c"}, 0, "V: I: M: X:"},
      {DirEntry("s", a + b), DirEntry("s", a + changed), {"s/b"}, 0, "V:s/ s/a I: M: X:"},
      {DirEntry("s", a),
       DirEntry("s", a + b),
       {"b"},
       VESK2_ERR_HASH_MISMATCH,
       "V:s/a I:s/ M: X:s/b"},
      // The reference's list decides while both sides last, then each side's own.
      {b + c, b + b + c, {"b"}, VESK2_ERR_EXTRA_FILES, "V:c I: M: X:b"},
      {b, b + b, {"b"}, 0, "V: I: M: X:"},
  };
  for (const Case& row : cases) {
    Manifest manifest(nullptr);
    Ignore(manifest, row.ignored);
    const int code = manifest.Compare(Wrap(Body(row.reference)).get(), Wrap(Body(row.other)).get());
    EXPECT_EQ(code, row.code) << row.findings;
    EXPECT_EQ(Findings(manifest), row.findings);
  }
}

}  // namespace

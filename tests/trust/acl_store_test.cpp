#include <sys/stat.h>

#include "tests/trust/trust_test.h"

namespace vesk2test {
namespace {

std::string Entry(const std::string& tag) { return AclEntryText(HashOf("key"), Tag(tag)); }

class AclStore : public TrustTest {
 protected:
  // The last words of the tags that Import loads, in order, or the number of its error.
  static std::string Load(const char* extra = nullptr) {
    Ref<SExpression> list;
    const int code = AclEntry::Import(list.Out(), nullptr, extra);
    if (code != 0) return std::to_string(code);
    std::string tags;
    for (auto it = list->Begin(); it; it.Next()) {
      auto* const entry = dynamic_cast<AclEntry*>(it.Value());
      tags += entry != nullptr ? Bytes(dynamic_cast<ByteString*>(entry->GetTag()->Last())) : ".";
    }
    return tags;
  }
  int Install(const std::string& dir) { return AclEntry::InstallAcls(dir.c_str(), nullptr); }
};

const std::string kNotFound = std::to_string(VESK2_ERR_FILE_NOT_FOUND);

TEST_F(AclStore, ImportOfOneFile) {
  WriteAcl("a", Entry("a"));
  const std::string path = other.Write("b", Entry("b"));
  const struct {
    std::string name, file;
    int code;
  } cases[] = {
      {"a", global.File("acl/a.acl"), 0},  // in the store
      {path, path, 0},                     // a path, taken as it is
      {path + ".acl", path + ".acl", VESK2_ERR_FILE_OPEN},
      {"b", global.File("acl/b.acl"), VESK2_ERR_FILE_OPEN},
  };
  for (const auto& c : cases) {
    const Ref<AclEntry> entry(new AclEntry(nullptr));
    EXPECT_EQ(entry->Import(c.name.c_str()), c.code) << c.name;
    EXPECT_EQ(entry->GetFileName(), c.file);
  }
}

TEST_F(AclStore, ImportOfTheStore) {
  const char* const extra = other.Path().c_str();
  EXPECT_EQ(Load(), kNotFound);
  WriteAcl("b", Entry("b"));
  WriteAcl("a", Entry("a"));
  other.Write("0.acl", Entry("x"));
  other.Write("1.acl", "broken");
  EXPECT_EQ(Load(), ".ab");
  EXPECT_EQ(Load(extra), ".abx");
  EXPECT_EQ(Load("/nonexistent"), ".ab");

  // What cannot be read is passed over; but as the last file it fails the load, unless there is an
  // extra directory.
  ASSERT_EQ(mkfifo(global.File("acl/aa.acl").c_str(), 0600), 0);
  EXPECT_EQ(Load(), ".ab");
  WriteAcl("c", "broken");
  EXPECT_EQ(Load(), kNotFound);
  EXPECT_EQ(Load(extra), ".abx");

  VeskConf::SetGlobalDirectory("");
  EXPECT_EQ(Load(), kNotFound);
  EXPECT_EQ(Load(extra), ".x");
}

TEST_F(AclStore, InstallAddsWhatIsMissing) {
  WriteAcl("a", Entry("a"));
  other.Write("a.acl", Entry("new"));   // the name is another trust root's
  other.Write("same.acl", Entry("a"));  // the tag is there
  other.Write("x.acl", Entry("x"));
  EXPECT_EQ(Install(other.Path()), 0);
  EXPECT_EQ(Load(), ".ax");
  EXPECT_EQ(global.Read("acl/a.acl"), Entry("a"));
  EXPECT_EQ(global.Read("acl/x.acl"), Entry("x"));
  for (const std::string& dir : {other.Path() + "/", global.File("acl"), std::string("/none")}) {
    EXPECT_EQ(Install(dir), 0);
    EXPECT_EQ(Load(), ".ax");
  }
}

TEST_F(AclStore, InstallIntoAnEmptyStore) {
  // Only entries of the store are compared: two new ones of one tag are both installed.
  other.Write("deep/er/a.acl", Entry("same"));
  other.Write("deep/er/b.acl", Entry("same"));
  for (const char* root : {"", "/nonexistent", global.Path().c_str()}) {
    VeskConf::SetGlobalDirectory(root);
    EXPECT_EQ(Install(other.File("deep/er")), 0);
  }
  EXPECT_FALSE(std::filesystem::exists("acl"));
  EXPECT_EQ(Names("acl").size(), 14U);  // both, and nothing else
  EXPECT_EQ(Load(), ".samesame");
}

}  // namespace
}  // namespace vesk2test

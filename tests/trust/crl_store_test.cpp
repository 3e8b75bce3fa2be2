#include <sys/resource.h>
#include <sys/stat.h>

#include <csignal>

#include "tests/trust/trust_test.h"

namespace vesk2test {
namespace {

constexpr char kNear[] = "3000-01-01_00:00:00";

std::string Root(const std::string& tag) { return AclEntryText(KeyText(0), tag); }
std::string Sequence(const std::string& tag, const std::string& begin = kPast,
                     const std::string& end = kFuture, unsigned key = 0) {
  return CrlSequenceText(key, tag, CrlText(Item(HashOf("item")), ""), begin, end);
}

class CrlStore : public TrustTest {
 protected:
  // Offers a sequence to a store that trusts `root` for its tag.
  int Offer(const std::string& text, const std::string& tag, unsigned root = 0) {
    return Read<CrlSequence>(text)->UpdateStore(Acls({AclEntryText(KeyText(root), tag)}).get());
  }
  int ImportDir(Ref<SExpression>& list) {
    return CrlSequence::ImportDir(list.Out(), other.Path().c_str(), StorageGlobal, nullptr);
  }
  int ImportDirAndStore() { return CrlSequence::ImportDirAndStore(other.Path().c_str(), nullptr); }
};

TEST_F(CrlStore, TagsNameFiles) {
  const struct {
    std::string tag, file;
    int code;
  } cases[] = {
      {Tag("sym (revoke x)"), "<sym (revoke x).crl>", 0},
      {Tag("a/b (revoke x)"), "<a%2Fb (revoke x).crl>", 0},
      {Tag("../../x (revoke)"), "<..%2F..%2Fx (revoke).crl>", 0},
      {Tag(std::string(241, 'n') + " (revoke)"), "<" + std::string(241, 'n') + " (revoke).crl>", 0},
      {Tag(std::string(242, 'n') + " (revoke)"), "", VESK2_ERR_INVALID_PARAM},
      {Tag(std::string("sym\0x (revoke x)", 16)), "", VESK2_ERR_INVALID_PARAM},
      {"(3:foo1:a(6:revoke))", "", VESK2_ERR_INVALID_PARAM},
      {Tag(".."), "", 0},  // not in the store
  };
  for (const auto& c : cases) {
    SCOPED_TRACE(c.tag);
    EXPECT_EQ(Offer(Sequence(c.tag), c.tag), c.code);
    EXPECT_EQ(Names("cert"), c.file);
    // What was stored is what is loaded for a root with that tag.
    Ref<SExpression> store;
    EXPECT_EQ(CrlSequence::ImportStore(store.Out(), Acls({Root(c.tag)}).get(), nullptr), 0);
    EXPECT_EQ(store->Count(), c.file.empty() ? 0U : 1U);
    std::filesystem::remove_all(global.File("cert"));
    std::filesystem::create_directory(global.File("cert"));
  }
}

TEST_F(CrlStore, UpdateRules) {
  const std::string tag = Tag("sym");
  const std::string twin = "(3:tag5:a b c)";  // reads as the tag (tag a b c) does
  const struct {
    const char* what;
    std::string stored, fresh;
    bool replaces;
  } cases[] = {
      {"later end", Sequence(tag, kPast, kNear), Sequence(tag), true},
      {"same end", Sequence(tag, kMiddle), Sequence(tag), true},
      {"earlier end", Sequence(tag), Sequence(tag, kPast, kNear), false},
      {"not begun", Sequence(tag), Sequence(tag, kFuture, kFarFuture), false},
      {"stored not begun", Sequence(tag, kFuture, kFarFuture), Sequence(tag), true},
      {"no start: begun", Sequence(tag), Sequence(tag, "", kFarFuture), true},
      {"no end", Sequence(tag), Sequence(tag, kPast, ""), false},
      {"stored without end", Sequence(tag, kPast, ""), Sequence(tag), false},
      {"damaged, not begun", "damaged", Sequence(tag, kFuture), true},
      {"unverified", Sequence(tag), Sequence(tag, kPast, kFarFuture, 1), false},
      {"unverified, damaged", "damaged", Sequence(tag, kPast, kFuture, 1), false},
      {"another tag", Sequence(Tag("other")), Sequence(tag, kPast, kFarFuture), false},
  };
  for (const auto& c : cases) {
    global.Write("cert/sym.crl", c.stored);
    EXPECT_EQ(Offer(c.fresh, tag), 0) << c.what;
    EXPECT_EQ(global.Read("cert/sym.crl"), c.replaces ? c.fresh : c.stored) << c.what;
  }
  EXPECT_EQ(Names("cert"), "<sym.crl>");
  EXPECT_EQ(Ref<CrlSequence>(new CrlSequence(nullptr))->UpdateStore(nullptr),
            VESK2_ERR_INVALID_PARAM);
  VeskConf::SetGlobalDirectory("");
  EXPECT_EQ(Offer(Sequence(tag), tag), 0);
}

TEST_F(CrlStore, ReplacesWholeOrNotAtAll) {
  const std::string tag = Tag("sym");
  const std::string old = Sequence(tag, kPast, kNear);
  global.Write("cert/sym.crl", old);
  const auto handler = std::signal(SIGXFSZ, SIG_IGN);
  rlimit limit{};
  ASSERT_EQ(getrlimit(RLIMIT_FSIZE, &limit), 0);
  const rlimit full = {100, limit.rlim_max};  // the disk is full after 100 bytes
  ASSERT_EQ(setrlimit(RLIMIT_FSIZE, &full), 0);
  EXPECT_EQ(Offer(Sequence(tag), tag), 0);
  ASSERT_EQ(setrlimit(RLIMIT_FSIZE, &limit), 0);
  std::signal(SIGXFSZ, handler);
  EXPECT_EQ(global.Read("cert/sym.crl"), old);
  EXPECT_EQ(Names("cert"), "<sym.crl>");

  // A link is replaced, and what it points to left alone.
  const std::string victim = other.Write("victim", "keep");
  std::filesystem::remove(global.File("cert/sym.crl"));
  std::filesystem::create_symlink(victim, global.File("cert/sym.crl"));
  EXPECT_EQ(Offer(old, tag), 0);
  EXPECT_EQ(global.Read("cert/sym.crl"), old);
  EXPECT_EQ(other.Read("victim"), "keep");
}

TEST_F(CrlStore, ImportStorePassesOverWhatCannotBeRead) {
  SExpression* store = nullptr;
  EXPECT_EQ(CrlSequence::ImportStore(store, nullptr, nullptr), VESK2_ERR_FILE_NOT_FOUND);
  EXPECT_EQ(CrlSequence::ImportStore(store, Parse("()").get(), nullptr), VESK2_ERR_INVALID_PARAM);
  for (const char* name : {"a (revoke)", "b (revoke)", "c (revoke)", "d (revoke)", "e"}) {
    WriteAcl(name, Root(Tag(name)));
    global.Write("cert/" + std::string(name) + ".crl", Sequence(Tag(name)));
  }
  global.Write("cert/b (revoke).crl", "damaged");
  std::filesystem::remove(global.File("cert/c (revoke).crl"));
  std::filesystem::remove(global.File("cert/d (revoke).crl"));
  ASSERT_EQ(mkfifo(global.File("cert/d (revoke).crl").c_str(), 0600), 0);
  Ref<SExpression> loaded;  // "e" names no source
  EXPECT_EQ(CrlSequence::ImportStore(loaded.Out(), nullptr, nullptr), 0);
  ASSERT_EQ(loaded->Count(), 1U);
  EXPECT_EQ(Canonical(*loaded->First()), Sequence(Tag("a (revoke)")));
}

TEST_F(CrlStore, FromADirectoryToTheStore) {
  const std::string tag = Tag("a (revoke)");
  Ref<SExpression> list;
  other.Write("0.crl", "damaged");
  other.Write("1.txt", Sequence(tag));
  std::filesystem::create_directory(other.File("2.crl"));
  EXPECT_EQ(ImportDir(list), VESK2_ERR_CRL_NOT_FOUND);
  EXPECT_EQ(ImportDirAndStore(), VESK2_ERR_FILE_NOT_FOUND);  // there is no ACL store
  WriteAcl("a", Root(tag));
  EXPECT_EQ(ImportDirAndStore(), VESK2_ERR_CRL_NOT_FOUND);
  other.Write("3.crl", Sequence(tag));
  other.Write("4.crl", Sequence(Tag("unknown (revoke)")));
  EXPECT_EQ(ImportDir(list), 0);
  EXPECT_EQ(list->Count(), 2U);
  auto* const sequence = dynamic_cast<CrlSequence*>(list->First());
  EXPECT_EQ(sequence->GetStorageType(), StorageGlobal);
  EXPECT_EQ(sequence->GetFileName(), other.File("3.crl"));
  EXPECT_EQ(ImportDirAndStore(), 0);
  EXPECT_EQ(Names("cert"), "<a (revoke).crl>");
  EXPECT_EQ(global.Read("cert/a (revoke).crl"), Sequence(tag));
}

TEST_F(CrlStore, Find) {
  const Ref<SExpression> tag = Parse(Tag("a (revoke)"));
  Ref<CrlSequence> found;
  EXPECT_EQ(CrlSequence::Find(found.Out(), tag.get()), VESK2_ERR_FIND_DIR);
  std::filesystem::create_directory(global.File("cert"));
  EXPECT_EQ(CrlSequence::Find(found.Out(), tag.get()), 0);  // an empty store is a success
  EXPECT_FALSE(found);
  global.Write("cert/0.crl", Sequence(Tag("a (revoke)")));
  global.Write("cert/1.crl", "damaged");
  // The keyword does not count.
  EXPECT_EQ(CrlSequence::Find(found.Out(), Parse("(3:any1:a(6:revoke))").get()), 0);
  EXPECT_EQ(Canonical(found), Sequence(Tag("a (revoke)")));
  CrlSequence* used = found.get();
  EXPECT_EQ(CrlSequence::Find(used, tag.get()), VESK2_ERR_PARAM_NOT_NULL);
  EXPECT_EQ(CrlSequence::Find(found.Out(), nullptr), VESK2_ERR_PARAM_NULL);
  // The last candidate is handed out though it is not the one.
  EXPECT_EQ(CrlSequence::Find(found.Out(), Parse(Tag("b")).get()), VESK2_ERR_ACL_ENTRY_NOT_FOUND);
  EXPECT_TRUE(found);
  VeskConf::SetGlobalDirectory("");
  EXPECT_EQ(CrlSequence::Find(found.Out(), tag.get()), VESK2_ERR_FIND_DIR);
}

}  // namespace
}  // namespace vesk2test

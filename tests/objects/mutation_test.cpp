// Every truncation and every single-bit change of small objects: refused, or read as an object that
// prints as text which reads back the same.
#include <gtest/gtest.h>

#include <vesk2/cert.h>
#include <vesk2/signature.h>

#include "tests/support/test_key.h"
#include "tests/support/test_object.h"
#include "tests/support/test_text.h"

namespace vesk2test {
namespace {

using ZvVesk2::Ref;

template <typename T>
void Mutate(const std::string& text) {
  const auto import = [](const std::string& changed) {
    Ref<T> object(new T(nullptr));
    if (object->Import(Wrap(changed).get()) != 0) object.Reset();
    return object;
  };
  ASSERT_TRUE(import(text));
  for (size_t length = 0; length < text.size(); ++length) {
    EXPECT_FALSE(import(text.substr(0, length))) << length;
  }
  for (size_t bit = 0; bit < text.size() * 8; ++bit) {
    std::string changed = text;
    changed[bit / 8] = static_cast<char>(changed[bit / 8] ^ (1 << bit % 8));
    const Ref<T> object = import(changed);
    if (!object) continue;
    const std::string printed = Canonical(object);
    const Ref<T> again = import(printed);
    ASSERT_TRUE(again) << bit;
    EXPECT_EQ(Canonical(again), printed) << bit;
    EXPECT_TRUE(again->IsEqual(object.get())) << bit;
  }
}

const std::string kKey = "(10:public-key(3:rsa(1:e[bin]1:\3)(1:n[bin]2:\1\1)))";

TEST(MutationTest, Certificate) {
  Mutate<ZvVesk2::Cert>(Cert({.issuer = kKey,
                              .subject = "(6:k-of-n[num]1:\1[num]1:\2" + kKey + kKey + ")",
                              .tag = Tag("(* set read write)"),
                              .propagate = true,
                              .notBefore = "2005-01-01_00:00:00",
                              .notAfter = "2006-01-01_00:00:00",
                              .comment = "why",
                              .revocation = "(10:revocation(6:revoke1:x))",
                              .version = true}));
}

TEST(MutationTest, Signature) {
  Mutate<ZvVesk2::Signature>(List({Str("signature"), HashOf("x", "sha1"), HashOf("y"),
                                   List({Str("rsa-1.5"), Hint("bin", "value")})}));
  Mutate<ZvVesk2::Signature>(TestKey::Dsa(0).Sign("(1:x)"));
}

}  // namespace
}  // namespace vesk2test

// SPDX-License-Identifier: Apache-2.0
// Principals: the keys along a chain, found by what names them. Whoever writes a chain chooses how
// many there are, and a large installation how many entries are asked about.
#ifndef VESK2_SRC_TRUST_PRINCIPALS_H
#define VESK2_SRC_TRUST_PRINCIPALS_H

#include <array>
#include <memory>
#include <span>

#include <vesk2/evidence.h>
#include <vesk2/hash.h>

namespace ZvVesk2 {

// Filled once by Load, and asked as often as needed: each question costs a digest and a search by
// halves.
class Principals {
 public:
  // The issuers of the certificates, and whom the first is for. VESK2_ERR_MEM_ALLOC.
  [[nodiscard]] int Load(const Evidence& evidence);

  // A subject names a key that it is, whose digest it is, or that it counts among its k-of-n. The
  // three answers are about any of the chain, about an issuer, and about an issuer of another
  // certificate than this.
  [[nodiscard]] int Names(bool& named, Subject* subject) const;
  [[nodiscard]] int NamesIssuer(bool& named, Subject* subject) const;
  [[nodiscard]] int NamesOtherIssuer(bool& named, Subject* subject, size_t cert) const;
  // How many keys of a k-of-n are of the chain.
  [[nodiscard]] int CountMembers(size_t& count, ThresholdSubject* subject) const;
  // Whether no certificate before this one has its issuer.
  [[nodiscard]] int IsFirstOf(bool& first, Principal* issuer, size_t cert) const;

 private:
  struct Digest {
    ZvclmHashID algorithm;
    std::array<unsigned char, 32> bytes;  // a shorter one ends in 0
    friend auto operator<=>(const Digest&, const Digest&) = default;
  };
  struct Mark {
    Digest digest;
    // Whose issuer it is; the number of certificates for the subject of the first.
    size_t cert;
  };
  // How a key is known here. Codes of the two: VESK2_ERR_MEM_ALLOC.
  [[nodiscard]] static int DigestOf(bool& known, Digest& digest, DExpression* key,
                                    ZvclmHashID algorithm);
  [[nodiscard]] int Add(DExpression* key, size_t cert);
  [[nodiscard]] int Find(std::span<const Mark>& marks, DExpression* key) const;
  // Runs `matches` on the marks of each key that the subject names, until one matches.
  template <typename Matches>
  [[nodiscard]] int Any(bool& any, Subject* subject, Matches matches) const;

  // Sorted; at most three for each key.
  std::unique_ptr<Mark[]> marks_;
  size_t count_ = 0;
  size_t certs_ = 0;
};

}  // namespace ZvVesk2

#endif  // VESK2_SRC_TRUST_PRINCIPALS_H

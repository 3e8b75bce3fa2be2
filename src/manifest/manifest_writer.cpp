// SPDX-License-Identifier: Apache-2.0
// The writer of manifest files; manifest_reader.cpp and body_parse.cpp hold the form that they
// have. It writes what the readers take, and refuses by form what they would refuse, so that nobody
// signs a manifest that nobody can read. It holds no key: the digest goes out, certificates come
// in.
#include <vesk2/manifest_writer.h>

#include <algorithm>
#include <cstring>
#include <memory>
#include <string_view>

#include <vesk2/ref.h>

#include "src/manifest/signed_digest.h"
#include "src/objects/build.h"
#include "src/platform/file.h"
#include "src/platform/text.h"

namespace ZvVesk2 {
namespace {

// Readers take no stamp of another length.
constexpr unsigned kStampLength = 19;

// The reader's rule; a 0 byte cannot stand in a C string.
bool IsBareName(std::string_view name) {
  return !name.empty() && name != "." && name != ".." && name.find('/') == std::string_view::npos;
}

// Text that grows; what was appended stays when there is no memory for more. A body is as long as
// its tree is large: it grows by doubling.
class GrowingText {
 public:
  size_t length() const { return length_; }
  const char* data() const { return text_.get(); }

  // Makes room for that many bytes more. Everything that can fail, before anything is appended: a
  // call that lacked memory can be made again.
  [[nodiscard]] int Reserve(size_t more) {
    if (more <= capacity_ - length_) return 0;
    const size_t larger = std::max({2 * capacity_, length_ + more, size_t{4096}});
    std::unique_ptr<char[]> text(TryNewArray<char>(larger));
    VESK2_REQUIRE(text, VESK2_ERR_MEM_ALLOC);
    std::copy_n(text_.get(), length_, text.get());
    text_ = std::move(text);
    capacity_ = larger;
    return 0;
  }
  // Appends into the room that was made.
  void Put(std::string_view bytes) {
    std::memcpy(text_.get() + length_, bytes.data(), bytes.size());
    length_ += bytes.size();
  }
  void PutAtom(std::string_view bytes) {
    char digits[24];
    const int count = std::snprintf(digits, sizeof digits, "%zu:", bytes.size());
    Put({digits, static_cast<size_t>(count)});
    Put(bytes);
  }

 private:
  std::unique_ptr<char[]> text_;
  size_t length_ = 0;
  size_t capacity_ = 0;
};

// What an entry takes beside its name: its opening, lengths and a digest, and the parenthesis
// behind it.
constexpr size_t kEntryRoom = 96;

}  // namespace

struct ManifestWriter::Parts {
  explicit Parts(Vesk2ContextStruct* ctx) : context(ctx) {}

  // The room for all of the entry is made first, also for what AddFile appends behind it.
  [[nodiscard]] int Entry(std::string_view opening, const char* name) {
    VESK2_REQUIRE(open > 0 && name != nullptr && IsBareName(name), VESK2_ERR_INVALID_PARAM);
    VESK2_REQUIRE(std::strlen(name) <= Limits::kMaxBodyPath, VESK2_ERR_MAX_BYTE_STRING);
    VESK2_TRY(body.Reserve(std::strlen(name) + kEntryRoom));
    body.Put(opening);
    body.PutAtom(name);
    body.PutAtom("");  // of no meaning to readers
    return 0;
  }

  Vesk2ContextStruct* context;
  ManifestHead head;
  GrowingText body;
  unsigned open = 0;       // directories that are open, the body included
  bool ended = false;      // the body is whole
  Ref<SExpression> certs;  // of pairs: a certificate and its signature
  Ref<SExpression> lists;
};

// A constructor cannot answer: that there was no memory every later call says.
ManifestWriter::ManifestWriter(Vesk2ContextStruct* ctx) : parts_(TryNew<Parts>(ctx)) {}
ManifestWriter::~ManifestWriter() { delete parts_; }

// Made whole, then put in the place of the old one. The stamp is copied, as a caller may go on to
// change it; and without a hint, which would be part of what is signed.
int ManifestWriter::SetHead(const char* creator, TimeStamp* signedAt) {
  VESK2_REQUIRE(parts_ != nullptr, VESK2_ERR_MEM_ALLOC);
  VESK2_REQUIRE(creator != nullptr && signedAt != nullptr, VESK2_ERR_INVALID_PARAM);
  VESK2_REQUIRE(signedAt->GetLength() == kStampLength, VESK2_ERR_TIME_STAMP);
  Vesk2ContextStruct* const ctx = parts_->context;
  ManifestHead head;
  VESK2_TRY(SExpression::Create(head.version.Out(), "version", "1", ctx));
  VESK2_TRY(head.version->Insert(creator));
  VESK2_TRY(SExpression::Create(head.type.Out(), "type", "plain", ctx));
  Ref<TimeStamp> time(TryNew<TimeStamp>(ctx));
  VESK2_REQUIRE(time, VESK2_ERR_MEM_ALLOC);
  VESK2_TRY(time->ByteString::Set(signedAt->GetData(), kStampLength, ByteString::BsNone));
  VESK2_TRY(SExpression::Create(head.time.Out(), "time-of-signing", ctx));
  VESK2_TRY(Append(head.time.get(), std::move(time)));
  parts_->head = std::move(head);
  return 0;
}

// Once a manifest: what was signed must not be begun anew.
int ManifestWriter::BeginBody(const unsigned char (&token)[4]) {
  VESK2_REQUIRE(parts_ != nullptr, VESK2_ERR_MEM_ALLOC);
  VESK2_REQUIRE(parts_->open == 0 && !parts_->ended, VESK2_ERR_INVALID_PARAM);
  VESK2_TRY(parts_->body.Reserve(kEntryRoom));
  parts_->body.Put("(4:body(12:random-token");
  parts_->body.PutAtom({reinterpret_cast<const char*>(token), sizeof token});
  parts_->body.Put(")");
  parts_->open = 1;
  return 0;
}

// Order and doubles are the caller's: the reader sorts.
int ManifestWriter::AddFile(const char* name, const unsigned char (&sha256)[32]) {
  VESK2_REQUIRE(parts_ != nullptr, VESK2_ERR_MEM_ALLOC);
  VESK2_TRY(parts_->Entry("(4:file", name));
  parts_->body.PutAtom({reinterpret_cast<const char*>(sha256), sizeof sha256});
  parts_->body.Put(")");
  return 0;
}

// As deep as readers go. Path lengths are not counted here: readers refuse longer ones.
int ManifestWriter::OpenDirectory(const char* name) {
  VESK2_REQUIRE(parts_ != nullptr, VESK2_ERR_MEM_ALLOC);
  VESK2_REQUIRE(parts_->open < Limits::kMaxDepth, VESK2_ERR_INVALID_PARAM);
  VESK2_TRY(parts_->Entry("(3:dir", name));
  ++parts_->open;
  return 0;
}

int ManifestWriter::CloseDirectory() {
  VESK2_REQUIRE(parts_ != nullptr, VESK2_ERR_MEM_ALLOC);
  VESK2_REQUIRE(parts_->open > 1, VESK2_ERR_INVALID_PARAM);
  VESK2_TRY(parts_->body.Reserve(1));
  parts_->body.Put(")");
  --parts_->open;
  return 0;
}

// All directories must be closed, or the body would end within one.
int ManifestWriter::EndBody() {
  VESK2_REQUIRE(parts_ != nullptr, VESK2_ERR_MEM_ALLOC);
  VESK2_REQUIRE(parts_->open == 1, VESK2_ERR_INVALID_PARAM);
  VESK2_TRY(parts_->body.Reserve(1));
  parts_->body.Put(")");
  parts_->open = 0;
  parts_->ended = true;
  return 0;
}

const char* ManifestWriter::GetBody(size_t* length) const {
  const bool begun = parts_ != nullptr && parts_->body.length() > 0;
  if (length != nullptr) *length = begun ? parts_->body.length() : 0;
  return begun ? parts_->body.data() : nullptr;
}

// Over the bytes that Write will write, and no others.
int ManifestWriter::SignedDigest(Hash*& out, ZvclmHashID id) {
  VESK2_REQUIRE(parts_ != nullptr, VESK2_ERR_MEM_ALLOC);
  VESK2_REQUIRE(out == nullptr && parts_->head.time && parts_->ended, VESK2_ERR_INVALID_PARAM);
  const auto* body = reinterpret_cast<const unsigned char*>(parts_->body.data());
  Ref<Hash> digest;
  VESK2_TRY(ZvVesk2::SignedDigest(digest, id, parts_->head, body, parts_->body.length()));
  out = digest.Release();
  return 0;
}

// Pairs, so that a certificate without its signature can never be written.
int ManifestWriter::AddCertificate(Cert* cert, Signature* signature) {
  VESK2_REQUIRE(parts_ != nullptr, VESK2_ERR_MEM_ALLOC);
  VESK2_REQUIRE(cert != nullptr && signature != nullptr, VESK2_ERR_INVALID_PARAM);
  Ref<SExpression>& certs = parts_->certs;
  // Made with the first; a manifest without lists has none to free.
  if (!certs) certs.Reset(TryNew<SExpression>(parts_->context));
  Ref<SExpression> pair(TryNew<SExpression>(parts_->context));
  VESK2_REQUIRE(certs && pair, VESK2_ERR_MEM_ALLOC);
  VESK2_TRY(Append(pair.get(), Ref<Cert>::Share(cert)));
  VESK2_TRY(Append(pair.get(), Ref<Signature>::Share(signature)));
  return Append(certs.get(), std::move(pair));
}

int ManifestWriter::AddList(CrlSequence* list) {
  VESK2_REQUIRE(parts_ != nullptr, VESK2_ERR_MEM_ALLOC);
  VESK2_REQUIRE(list != nullptr, VESK2_ERR_INVALID_PARAM);
  Ref<SExpression>& lists = parts_->lists;
  if (!lists) lists.Reset(TryNew<SExpression>(parts_->context));
  VESK2_REQUIRE(lists, VESK2_ERR_MEM_ALLOC);
  return Append(lists.get(), Ref<CrlSequence>::Share(list));
}

namespace {

// A short write is an error here, and not a shorter manifest.
[[nodiscard]] int Print(FILE* stream, std::string_view text) {
  const bool written = ZVsysutil::zv_write(stream, text.data(), text.size()) == text.size();
  return written ? 0 : VESK2_ERR_WRITE_FILE;
}

[[nodiscard]] int PrintElements(FILE* stream, const SExpression* list) {
  if (list == nullptr) return 0;
  for (auto it = list->Begin(); it; it.Next()) VESK2_TRY(it.Value()->PrintCanonical(stream));
  return 0;
}

}  // namespace

// May be called again: nothing is used up. Two certificates at least: the signer's own is what
// makes the first worth anything.
int ManifestWriter::Write(FILE* stream) {
  VESK2_REQUIRE(parts_ != nullptr, VESK2_ERR_MEM_ALLOC);
  const Parts& parts = *parts_;
  VESK2_REQUIRE(stream != nullptr && parts.head.time && parts.ended, VESK2_ERR_INVALID_PARAM);
  VESK2_REQUIRE(parts.certs && parts.certs->Count() >= 2, VESK2_ERR_INVALID_PARAM);
  VESK2_TRY(Print(stream, "(8:manifest"));
  VESK2_TRY(parts.head.version->PrintCanonical(stream));
  VESK2_TRY(parts.head.type->PrintCanonical(stream));
  VESK2_TRY(Print(stream, "(15:signature-block"));
  VESK2_TRY(parts.head.time->PrintCanonical(stream));
  for (auto it = parts.certs->Begin(); it; it.Next()) {
    VESK2_TRY(PrintElements(stream, static_cast<SExpression*>(it.Value())));
  }
  VESK2_TRY(Print(stream, ")(3:crl"));
  VESK2_TRY(PrintElements(stream, parts.lists.get()));
  VESK2_TRY(Print(stream, ")"));
  VESK2_TRY(Print(stream, {parts.body.data(), parts.body.length()}));
  return Print(stream, ")");
}

}  // namespace ZvVesk2

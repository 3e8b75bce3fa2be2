// SPDX-License-Identifier: Apache-2.0
// The reader of manifest bodies:
//
//   (4:body(12:random-token<4 bytes>)<entry>...)
//   (4:file<name><ignored><digest of 32 bytes>)      (3:dir<name><ignored><entry>...)
//
// The text comes from whoever signed the manifest, and every name in it becomes a path that is
// opened: names that are not one plain component are refused. A signed listing is a stranger's all
// the same: sizes, depth and names are bounded as they are read (limits.h). A listing of a million
// files is read through here, so that a byte string is looked at where it stands, without an
// object.
#include <cstring>
#include <string_view>

#include <vesk2/expression.h>
#include <vesk2/manifest_body.h>
#include <vesk2/ref.h>

#include "src/frame/check.h"
#include "src/objects/build.h"
#include "src/platform/text.h"

namespace ZvVesk2 {
namespace {

using ZVsysutil::zv_filenamencmp;

constexpr unsigned kTokenLength = 4;
constexpr unsigned kDigestLength = 32;
constexpr char kSeparator = '/';

// A view of no bytes has no pointer to be followed.
std::string_view Text(const unsigned char* bytes, size_t length) {
  if (length == 0) return {};
  return {reinterpret_cast<const char*>(bytes), length};
}

// A byte string that is read where it stands if it has no hint, as nearly all have none: a listing
// has three for each file. All others, and all that is wrong, are an object's to read.
class ReadString {
 public:
  [[nodiscard]] int Import(ZvBuffer* buffer, Vesk2ContextStruct* ctx) {
    if (ReadInPlace(*buffer)) return 0;
    VESK2_TRY(ImportNew(read_, buffer, ctx));
    text_ = ZvVesk2::Text(read_->GetData(), read_->GetLength());
    return 0;
  }
  // Lives as long as this and the buffer.
  std::string_view Text() const { return text_; }

 private:
  // "<digits>:<bytes>"
  //
  // Takes exactly what ByteString::Import takes without a hint. What it does not take is left to
  // that one, untouched, for the code that it gives.
  bool ReadInPlace(ZvBuffer& buffer) {
    const unsigned char* const bytes = buffer.Data();
    const size_t left = buffer.Remaining();
    size_t digits = 0;
    size_t length = 0;
    for (; digits < left && digits < Limits::kMaxLengthDigits; ++digits) {
      if (bytes[digits] < '0' || bytes[digits] > '9') break;
      length = length * 10 + (bytes[digits] - '0');
    }
    if (digits == left || bytes[digits] != ':' || length > Limits::kMaxByteString) return false;
    if (length > left - digits - 1) return false;
    text_ = ZvVesk2::Text(bytes + digits + 1, length);
    buffer.Skip(digits + 1 + length);
    return true;
  }

  std::string_view text_;
  Ref<ByteString> read_;
};

// Every name becomes part of a path: with ".." or "/" a signer could have files outside the tree
// read, and told about; with a 0 byte the path would end before the name does.
bool IsBareName(std::string_view name) {
  return !name.empty() && name != "." && name != ".." &&
         name.find(kSeparator) == std::string_view::npos &&
         name.find('\0') == std::string_view::npos;
}

// The part of an ignored path that names something directly inside `directory` or below it; null
// when the path lies elsewhere. `directory` may end in a separator: callers pass what they were
// given. "lib" does not hold "library/x": behind the directory's name a separator must stand, or
// the end of a name that brought one.
const char* RestInside(const char* directory, const char* path) {
  const size_t length = directory != nullptr ? std::strlen(directory) : 0;
  if (length == 0) return path;
  if (zv_filenamencmp(path, directory, length) != 0) return nullptr;
  const char* rest = path + length;
  if (directory[length - 1] != kSeparator && *rest++ != kSeparator) return nullptr;
  return *rest != '\0' ? rest : nullptr;
}

}  // namespace

// The token makes two signatures over equal trees differ. Its length is all that is asked of it.
int BodyDirectory::ParseBody(ZvBuffer* buffer, PointerArray<char>* ignoreList) {
  VESK2_REQUIRE(buffer != nullptr, VESK2_ERR_PARAM_NULL);
  VESK2_TRY(buffer->Expect("(4:body(12:random-token"));
  Ref<ByteString> token;
  VESK2_TRY(ImportNew(token, buffer, GetContext()));
  VESK2_REQUIRE(token->GetLength() == kTokenLength, VESK2_ERR_RANDOM_TOKEN);
  VESK2_TRY(buffer->Expect(")"));
  return ParseDir(buffer, ignoreList);
}

int BodyDirectory::ParseDir(ZvBuffer* buffer, PointerArray<char>* ignoreList) {
  VESK2_REQUIRE(buffer != nullptr, VESK2_ERR_PARAM_NULL);
  return ParseEntries(buffer, ignoreList, 1, 0);
}

// Depth counts directories, the root's being 1. The lists are sorted when they are whole: signers
// write them in any order, and whoever compares walks them side by side.
int BodyDirectory::ParseEntries(ZvBuffer* buffer, PointerArray<char>* ignoreList, unsigned depth,
                                size_t length) {
  VESK2_REQUIRE(depth <= Limits::kMaxDepth, VESK2_ERR_PARSE_FILE);
  // The end of the text ends the loop too, and then the ")" is missing.
  while (buffer->Peek() != ')' && buffer->Peek() >= 0) {
    VESK2_TRY(ParseEntry(buffer, ignoreList, depth, length));
  }
  VESK2_TRY(buffer->Expect(")"));
  subdirectories.sort(BodyObject::Cmp);
  files.sort(BodyObject::Cmp);
  return ignoreList != nullptr ? CollectIgnored(ignoreList) : 0;
}

// There are two kinds, and no third is passed over: a reader that did would let a signer list what
// nobody compares.
int BodyDirectory::ParseEntry(ZvBuffer* buffer, PointerArray<char>* ignoreList, unsigned depth,
                              size_t length) {
  if (buffer->Accept("(3:dir")) return ParseSubdirectory(buffer, ignoreList, depth + 1, length);
  VESK2_TRY(buffer->Expect("(4:file"));
  return ParseFile(buffer, length);
}

// Reads an entry's name and the byte string after it, whose meaning is the signer's. `length` is
// that of the directory's path within the body, and becomes the entry's. The second byte string is
// read and not kept, whatever it says.
int BodyDirectory::ParseName(ZvBuffer* buffer, std::unique_ptr<char[]>& bare, size_t& length) {
  ReadString string;
  VESK2_TRY(string.Import(buffer, GetContext()));
  const std::string_view text = string.Text();
  VESK2_REQUIRE(IsBareName(text), VESK2_ERR_PARSE_FILE);
  // Counted from the body's root: where the tree lies has no say in what is well-formed.
  length += (length > 0 ? 1 : 0) + text.size();
  VESK2_REQUIRE(length <= Limits::kMaxBodyPath, VESK2_ERR_PARSE_FILE);
  bare.reset(TryNewArray<char>(text.size() + 1));
  VESK2_REQUIRE(bare, VESK2_ERR_MEM_ALLOC);
  bare[text.copy(bare.get(), text.size())] = '\0';
  ReadString ignoredString;
  return ignoredString.Import(buffer, GetContext());
}

// A file keeps its bare name: joined paths of a million files would take more memory than all the
// rest.
int BodyDirectory::ParseFile(ZvBuffer* buffer, size_t length) {
  std::unique_ptr<char[]> bare;
  VESK2_TRY(ParseName(buffer, bare, length));
  ReadString digest;
  VESK2_TRY(digest.Import(buffer, GetContext()));
  std::unique_ptr<BodyFile> file(TryNew<BodyFile>(GetContext()));
  VESK2_REQUIRE(file, VESK2_ERR_MEM_ALLOC);
  file->SetName(bare.release());
  // One algorithm, known by its length: another digest is another format and not a file that
  // differs.
  VESK2_REQUIRE(digest.Text().size() == kDigestLength, VESK2_ERR_UNKNOWN_HASH_ID);
  file->SetHash(reinterpret_cast<const unsigned char*>(digest.Text().data()));
  VESK2_TRY(buffer->Expect(")"));
  VESK2_REQUIRE(files.push(file.get()), VESK2_ERR_MEM_ALLOC);
  static_cast<void>(file.release());
  return 0;
}

// A directory keeps its path, since results name it so and names below are made of it. Its length
// is bounded by kMaxBodyPath, so that a deep tree costs at most its square.
int BodyDirectory::ParseSubdirectory(ZvBuffer* buffer, PointerArray<char>* ignoreList,
                                     unsigned depth, size_t length) {
  std::unique_ptr<char[]> bare;
  VESK2_TRY(ParseName(buffer, bare, length));
  std::unique_ptr<BodyDirectory> directory(TryNew<BodyDirectory>(GetContext()));
  VESK2_REQUIRE(directory, VESK2_ERR_MEM_ALLOC);
  directory->SetName(ZVsysutil::zv_join_path(GetName(), bare.get()));
  VESK2_REQUIRE(directory->GetName() != nullptr, VESK2_ERR_MEM_ALLOC);
  VESK2_TRY(directory->ParseEntries(buffer, ignoreList, depth, length));
  VESK2_REQUIRE(subdirectories.push(directory.get()), VESK2_ERR_MEM_ALLOC);
  static_cast<void>(directory.release());
  return 0;
}

// Picks the names to ignore inside this directory out of the sorted list, where the paths below one
// directory stand together. Each directory walks the list up to its own run, directories times
// ignored names in all: the latter are what a caller wrote, and few.
int BodyDirectory::CollectIgnored(PointerArray<char>* ignoreList) {
  bool found = false;
  for (const char* path = ignoreList->begin(); path != nullptr; path = ignoreList->next()) {
    const char* const rest = RestInside(GetName(), path);
    if (rest == nullptr && found) break;
    if (rest == nullptr) continue;
    found = true;
    // It lies further down, and is picked up there.
    if (std::strchr(rest, kSeparator) != nullptr) continue;
    std::unique_ptr<char[]> copy(ZVsysutil::zv_fstrdup(rest));
    VESK2_REQUIRE(copy && ignored.push(copy.get()), VESK2_ERR_MEM_ALLOC);
    static_cast<void>(copy.release());
  }
  return 0;
}

}  // namespace ZvVesk2

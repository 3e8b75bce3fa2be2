// SPDX-License-Identifier: Apache-2.0
// manifest_body.h: the body of a manifest, a directory tree with the SHA-256 of every file:
//
//   (body (random-token <4 bytes>) <entry>...)
//   (file <name> <ignored> <digest>)      (dir <name> <ignored> <entry>...)
//
// Names are bare: an empty one, ".", "..", or one with "/" or a 0 byte is refused, so that a body
// cannot reach outside its tree. Names are bytes, in no encoding, and compared as bytes. <ignored>
// may be any byte string, and says nothing.
//
//   BodyDirectory root(nullptr);
//   const int code = root.ParseBody(body, nullptr);       body: of Manifest::ReadManifest
//   for (BodyObject* f = root.GetFiles().begin(); f != nullptr; f = root.GetFiles().next()) ...
#ifndef VESK2_MANIFEST_BODY_H
#define VESK2_MANIFEST_BODY_H

#include <vesk2/platform.h>
#include <vesk2/pointer_array.h>

#include <memory>

namespace ZvVesk2 {

// BodyObject is an entry of a body, or of a directory on disk: a name, and whether it is a
// directory. It is owned by the directory that lists it. It is not counted; the classes of bodies
// may lie on the stack.
class VESK2_API BodyObject {
 public:
  // Status of a result record; each is a bit.
  enum Status : uint32_t { StatusNone = 0, Valid = 1, Invalid = 2, Missing = 4, Extra = 8 };

  // Made without a name, a status or a digest; `ctx` may be null.
  explicit BodyObject(Vesk2ContextStruct* ctx);
  virtual ~BodyObject();
  BodyObject(const BodyObject&) = delete;
  BodyObject& operator=(const BodyObject&) = delete;

  // Cmp orders two BodyObject* (given by address) by name, bytewise; one without a name comes last.
  // For PointerArray::sort.
  [[nodiscard]] static int Cmp(const void* a, const void* b);

  // The name, borrowed, or null: of a file its bare name, of a directory its path (see
  // BodyDirectory). The status and the kind as they were set.
  const char* GetName() const;
  // One of Status; entries of a body have none until a comparison sets it.
  uint32_t GetStatus() const;
  // True for each BodyDirectory, and for what was set so.
  bool GetIsDirectory() const;
  Vesk2ContextStruct* GetContext() const;

  // Adopts `owned`, an array from new[], or null. A change of names does not sort the list that the
  // object stands in.
  void SetName(char* owned);
  // A Status, and whether it is a directory: for who makes or compares entries.
  void SetStatus(uint32_t value);
  void SetIsDirectory(bool value);
  // Hands the name to the caller, an array to be released with Vesk2Free; the object has none then.
  [[nodiscard]] char* TakeName();

 private:
  Vesk2ContextStruct* context;
  std::unique_ptr<char[]> name;
  uint32_t status = StatusNone;
  bool isDirectory = false;
};

// BodyFile is a file with the SHA-256 of its content.
class VESK2_API BodyFile : public BodyObject {
 public:
  // A file without a digest, which equals no digest but an empty one.
  explicit BodyFile(Vesk2ContextStruct* ctx);
  ~BodyFile() override;

  // Whether the digest, of `length` bytes, is this file's. The other form compares with another
  // file: false for null and for what is no BodyFile.
  bool Equal(const unsigned char* digest, int length) const;
  // Whether it is a BodyFile with the same digest.
  bool Equal(const BodyObject* other) const;  // a BodyFile
  // Copies a digest of exactly 32 bytes.
  void SetHash(const unsigned char* digest);

  // 32 once there is a digest, else 0; and its bytes, borrowed.
  uint32_t GetHashLength() const;
  // The bytes of the digest, borrowed; zeros when there is none.
  const unsigned char* GetHash() const;

 private:
  uint32_t hashLength = 0;
  unsigned char hash[32] = {};
};

// A directory's name is a path: the parent's joined with its own. The root of a verification is
// named by the directory verified; the roots of a comparison have no name. A directory owns its
// entries.
class VESK2_API BodyDirectory : public BodyObject {
 public:
  // A directory without a name or entries. Name it before it is read: the names below are made from
  // its own.
  explicit BodyDirectory(Vesk2ContextStruct* ctx);
  ~BodyDirectory() override;

  // ParseBody reads a whole body into this directory, ParseDir the entries up to and including the
  // closing ")". `ignoreList`, sorted paths that begin with this directory's name, may be null;
  // what of it lies directly in a directory is copied into that directory's GetIgnored. Children
  // end up sorted by name; one name may be listed more than once. What follows the body is left
  // unread. After a failure some entries are there: destroy the object.
  //   VESK2_ERR_PARAM_NULL       no buffer
  //   VESK2_ERR_RANDOM_TOKEN     a token that is not of 4 bytes
  //   VESK2_ERR_PARSE_FILE       another form; also: a name that is refused, a path of over
  //                              Limits::kMaxBodyPath bytes within the body, directories nested
  //                              over Limits::kMaxDepth levels
  //   VESK2_ERR_UNKNOWN_HASH_ID  a digest that is not of 32 bytes
  //   VESK2_ERR_MAX_BYTE_STRING  a string that is too long
  //   VESK2_ERR_MEM_ALLOC        memory ran out
  [[nodiscard]] int ParseBody(ZvBuffer* buffer, PointerArray<char>* ignoreList);
  [[nodiscard]] int ParseDir(ZvBuffer* buffer, PointerArray<char>* ignoreList);

  // The entries, of BodyFile and BodyDirectory, and the bare names that are ignored here; borrowed.
  // Each array has a cursor of its own, which whoever walks it moves.
  PointerArray<BodyObject>& GetFiles();
  PointerArray<BodyObject>& GetSubdirectories();
  // Sorted bare names. Each ignores one listing of its name.
  PointerArray<char>& GetIgnored();

 private:
  // The parts of the reader, one for each of the forms above. `depth` is that of the directory, the
  // root's 1; `length` the bytes of its path within the body, which a name is added to.
  [[nodiscard]] VESK2_LOCAL int ParseEntries(ZvBuffer* buffer, PointerArray<char>* ignoreList,
                                             unsigned depth, size_t length);
  [[nodiscard]] VESK2_LOCAL int ParseEntry(ZvBuffer* buffer, PointerArray<char>* ignoreList,
                                           unsigned depth, size_t length);
  [[nodiscard]] VESK2_LOCAL int ParseName(ZvBuffer* buffer, std::unique_ptr<char[]>& bare,
                                          size_t& length);
  [[nodiscard]] VESK2_LOCAL int ParseFile(ZvBuffer* buffer, size_t length);
  [[nodiscard]] VESK2_LOCAL int ParseSubdirectory(ZvBuffer* buffer, PointerArray<char>* ignoreList,
                                                  unsigned depth, size_t length);
  [[nodiscard]] VESK2_LOCAL int CollectIgnored(PointerArray<char>* ignoreList);

  PointerArray<BodyObject> files;
  PointerArray<BodyObject> subdirectories;
  PointerArray<char> ignored;
};

}  // namespace ZvVesk2

#endif  // VESK2_MANIFEST_BODY_H

// SPDX-License-Identifier: Apache-2.0
// manifest_body.h: the body of a manifest, a directory tree with the SHA-256 of every file:
//
//   (body (random-token <4 bytes>) <entry>...)
//   (file <name> <ignored> <digest>)      (dir <name> <ignored> <entry>...)
//
// Names are bare: an empty one, ".", "..", or one with "/" or a 0 byte is refused, so that a body
// cannot reach outside its tree.
#ifndef VESK2_MANIFEST_BODY_H
#define VESK2_MANIFEST_BODY_H

#include <vesk2/platform.h>
#include <vesk2/pointer_array.h>

#include <memory>

namespace ZvVesk2 {

class VESK2_API BodyObject {
 public:
  // Status of a result record.
  enum Status : uint32_t { StatusNone = 0, Valid = 1, Invalid = 2, Missing = 4, Extra = 8 };

  explicit BodyObject(Vesk2ContextStruct* ctx);
  virtual ~BodyObject();
  BodyObject(const BodyObject&) = delete;
  BodyObject& operator=(const BodyObject&) = delete;

  // Cmp orders two BodyObject* (given by address) by name, bytewise; one without a name comes last.
  [[nodiscard]] static int Cmp(const void* a, const void* b);

  const char* GetName() const;
  uint32_t GetStatus() const;
  bool GetIsDirectory() const;
  Vesk2ContextStruct* GetContext() const;

  // Adopts `owned`, an array from new[].
  void SetName(char* owned);
  void SetStatus(uint32_t value);
  void SetIsDirectory(bool value);
  // Hands the name to the caller.
  [[nodiscard]] char* TakeName();

 private:
  Vesk2ContextStruct* context;
  std::unique_ptr<char[]> name;
  uint32_t status = StatusNone;
  bool isDirectory = false;
};

class VESK2_API BodyFile : public BodyObject {
 public:
  explicit BodyFile(Vesk2ContextStruct* ctx);
  ~BodyFile() override;

  bool Equal(const unsigned char* digest, int length) const;
  bool Equal(const BodyObject* other) const;  // a BodyFile
  // Stores a digest of exactly 32 bytes.
  void SetHash(const unsigned char* digest);

  uint32_t GetHashLength() const;
  const unsigned char* GetHash() const;

 private:
  uint32_t hashLength = 0;
  unsigned char hash[32] = {};
};

// A directory's name is a path: the parent's joined with its own. The root of a verification is
// named by the directory verified; the roots of a comparison have no name.
class VESK2_API BodyDirectory : public BodyObject {
 public:
  explicit BodyDirectory(Vesk2ContextStruct* ctx);
  ~BodyDirectory() override;

  // ParseBody reads a whole body into this directory, ParseDir the entries up to and including the
  // closing ")". `ignoreList`, sorted paths, may be null. Children end up sorted by name.
  //   VESK2_ERR_PARAM_NULL, VESK2_ERR_RANDOM_TOKEN, VESK2_ERR_PARSE_FILE (also: a name that is
  //   refused, a path of over 4096 bytes within the body, nested too deeply),
  //   VESK2_ERR_UNKNOWN_HASH_ID (a digest that is not of 32 bytes), VESK2_ERR_MAX_BYTE_STRING,
  //   VESK2_ERR_MEM_ALLOC.
  [[nodiscard]] int ParseBody(ZvBuffer* buffer, PointerArray<char>* ignoreList);
  [[nodiscard]] int ParseDir(ZvBuffer* buffer, PointerArray<char>* ignoreList);

  PointerArray<BodyObject>& GetFiles();
  PointerArray<BodyObject>& GetSubdirectories();
  PointerArray<char>& GetIgnored();

 private:
  // `length` is that of this directory's path within the body.
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

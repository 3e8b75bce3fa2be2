// SPDX-License-Identifier: Apache-2.0
// expression.h: the value model. Every object of the library is an S-expression: a byte string
// (ByteString) or a list (SExpression), both counted DExpressions.
//
// Reference counting: a value starts with one reference, its creator's. IncrementRefCount adds a
// holder, Free takes one away and destroys the value with the last; nothing else releases values.
// Ref<T> (vesk2/ref.h) does this by scope. A list owns one reference to each element; accessors
// return borrowed pointers, valid as long as the list holds the element. Counts are plain integers:
// a value belongs to one thread.
//
// Arguments, in every header: what a call shares, it counts for itself, and the caller keeps the
// reference that it had. What a call takes over, a reference or an array, belongs to the callee
// after success only: after a failure it is the caller's as before. What a call adopts belongs to
// the callee from the call on, whatever it answers.
//
// Two encodings. Canonical: a list is "(" elements ")", a byte string its length in decimal, ":"
// and the bytes; the stream form puts a display hint "[bin]", "[utf-8]" or "[num]" before the
// length. Advanced: bare words separated by blanks, for text that people type and read; it has no
// quoting, so what is written need not read back.
//
// Factories are static and take a reference to a null pointer; it is null again after a failure,
// with everything half-built released. Lists nest at most Limits::kMaxDepth levels in every reader;
// one that a caller builds deeper can be freed, and is refused by whatever walks it.
#ifndef VESK2_EXPRESSION_H
#define VESK2_EXPRESSION_H

#include <vesk2.h>
#include <vesk2/limits.h>
#include <vesk2/platform.h>

#include <cstddef>
#include <cstdint>
#include <cstdio>
#include <new>

struct ZVCLMHashContextData;

namespace ZvVesk2 {

// Where an object is stored. Fixed underlying type: callers may pass other values, which mean the
// home store except where a function says otherwise.
enum StorageType : int32_t {
  StorageHome = 0,    // below the home directory
  StorageGlobal = 1,  // below the global directory
  StoragePath = 2,    // the name given is the path
};

// ---- DExpression -------------------------------------------------------------------------------

class VESK2_API DExpression {
 public:
  // new has the library take the memory, as much as the class needs there: a program may have been
  // compiled when it needed less.
  static void* operator new(size_t size);
  static void* operator new(size_t size, const std::nothrow_t&) noexcept;
  static void operator delete(void* object);

  explicit DExpression(Vesk2ContextStruct* context);
  DExpression(const DExpression&) = delete;
  DExpression& operator=(const DExpression&) = delete;

 protected:
  virtual ~DExpression();

 public:
  // UpdateHash feeds the canonical bytes to a running hash, display hints in their short form first
  // unless `ignoreHints`. Returns 0, the crypto layer's code (1001 to 1070), or
  // VESK2_ERR_BUFFER_OVERFLOW for lists nested too deeply.
  [[nodiscard]] virtual int UpdateHash(ZVCLMHashContextData* hash, bool ignoreHints) = 0;
  // CanonicalLength is the number of bytes of the canonical encoding without hints; UINT_MAX when
  // that is more, and for lists nested too deeply.
  virtual unsigned int CanonicalLength() = 0;
  // AdvancedLength is a buffer size, terminator included, that ExportAdvanced surely fits in; it is
  // larger than the text. UINT_MAX as above.
  virtual unsigned int AdvancedLength() = 0;
  // Export appends the canonical encoding, without hints, to `buf` of `size` bytes at `pos`, which
  // moves on. A list needs one byte of room beyond its ")" and does not report its elements'
  // results.
  //   VESK2_ERR_INVALID_PARAM (null buf), VESK2_ERR_BUFFER_OVERFLOW (no room, nested too deeply).
  [[nodiscard]] virtual int Export(unsigned char* buf, unsigned int& pos, unsigned int size) = 0;
  // ExportAdvanced appends the advanced text and a terminating 0, which is not counted in `pos`.
  // Errors as in Export.
  [[nodiscard]] virtual int ExportAdvanced(unsigned char* buf, unsigned int& pos,
                                           unsigned int size) = 0;
  // PrintAdvanced passes the text, piece by piece, to `write`, whose results are ignored. At depth
  // 0 or below the outermost parentheses are left out. Byte strings print by hint: none, the bytes
  // if all are printable, else nothing; bin nothing; utf-8 the bytes; num the first byte in
  // decimal. Always 0; the text ends where lists nest too deeply.
  [[nodiscard]] virtual int PrintAdvanced(int (*write)(const char* text, unsigned int length,
                                                       void* user),
                                          void* user, int depth) = 0;
  // PrintCanonical writes the canonical encoding with hints to a stream, which a list flushes at
  // its end. A short write or a failing flush gives VESK2_ERR_WRITE_FILE; a null stream
  // VESK2_ERR_PARAM_NULL for a byte string and VESK2_ERR_INVALID_PARAM for a list; lists nested too
  // deeply VESK2_ERR_BUFFER_OVERFLOW.
  [[nodiscard]] virtual int PrintCanonical(FILE* stream) = 0;
  virtual bool IsSExpression() const = 0;

  void IncrementRefCount();
  void Free();

  // IsEqual tells whether both have the same canonical encoding without hints. False for null; a
  // list nested too deeply equals nothing, not even itself.
  bool IsEqual(DExpression* other);

  // ComputeHash makes a new array with the digest of the canonical bytes; free it with Vesk2Free.
  // `digest` must be null (VESK2_ERR_INVALID_PARAM) and is null again after a failure.
  [[nodiscard]] int ComputeHash(unsigned char*& digest, unsigned int& digestLength, ZvclmHashID id,
                                bool ignoreHints);

  // Expect matches `text` in the memory readers. An index runs from `pos` to the length of `text`,
  // and each text[i] is compared with buf[pos + i]: so a one-character text is compared at position
  // 0 only, and elsewhere the byte at `pos` is consumed whatever it is. Which inputs the memory
  // readers accept rests on this. VESK2_ERR_INVALID_PARAM, VESK2_ERR_BUFFER_OVERFLOW,
  // VESK2_ERR_UNEXPECTED_CHAR.
  [[nodiscard]] static int Expect(const char* text, const unsigned char* buf, unsigned int size,
                                  unsigned int& pos);

  Vesk2ContextStruct* GetContext() const;
  int32_t GetRefCount() const;
  // The context's crypto handle, 0 without a context.
  uint32_t CryptoHandle() const;

 private:
  int32_t refCount = 1;
  Vesk2ContextStruct* context;
};

// ---- ByteString --------------------------------------------------------------------------------

class VESK2_API ByteString : public DExpression {
 public:
  // Display hints.
  enum BsType : int32_t { BsNone = 0, BsBin = 1, BsUtf8 = 2, BsNum = 3 };

  explicit ByteString(Vesk2ContextStruct* context);
  // Adopts `data`, an array from new[], without copying.
  ByteString(unsigned char* data, unsigned int length, BsType type, Vesk2ContextStruct* context);

 protected:
  ~ByteString() override;

 public:
  [[nodiscard]] int UpdateHash(ZVCLMHashContextData* hash, bool ignoreHints) override;
  unsigned int CanonicalLength() override;
  unsigned int AdvancedLength() override;
  [[nodiscard]] int Export(unsigned char* buf, unsigned int& pos, unsigned int size) override;
  [[nodiscard]] int ExportAdvanced(unsigned char* buf, unsigned int& pos,
                                   unsigned int size) override;
  [[nodiscard]] int PrintAdvanced(int (*write)(const char* text, unsigned int length, void* user),
                                  void* user, int depth) override;
  [[nodiscard]] int PrintCanonical(FILE* stream) override;
  bool IsSExpression() const override;
  // ToString returns a new 0-terminated copy, cut at a 0 byte; free it with Vesk2Free. Null without
  // memory.
  virtual char* ToString();

  // Set copies `length` bytes (1 to 8192). VESK2_ERR_INVALID_PARAM for null or no bytes,
  // VESK2_ERR_MAX_BYTE_STRING, VESK2_ERR_MEM_ALLOC (the string is then empty). The array is kept
  // when the old length is at most 7 bytes larger than the new one.
  [[nodiscard]] int Set(const unsigned char* data, unsigned int length, BsType type);
  [[nodiscard]] int Set(const char* text, BsType type);

  // IsEqual compares the bytes with a 0-terminated text; hints do not count.
  bool IsEqual(const char* text) const;
  using DExpression::IsEqual;

  // Import reads one byte string, with an optional display hint, from a buffer into this object.
  // VESK2_ERR_PARAM_NULL, VESK2_ERR_PARSE_FILE, VESK2_ERR_MAX_BYTE_STRING, VESK2_ERR_MEM_ALLOC; the
  // string is empty after a failure.
  [[nodiscard]] int Import(ZvBuffer* buffer);

  // ParseCanonical and ParseAdvanced read one byte string (a token) from memory at `pos`.
  [[nodiscard]] static int ParseCanonical(DExpression*& out, unsigned char* buf, unsigned int size,
                                          unsigned int& pos, Vesk2ContextStruct* context);
  [[nodiscard]] static int ParseAdvanced(DExpression*& out, const char* text, unsigned int& pos,
                                         Vesk2ContextStruct* context);

  BsType GetType() const;
  unsigned int GetLength() const;
  // The bytes, not terminated; null until there were any.
  const unsigned char* GetData() const;

 protected:
  // Makes room for `size` bytes by the rule of Set; the contents are then the caller's to write.
  [[nodiscard]] VESK2_LOCAL int Reserve(unsigned int size);
  // Deletes the bytes.
  VESK2_LOCAL void Clear();

  BsType type = BsNone;
  unsigned int length = 0;
  unsigned char* data = nullptr;  // an array from new[], or `shortBytes`

 private:
  // The bytes of a short string: keywords, names and times need no array of their own.
  static constexpr unsigned int kShort = 24;
  unsigned char shortBytes[kShort];
};

// ---- SExpression -------------------------------------------------------------------------------

class VESK2_API SExpression : public DExpression {
 public:
  explicit SExpression(Vesk2ContextStruct* context);

 protected:
  ~SExpression() override;

 public:
  [[nodiscard]] int UpdateHash(ZVCLMHashContextData* hash, bool ignoreHints) override;
  unsigned int CanonicalLength() override;
  unsigned int AdvancedLength() override;
  [[nodiscard]] int Export(unsigned char* buf, unsigned int& pos, unsigned int size) override;
  [[nodiscard]] int ExportAdvanced(unsigned char* buf, unsigned int& pos,
                                   unsigned int size) override;
  [[nodiscard]] int PrintAdvanced(int (*write)(const char* text, unsigned int length, void* user),
                                  void* user, int depth) override;
  [[nodiscard]] int PrintCanonical(FILE* stream) override;
  bool IsSExpression() const override;
  // The class's directory below a store root and its file extension; empty when it has none.
  virtual const char* DirectoryName() const;
  virtual const char* ExtensionName() const;
  virtual bool IsHash() const;

  // ---- Building lists ----

  // Create makes the list (tag value), or (tag) without a value. It takes over the reference to a
  // ByteString `value`. Errors are Insert's and VESK2_ERR_MEM_ALLOC.
  [[nodiscard]] static int Create(SExpression*& out, const char* tag, ByteString* value,
                                  Vesk2ContextStruct* context);
  [[nodiscard]] static int Create(SExpression*& out, const char* tag, const char* value,
                                  Vesk2ContextStruct* context);
  [[nodiscard]] static int Create(SExpression*& out, const char* tag, Vesk2ContextStruct* context);

  // Insert appends and takes over the caller's reference. VESK2_ERR_PARAM_NULL,
  // VESK2_ERR_MEM_ALLOC. The text form appends a new byte string; an empty or null text gives
  // VESK2_ERR_INVALID_PARAM.
  [[nodiscard]] int Insert(DExpression* value);
  [[nodiscard]] int Insert(const char* text);
  // Remove unlinks the first element that is `value` itself and hands its reference to the caller.
  // VESK2_ERR_PARAM_NULL, VESK2_ERR_NOT_IN_LIST.
  [[nodiscard]] int Remove(DExpression* value);
  // DeleteNodes frees every element. Do not edit the list of a typed object (a key, a certificate):
  // its fields point into it.
  void DeleteNodes();

  // ---- Reading lists ----

  DExpression* First() const;
  DExpression* Last() const;
  unsigned int Count() const;
  // Rest is a new list that shares all elements but the first; null without memory. The caller
  // frees it with Free().
  SExpression* Rest();
  // Whether x->IsEqual(e) for some element e.
  bool Contains(SExpression* x);

  // Iterator walks the elements: for (auto it = list->Begin(); it; it.Next()) use(it.Value());
  // It is one pointer and stays one.
 private:
  struct Node;

 public:
  class VESK2_API Iterator {
   public:
    explicit Iterator(const Node* node) : node_(node) {}
    explicit operator bool() const { return node_ != nullptr; }
    DExpression* Value() const;
    void Next();

   private:
    const Node* node_;
  };
  Iterator Begin() const;

  // ---- Canonical and advanced text ----

  using DExpression::Export;
  // Export makes a new array that holds exactly the canonical encoding without hints, not
  // terminated; free it with Vesk2Free. `out` must be null (VESK2_ERR_INVALID_PARAM).
  // VESK2_ERR_MEM_ALLOC, VESK2_ERR_BUFFER_OVERFLOW.
  [[nodiscard]] int Export(unsigned char*& out, unsigned int& length);

  // Import reads one list, with hints, from a buffer or a file. VESK2_ERR_INVALID_PARAM (buffer
  // form) or VESK2_ERR_PARAM_NOT_NULL and VESK2_ERR_PARAM_NULL (file form) for misplaced arguments,
  // VESK2_ERR_FILE_OPEN, VESK2_ERR_READ_FILE (another process held the file for
  // Limits::kMaxHeldWait), VESK2_ERR_PARSE_FILE, VESK2_ERR_MAX_BYTE_STRING, VESK2_ERR_MEM_ALLOC.
  [[nodiscard]] static int Import(SExpression*& out, ZvBuffer* buffer, Vesk2ContextStruct* context);
  [[nodiscard]] static int Import(SExpression*& out, const char* path, Vesk2ContextStruct* context);

  // ParseCanonical reads one list from memory at `pos`. Between elements it skips white space; the
  // first element is always read as a byte string; the ")" of an empty list is left unread.
  //   VESK2_ERR_INVALID_PARAM, VESK2_ERR_BUFFER_OVERFLOW at the end of input,
  //   VESK2_ERR_UNEXPECTED_CHAR, VESK2_ERR_INVALID_S_EXPRESSION, VESK2_ERR_MEM_ALLOC.
  [[nodiscard]] static int ParseCanonical(DExpression*& out, unsigned char* buf, unsigned int size,
                                          unsigned int& pos, Vesk2ContextStruct* context);
  // ParseCanonical2 also points `found` (borrowed) at the last nested list, in the order in which
  // lists close, whose first element is `tag`. After a failure `found` is as it was.
  [[nodiscard]] static int ParseCanonical2(DExpression*& out, unsigned char* buf, unsigned int size,
                                           unsigned int& pos, const char* tag, SExpression*& found,
                                           Vesk2ContextStruct* context);
  // FindSubExpression parses `buf` and returns that list, to be freed by the caller; null with
  // result 0 when there is none. VESK2_ERR_PARAM_NOT_NULL, VESK2_ERR_PARAM_NULL and
  // ParseCanonical2's.
  [[nodiscard]] static int FindSubExpression(SExpression*& found, unsigned char* buf,
                                             unsigned int size, const char* tag,
                                             Vesk2ContextStruct* context);

  // ParseAdvanced reads one list from 0-terminated text, the whole of it or at `pos`.
  // VESK2_ERR_INVALID_PARAM, VESK2_ERR_UNEXPECTED_CHAR (also for trailing text),
  // VESK2_ERR_INVALID_S_EXPRESSION, VESK2_ERR_MEM_ALLOC.
  [[nodiscard]] static int ParseAdvanced(SExpression*& out, const char* text,
                                         Vesk2ContextStruct* context);
  [[nodiscard]] static int ParseAdvanced(DExpression*& out, const char* text, unsigned int& pos,
                                         Vesk2ContextStruct* context);
  // ParseTagAdvanced reads elements without enclosing parentheses into a new list headed by `tag`.
  [[nodiscard]] static int ParseTagAdvanced(SExpression*& out, const char* text, const char* tag,
                                            Vesk2ContextStruct* context);
  // ExportTag returns the advanced text as a new string (free with Vesk2Free): the whole of it
  // without `tag`, what follows the keyword when the list is headed by `tag` and has a body, what
  // is between the parentheses for an empty `tag`. Null otherwise and without memory. ExportTagW
  // gives the file-name form.
  char* ExportTag(const char* tag);
  char* ExportTagW(const char* tag);

  // IsSubset tells whether this tag lies within `other`. Every failure reads as false. Two sets are
  // never subsets of one another unless they are equal: ask for single strings, lists, prefixes or
  // ranges.
  bool IsSubset(SExpression* other);

  // ---- Storage ----

  // CalcDir returns the directory of a store as a new string: "." for StoragePath or without a
  // directory name, else root/dirName. Null when the root is not set, the path is too
  // long, or without memory.
  static char* CalcDir(const char* dirName, StorageType type);
  // CalcPath returns the path of an object as a new string. With StoragePath or without a directory
  // name it is `name`; otherwise only the last component of `name` counts, below the store
  // directory, which is created. `extension` is appended unless the path ends in it. Null when the
  // root is not set, the name is "", ".", ".." or "/" inside a store, or anything would have to be
  // cut.
  static char* CalcPath(const char* dirName, const char* extension, const char* name,
                        StorageType type);
  void SetStorageType(StorageType type);
  // SetFileName sets the file name to CalcPath of `name`. VESK2_ERR_INVALID_PARAM for null,
  // VESK2_ERR_MEM_ALLOC when there is no such path. Set the storage type first.
  [[nodiscard]] int SetFileName(const char* name);
  // CreateFileDirectory makes the object's store directory. VESK2_ERR_FIND_DIR for a storage type
  // that is none and when the root is not set or too long, VESK2_ERR_MEM_ALLOC,
  // VESK2_ERR_CREATE_DIR.
  [[nodiscard]] int CreateFileDirectory();
  // Export writes the object, with hints, to its file: to SetFileName(name) when a name is given. A
  // path of its own may be a link, a file of a store may not; in the global store it is readable by
  // all whatever the umask.
  // VESK2_ERR_FILE_OPEN, VESK2_ERR_WRITE_FILE (the file is left as far as it was written) and those
  // of the two functions above.
  [[nodiscard]] int Export(const char* name);
  // Whether the object's file exists.
  bool Exists();
  // The last component of the file name as a new string (free with Vesk2Free); null without one.
  char* BaseName();

  StorageType GetStorageType() const;
  const char* GetFileName() const;

 protected:
  // Replaces the file name by a copy of `path`, as it stands.
  [[nodiscard]] VESK2_LOCAL int SetFilePath(const char* path);

 private:
  struct Node {
    Node* next = nullptr;
    DExpression* value = nullptr;  // the list holds one reference
    bool own = false;              // whether it stands in a list itself
  };
  VESK2_LOCAL static void DeleteNode(Node* node);

  StorageType storageType = StorageHome;
  unsigned int ownUsed = 0;  // of ownNodes
  Node* first = nullptr;
  Node* last = nullptr;
  char* fileName = nullptr;

  // The nodes of the first elements; most lists are short, and need no others.
  static constexpr unsigned int kOwnNodes = 3;
  Node ownNodes[kOwnNodes];
};

}  // namespace ZvVesk2

#endif  // VESK2_EXPRESSION_H

// SPDX-License-Identifier: Apache-2.0
// expression.h: the value model. Every object of the library is an S-expression: a byte string
// (ByteString) or a list (SExpression), both counted DExpressions.
//
//   Ref<SExpression> tag;
//   int code = SExpression::ParseAdvanced(tag.Out(), "(tag (install (app calc)))", nullptr);
//   if (code == 0) code = tag->Export("calc.tag");     canonical: (3:tag(7:install(3:app4:calc)))
//
// Reference counting: a value starts with one reference, its creator's. IncrementRefCount adds a
// holder, Free takes one away and destroys the value with the last; nothing else releases values.
// Ref<T> (vesk2/ref.h) does this by scope. A list owns one reference to each element; accessors
// return borrowed pointers, valid as long as the list holds the element. Counts are plain integers:
// a value belongs to one thread, and so does every value that it shares with another.
//
// Arguments, in every header: what a call shares, it counts for itself, and the caller keeps the
// reference that it had. What a call takes over, a reference or an array, belongs to the callee
// after success only: after a failure it is the caller's as before. What a call adopts belongs to
// the callee from the call on, whatever it answers. What none of these is said of is borrowed for
// the call. Arrays come from new[] on both sides; Vesk2Free releases what was handed out.
//
// Two encodings. Canonical: a list is "(" elements ")", a byte string its length in decimal, ":"
// and the bytes; the stream form puts a display hint "[bin]", "[utf-8]" or "[num]" before the
// length. Advanced: bare words separated by blanks, for text that people type and read; it has no
// quoting, so what is written need not read back.
//
// Display hints count in no comparison of objects and not in the reduction: two keys that differ in
// hints alone are one. Signatures cover them. Compare by IsEqual or fingerprint, not by the bytes
// of files.
//
// Factories are static and take a reference to a null pointer; it is null again after a failure,
// with everything half-built released. Lists nest at most Limits::kMaxDepth levels in every reader;
// one that a caller builds deeper can be freed, and is refused by whatever walks it. A list must
// never come to hold itself, at any depth: it could not be freed.
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

namespace ZVsysutil {
class ZvDrops;
}

namespace ZvVesk2 {

class AtomText;
class ValueBlocks;
class Walk;

// Where an object is stored; the roots are those of VeskConf (vesk2/context.h). Fixed underlying
// type: callers may pass other values, which mean the home store except where a function says
// otherwise.
enum StorageType : int32_t {
  StorageHome = 0,    // below the home directory
  StorageGlobal = 1,  // below the global directory
  StoragePath = 2,    // the name given is the path
};

// ---- DExpression -------------------------------------------------------------------------------

// DExpression is a counted value: what byte strings and lists have in common. Programs make values
// with new or a factory, hold them by Ref, and never delete them.
class VESK2_API DExpression {
 public:
  // new has the library take the memory, as much as the class needs there: a program may have been
  // compiled when it needed less. The nothrow form is null without memory; the other throws
  // std::bad_alloc, as any new does.
  static void* operator new(size_t size);
  static void* operator new(size_t size, const std::nothrow_t&) noexcept;
  static void operator delete(void* object);

  // Every constructor of a value takes the context, which may be null, keeps the pointer and does
  // not own it. The value starts with one reference.
  explicit DExpression(Vesk2ContextStruct* context);
  DExpression(const DExpression&) = delete;
  DExpression& operator=(const DExpression&) = delete;

 protected:
  virtual ~DExpression();

 public:
  // UpdateHash feeds the canonical bytes to a running hash, display hints in their short form first
  // unless `ignoreHints`. Returns 0, the crypto layer's code (1001 to 1070; a null `hash` is
  // ZVCLM_ERR_NULL_PARAM), or VESK2_ERR_BUFFER_OVERFLOW for lists nested too deeply. After a
  // failure part of the bytes is in the hash.
  [[nodiscard]] virtual int UpdateHash(ZVCLMHashContextData* hash, bool ignoreHints) = 0;
  // CanonicalLength is the number of bytes of the canonical encoding without hints; UINT_MAX when
  // that is more, and for lists nested too deeply.
  virtual unsigned int CanonicalLength() = 0;
  // AdvancedLength is a buffer size in bytes, terminator included, that ExportAdvanced surely fits
  // in; it is larger than the text. A byte string or an empty list by itself needs one byte more.
  // UINT_MAX as above.
  virtual unsigned int AdvancedLength() = 0;
  // Export appends the canonical encoding, without hints, to `buf` of `size` bytes at `pos`, which
  // moves on. A list needs one byte of room beyond its ")" and does not report its elements'
  // results: a string that does not fit is left out, and what was written is then another list.
  // Give CanonicalLength() + 1 bytes of room behind `pos`, or use the form that makes the array.
  //   VESK2_ERR_INVALID_PARAM    a null `buf`
  //   VESK2_ERR_BUFFER_OVERFLOW  no room, or nested too deeply; `pos` is where it stopped
  [[nodiscard]] virtual int Export(unsigned char* buf, unsigned int& pos, unsigned int size) = 0;
  // ExportAdvanced appends the advanced text and a terminating 0, which is not counted in `pos`.
  // Bytes are written as they are, hints are not; a 0 byte among them ends the text for whoever
  // reads it as a string. Room and errors as in Export, with AdvancedLength().
  [[nodiscard]] virtual int ExportAdvanced(unsigned char* buf, unsigned int& pos,
                                           unsigned int size) = 0;
  // PrintAdvanced passes the text, piece by piece, to `write` with `user`, whose results are
  // ignored; null writes nothing. The pieces are not terminated and are borrowed for the call. At
  // depth 0 or below the outermost parentheses are left out. Byte strings print by hint: none, the
  // bytes if all are printable, else nothing; bin nothing; utf-8 the bytes; num the first byte in
  // decimal. Always 0; the text ends where lists nest too deeply.
  [[nodiscard]] virtual int PrintAdvanced(int (*write)(const char* text, unsigned int length,
                                                       void* user),
                                          void* user, int depth) = 0;
  // PrintCanonical writes the canonical encoding with hints to a stream, which a list flushes at
  // its end; the stream stays open. This is the form of files and of what is signed.
  //   VESK2_ERR_WRITE_FILE       a short write or a failing flush
  //   VESK2_ERR_PARAM_NULL       a byte string, and a null stream
  //   VESK2_ERR_INVALID_PARAM    a list, and a null stream
  //   VESK2_ERR_BUFFER_OVERFLOW  lists nested too deeply; part of it is written
  [[nodiscard]] virtual int PrintCanonical(FILE* stream) = 0;
  // Whether it is a list, of whatever class; a byte string otherwise.
  virtual bool IsSExpression() const = 0;

  // IncrementRefCount adds a reference, Free gives one back; the value is destroyed with the last,
  // so that Free through a borrowed pointer takes it from its owner. Neither may race with the
  // other.
  void IncrementRefCount();
  void Free();

  // IsEqual tells whether both have the same canonical encoding without hints. False for null; a
  // list nested too deeply equals nothing, not even itself. It allocates nothing, and stops at the
  // first difference.
  bool IsEqual(DExpression* other);

  // ComputeHash makes a new array with the digest of the canonical bytes, with hints in their short
  // form unless `ignoreHints`; free it with Vesk2Free. `digestLength` receives its bytes: 20 or 32.
  // A key is named by the digest without hints; what is signed is the one with them.
  //   VESK2_ERR_INVALID_PARAM    `digest` is not null
  //   VESK2_ERR_BUFFER_OVERFLOW  lists nested too deeply
  //   VESK2_ERR_MEM_ALLOC, ZVCLM_ERR_NO_MEM
  //                              memory ran out
  //   ZVCLM_ERR_UNKNOWN_HASH     `id` is none of ZvclmHashID
  // After a failure `digest` is null.
  [[nodiscard]] int ComputeHash(unsigned char*& digest, unsigned int& digestLength, ZvclmHashID id,
                                bool ignoreHints);

  // Expect matches `text` in the memory readers. An index runs from `pos` to the length of `text`,
  // and each text[i] is compared with buf[pos + i]: so a one-character text is compared at position
  // 0 only, and elsewhere the byte at `pos` is consumed whatever it is. Which inputs the memory
  // readers accept rests on this: stored texts are read that nothing else would take. `size` is
  // that of `buf` in bytes. Who wants every byte compared reads from a ZvBuffer.
  //   VESK2_ERR_INVALID_PARAM    a null `text` or `buf`
  //   VESK2_ERR_BUFFER_OVERFLOW  fewer bytes are left than `text` has
  //   VESK2_ERR_UNEXPECTED_CHAR  another byte where one is compared
  [[nodiscard]] static int Expect(const char* text, const unsigned char* buf, unsigned int size,
                                  unsigned int& pos);

  // The context that the value was made with, borrowed; null without one.
  Vesk2ContextStruct* GetContext() const;
  // The references that are held now: for tests and diagnosis, nothing to decide by.
  int32_t GetRefCount() const;
  // The context's crypto handle, 0 without a context.
  uint32_t CryptoHandle() const;

 private:
  friend class AtomText;
  friend class SExpression;
  friend class ValueBlocks;
  friend class Walk;

  VESK2_LOCAL void Free(ZVsysutil::ZvDrops& drops);

  int32_t refCount = 1;
  uint32_t place : 31;  // bytes behind the start of its block; 0 in memory of its own
  uint32_t isList : 1;  // an SExpression
  Vesk2ContextStruct* context;
};

// ---- ByteString --------------------------------------------------------------------------------

// ByteString is a string of bytes with a display hint: 4:calc, or with its hint [utf-8]4:calc. It
// may hold any bytes, 0 among them, and is not terminated. Readers and Set take at most
// Limits::kMaxByteString bytes.
class VESK2_API ByteString : public DExpression {
 public:
  // Display hints: how the bytes are meant to be shown.
  enum BsType : int32_t { BsNone = 0, BsBin = 1, BsUtf8 = 2, BsNum = 3 };

  // An empty string, for Set or Import.
  explicit ByteString(Vesk2ContextStruct* context);
  // Adopts `data`, an array from new[] of `length` bytes, without copying, of any length; null
  // makes an empty string. `context` may be null.
  ByteString(unsigned char* data, unsigned int length, BsType type, Vesk2ContextStruct* context);

 protected:
  ~ByteString() override;

 public:
  // See DExpression. A string's canonical form is its length in decimal without leading zeros, ":"
  // and the bytes, whatever leading zeros it was read with: a string that was read is not always
  // written as it was, and a signature is over what is written.
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
  // memory. The bytes are as they were written: see Wording::Escape before showing them.
  virtual char* ToString();

  // Set copies `length` bytes (1 to 8192), which may lie within the string itself, and takes the
  // hint. The text form copies what comes before the 0 byte. The array is kept when the old length
  // is at most 7 bytes larger than the new one.
  //   VESK2_ERR_INVALID_PARAM    null or no bytes; the string is as it was
  //   VESK2_ERR_MAX_BYTE_STRING  more bytes; the string is as it was
  //   VESK2_ERR_MEM_ALLOC        the string is then empty
  [[nodiscard]] int Set(const unsigned char* data, unsigned int length, BsType type);
  [[nodiscard]] int Set(const char* text, BsType type);

  // IsEqual compares the bytes with a 0-terminated text; hints do not count. False for null, and
  // for a string with a 0 byte in it.
  bool IsEqual(const char* text) const;
  using DExpression::IsEqual;

  // Import reads one byte string, with an optional display hint, from a buffer into this object,
  // over what it held. The string is empty after a failure, and the buffer stands where the text
  // stopped making sense.
  //   VESK2_ERR_PARAM_NULL       a null buffer
  //   VESK2_ERR_PARSE_FILE       an unknown hint, no ":", or fewer bytes than announced
  //   VESK2_ERR_MAX_BYTE_STRING  over Limits::kMaxLengthDigits digits or Limits::kMaxByteString
  //                              bytes
  //   VESK2_ERR_MEM_ALLOC        memory ran out
  [[nodiscard]] int Import(ZvBuffer* buffer);

  // ParseCanonical and ParseAdvanced read one byte string (a token) from memory at `pos`, which
  // moves behind it; white space before it is skipped. `out` must be null and receives the string
  // for the caller to free. The canonical form takes any byte for the ":" except at position 0 (see
  // Expect); a token ends at white space, a parenthesis or the end, and may be empty.
  //   VESK2_ERR_INVALID_PARAM         `out` is not null, or no text
  //   VESK2_ERR_BUFFER_OVERFLOW       the text ends before the string does
  //   VESK2_ERR_UNEXPECTED_CHAR       no ":" at position 0
  //   VESK2_ERR_INVALID_S_EXPRESSION  a token too long for `pos`
  //   VESK2_ERR_MEM_ALLOC             memory ran out
  [[nodiscard]] static int ParseCanonical(DExpression*& out, unsigned char* buf, unsigned int size,
                                          unsigned int& pos, Vesk2ContextStruct* context);
  [[nodiscard]] static int ParseAdvanced(DExpression*& out, const char* text, unsigned int& pos,
                                         Vesk2ContextStruct* context);

  // The hint; BsNone unless it was read or set.
  BsType GetType() const;
  // The bytes that there are.
  unsigned int GetLength() const;
  // The bytes, not terminated, borrowed until the string changes; null until there were any.
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
  friend class AtomText;
  friend class ValueBlocks;

  // The bytes of a short string: keywords, names and times need no array of their own.
  static constexpr unsigned int kShort = 24;
  unsigned char shortBytes[kShort];
};

// ---- SExpression -------------------------------------------------------------------------------

// SExpression is a list of values, in order, which may have a file. It is also what every typed
// object (a key, a certificate, a chain) derives from: those fill their list when they are read or
// built, and have fields that point into it.
class VESK2_API SExpression : public DExpression {
 public:
  // An empty list, of storage type StorageHome and without a file.
  explicit SExpression(Vesk2ContextStruct* context);

 protected:
  ~SExpression() override;

 public:
  // See DExpression. Each walks the list once, without recursion, and stops at Limits::kMaxDepth.
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
  // The class's directory below a store root and its file extension, static texts; empty when it
  // has none. A list without a directory is kept at a path of its own.
  virtual const char* DirectoryName() const;
  // With its dot: ".cert". It is appended to names that do not end in it.
  virtual const char* ExtensionName() const;
  // Whether it is a Hash.
  virtual bool IsHash() const;

  // ---- Building lists ----

  // Create makes the list (tag value), or (tag) without a value, for the caller to free. It takes
  // over the reference to a ByteString `value`, which may be null; a text `value` is copied, and
  // must not be null or empty. `out` is overwritten, and null after a failure. Errors are Insert's
  // and VESK2_ERR_MEM_ALLOC.
  [[nodiscard]] static int Create(SExpression*& out, const char* tag, ByteString* value,
                                  Vesk2ContextStruct* context);
  [[nodiscard]] static int Create(SExpression*& out, const char* tag, const char* value,
                                  Vesk2ContextStruct* context);
  [[nodiscard]] static int Create(SExpression*& out, const char* tag, Vesk2ContextStruct* context);

  // Insert appends and takes over the caller's reference. A value that is to stay in another list
  // too needs a reference of its own first. The text form appends a new byte string without a hint.
  //   VESK2_ERR_PARAM_NULL       a null value
  //   VESK2_ERR_INVALID_PARAM    an empty or null text
  //   VESK2_ERR_MAX_BYTE_STRING  a text of over Limits::kMaxByteString bytes
  //   VESK2_ERR_MEM_ALLOC        memory ran out; the list is as it was
  [[nodiscard]] int Insert(DExpression* value);
  [[nodiscard]] int Insert(const char* text);
  // Remove unlinks the first element that is `value` itself, not one that equals it, and hands its
  // reference to the caller. VESK2_ERR_PARAM_NULL, VESK2_ERR_NOT_IN_LIST.
  [[nodiscard]] int Remove(DExpression* value);
  // DeleteNodes frees every element, without recursion however deeply they nest. Do not edit the
  // list of a typed object (a key, a certificate): its fields point into it.
  void DeleteNodes();

  // ---- Reading lists ----

  // The first and the last element, borrowed; null for an empty list. Count walks the list.
  DExpression* First() const;
  // The last element is often the value: of (not-after <stamp>), for one.
  DExpression* Last() const;
  // Counted by a walk: not for the condition of a loop.
  unsigned int Count() const;
  // Rest is a new list that shares all elements but the first; empty for a list of one or none,
  // null without memory. The caller frees it with Free().
  SExpression* Rest();
  // Whether x->IsEqual(e) for some element e. False for null. It looks at one after the other.
  bool Contains(SExpression* x);

 private:
  struct Node;

 public:
  // Iterator walks the elements, in order:
  //   for (auto it = list->Begin(); it; it.Next()) Use(it.Value());
  // The list must not lose the element that it stands at. It is one pointer and stays one.
  class VESK2_API Iterator {
   public:
    // Made by Begin; a null node is the end. Only where it is true may Value (borrowed) and Next be
    // called.
    explicit Iterator(const Node* node) : node_(node) {}
    explicit operator bool() const { return node_ != nullptr; }
    // The element, borrowed; IsSExpression tells of which kind it is.
    DExpression* Value() const;
    // Moves on to the next element, or to the end.
    void Next();

   private:
    const Node* node_;
  };
  Iterator Begin() const;

  // ---- Canonical and advanced text ----

  using DExpression::Export;
  // Export makes a new array that holds exactly the canonical encoding without hints, not
  // terminated, of `length` bytes; free it with Vesk2Free. `out` is null after a failure.
  //   VESK2_ERR_INVALID_PARAM    `out` is not null
  //   VESK2_ERR_BUFFER_OVERFLOW  over Limits::kMaxExport bytes, or nested too deeply
  //   VESK2_ERR_MEM_ALLOC        memory ran out
  [[nodiscard]] int Export(unsigned char*& out, unsigned int& length);

  // Import reads one list, with hints, from a buffer or a file, for the caller to free. What
  // follows the list is ignored, and in a buffer left unread: whoever minds tests that
  // ZvBuffer::Remaining() is 0, as the command does for keys, chains and lists. The file is read
  // whole (at most Limits::kMaxFile bytes), and must be a regular one.
  //   VESK2_ERR_INVALID_PARAM    buffer form: `out` is not null, or no buffer
  //   VESK2_ERR_PARAM_NOT_NULL   file form: `out` is not null
  //   VESK2_ERR_PARAM_NULL       file form: no path
  //   VESK2_ERR_FILE_OPEN        the file cannot be opened or read
  //   VESK2_ERR_READ_FILE        another process held the file for Limits::kMaxHeldWait
  //   VESK2_ERR_PARSE_FILE       not a list, or nested too deeply
  //   VESK2_ERR_MAX_BYTE_STRING  a string that is too long
  //   VESK2_ERR_MEM_ALLOC        memory or descriptors ran out
  [[nodiscard]] static int Import(SExpression*& out, ZvBuffer* buffer, Vesk2ContextStruct* context);
  [[nodiscard]] static int Import(SExpression*& out, const char* path, Vesk2ContextStruct* context);

  // ParseCanonical reads one list from `size` bytes of memory at `pos`, which moves behind it, for
  // the caller to free; hints are not known here. Between elements it skips white space; the first
  // element is always read as a byte string; the ")" of an empty list is left unread. It ignores
  // what follows the list, and takes any byte for a parenthesis or a colon in most places (see
  // Expect): test that `pos` is at the end, or read from a ZvBuffer.
  //   VESK2_ERR_INVALID_PARAM         `out` is not null, or no bytes
  //   VESK2_ERR_BUFFER_OVERFLOW       the input ends too early
  //   VESK2_ERR_UNEXPECTED_CHAR       another byte where one is compared
  //   VESK2_ERR_INVALID_S_EXPRESSION  a 0 byte between elements, or nested too deeply
  //   VESK2_ERR_MEM_ALLOC             memory ran out
  [[nodiscard]] static int ParseCanonical(DExpression*& out, unsigned char* buf, unsigned int size,
                                          unsigned int& pos, Vesk2ContextStruct* context);
  // ParseCanonical2 also points `found` (borrowed from `out`) at the last nested list, in the order
  // in which lists close, whose first element is `tag`; the outermost is not looked at. After a
  // failure, and where there is none, `found` is as it was.
  [[nodiscard]] static int ParseCanonical2(DExpression*& out, unsigned char* buf, unsigned int size,
                                           unsigned int& pos, const char* tag, SExpression*& found,
                                           Vesk2ContextStruct* context);
  // FindSubExpression parses `buf` and returns that list, to be freed by the caller; null with
  // result 0 when there is none. It looks anywhere, also inside of what is not meant: a list named
  // `not-before` within a tag is found like a date.
  //   VESK2_ERR_PARAM_NOT_NULL  `found` is not null
  //   VESK2_ERR_PARAM_NULL      no bytes or no `tag`
  //   and ParseCanonical2's     of the reader
  [[nodiscard]] static int FindSubExpression(SExpression*& found, unsigned char* buf,
                                             unsigned int size, const char* tag,
                                             Vesk2ContextStruct* context);

  // ParseAdvanced reads one list from 0-terminated text, the whole of it or at `pos`, which moves
  // behind it, for the caller to free. "(install (app calc))" is a list of a word and a list; the
  // first element is always a word, an empty one in "((a) b)".
  //   VESK2_ERR_INVALID_PARAM         `out` is not null, or no text
  //   VESK2_ERR_UNEXPECTED_CHAR       no "(", or (whole form) text behind the list
  //   VESK2_ERR_INVALID_S_EXPRESSION  not closed, nested too deeply, or over 2 GiB of text
  //   VESK2_ERR_MEM_ALLOC             memory ran out
  [[nodiscard]] static int ParseAdvanced(SExpression*& out, const char* text,
                                         Vesk2ContextStruct* context);
  [[nodiscard]] static int ParseAdvanced(DExpression*& out, const char* text, unsigned int& pos,
                                         Vesk2ContextStruct* context);
  // ParseTagAdvanced reads elements without enclosing parentheses into a new list headed by `tag`:
  // "(install (app calc))" with "tag" becomes (tag (install (app calc))). Without elements it is
  // (tag), the widest grant and the widest request. Codes of ParseAdvanced; a ")" that closes
  // nothing is VESK2_ERR_UNEXPECTED_CHAR.
  [[nodiscard]] static int ParseTagAdvanced(SExpression*& out, const char* text, const char* tag,
                                            Vesk2ContextStruct* context);
  // ExportTag returns the advanced text as a new string (free with Vesk2Free): the whole of it
  // without `tag`, what follows the keyword when the list is headed by `tag` and has a body, what
  // is between the parentheses for an empty `tag`. Null otherwise and without memory;
  // Wording::OfTag has a text for every tag. The text of a tag with a 0 byte in it ends there for
  // whoever reads a C string. ExportTagW gives the file-name form.
  char* ExportTag(const char* tag);
  // The same text in the file-name form, which on Linux is the same bytes.
  char* ExportTagW(const char* tag);

  // IsSubset tells whether this tag lies within `other` (null: no). A shorter list is wider than a
  // longer one that begins like it: (tag (install (app calc))) lies within (tag (install)), and
  // everything within (tag). Every failure reads as false, a lack of memory and a spent budget
  // (Limits::kMaxComparisons) too: use it to look for grants, and the verifications to decide. Two
  // sets are never subsets of one another unless they are equal: ask for single strings, lists,
  // prefixes or ranges. Strings are equal up to their first 0 byte: keep 0 bytes out of tags, and
  // refuse them in tags that others wrote.
  bool IsSubset(SExpression* other);

  // ---- Storage ----

  // CalcDir returns the directory of a store as a new string, to be freed with Vesk2Free: "." for
  // StoragePath or without a directory name, else root/dirName. Null when the root is not set, the
  // path is too long, or without memory. Nothing is made or looked at.
  static char* CalcDir(const char* dirName, StorageType type);
  // CalcPath returns the path of an object as a new string, to be freed with Vesk2Free. With
  // StoragePath or without a directory name it is `name`; otherwise only the last component of
  // `name` counts, below the store directory, which is created: pass bare names, as a/b and c/b
  // name one file. `extension` is appended unless the path ends in it. Null when the root is not
  // set, the name is "", ".", ".." or "/" inside a store, anything would have to be cut (4096
  // bytes), an argument is null, or without memory.
  static char* CalcPath(const char* dirName, const char* extension, const char* name,
                        StorageType type);
  // Where SetFileName, CreateFileDirectory and Export look. The file name that there is stays.
  void SetStorageType(StorageType type);
  // SetFileName sets the file name to CalcPath of `name`, with the class's directory and extension.
  // Set the storage type first. VESK2_ERR_INVALID_PARAM for null, VESK2_ERR_MEM_ALLOC when there is
  // no such path; the object has no file name then.
  [[nodiscard]] int SetFileName(const char* name);
  // CreateFileDirectory makes the object's store directory: of the home store for its user alone,
  // of the global one readable by all. The root must exist. Nothing to do for a path of its own.
  //   VESK2_ERR_FIND_DIR    a storage type that is none; the root is not set or too long
  //   VESK2_ERR_CREATE_DIR  it cannot be made, or something else has its name
  //   VESK2_ERR_MEM_ALLOC   memory ran out
  [[nodiscard]] int CreateFileDirectory();
  // Export writes the object, with hints, to its file: to SetFileName(name) when a name is given,
  // else where it is set to lie. A path of its own may be a link, a file of a store may not; in the
  // global store it is readable by all whatever the umask. When writing fails, the file is left as
  // far as it was written: write elsewhere and rename. (CrlSequence::UpdateStore and
  // AclEntry::InstallAcls replace files whole or not at all, and so does the command.)
  //   VESK2_ERR_FILE_OPEN   the file cannot be made, is no regular file, or there is no name
  //   VESK2_ERR_WRITE_FILE  not all could be written
  //   VESK2_ERR_INVALID_PARAM, VESK2_ERR_FIND_DIR, VESK2_ERR_CREATE_DIR, VESK2_ERR_MEM_ALLOC
  //                         of the two functions above
  [[nodiscard]] int Export(const char* name);
  // Whether something has the object's file name, links followed. Not to decide by: it may be gone,
  // or come, in the next moment.
  bool Exists();
  // The last component of the file name as a new string (free with Vesk2Free); null without one.
  char* BaseName();

  // As it was set; StorageHome at first.
  StorageType GetStorageType() const;
  // The path, borrowed until it is set again; null without one.
  const char* GetFileName() const;

 protected:
  // Replaces the file name by a copy of `path`, as it stands.
  [[nodiscard]] VESK2_LOCAL int SetFilePath(const char* path);

 private:
  friend class ValueBlocks;
  friend class Walk;

  struct Node {
    static constexpr uint32_t kAlone = 0, kOwn = 1;  // in memory of its own; in a list itself
    Node* next = nullptr;
    DExpression* value = nullptr;  // the list holds one reference
    uint32_t place = kAlone;       // else the bytes behind the start of its block
  };
  VESK2_LOCAL void Link(Node* node);
  VESK2_LOCAL static void DeleteNode(Node* node, ZVsysutil::ZvDrops& drops);

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

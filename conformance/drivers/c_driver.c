/* SPDX-License-Identifier: Apache-2.0 */
/* Answers the questions of the kit through vesk2.h. README.md describes the lines that come and go:
 * a request is an object of texts, numbers and lists of texts, whose characters stand for one byte
 * each. */
#include <stdio.h>
#include <stdlib.h>
#include <string.h>
#include <vesk2.h>

/* ---- Requests -------------------------------------------------------------------------------- */

enum { MAX_MEMBERS = 64, MAX_LINE = 1 << 20 };

typedef struct Member {
  const char* key;
  char* text; /* of a text; each of a list is a member with the list's key */
  long number;
} Member;

typedef struct Request {
  Member members[MAX_MEMBERS];
  int count;
} Request;

static void Fail(const char* what) {
  fprintf(stderr, "c_driver: %s\n", what);
  exit(2);
}

static char* SkipBlanks(char* at) {
  while (*at == ' ') at++;
  return at;
}

/* Reads a text in place, terminates it, and returns what follows. */
static char* ReadText(char* at, char** out) {
  static const char kEscapes[] = "n\nt\tr\rb\bf\f";
  if (*at != '"') Fail("a text is missing");
  char* end = *out = ++at;
  for (; *at != '"'; at++) {
    if (*at == 0) Fail("a text has no end");
    if (*at != '\\') {
      *end++ = *at;
      continue;
    }
    at++;
    if (*at == 'u') {
      const char digits[5] = {at[1], at[2], at[3], at[4], 0};
      *end++ = (char)strtol(digits, NULL, 16);
      at += 4;
      continue;
    }
    const char* escape = strchr(kEscapes, *at);
    *end++ = escape ? escape[1] : *at;
  }
  *end = 0;
  return at + 1;
}

static Member* Add(Request* request, const char* key) {
  if (request->count == MAX_MEMBERS) Fail("too many members");
  Member* member = &request->members[request->count++];
  member->key = key;
  return member;
}

static char* ReadValue(char* at, Request* request, const char* key) {
  if (*at == '"') {
    return ReadText(at, &Add(request, key)->text);
  }
  if (*at == '[') {
    at = SkipBlanks(at + 1);
    while (*at != ']') {
      at = SkipBlanks(ReadText(at, &Add(request, key)->text));
      if (*at == ',') at = SkipBlanks(at + 1);
    }
    return at + 1;
  }
  char* end;
  Add(request, key)->number = strtol(at, &end, 10);
  if (end == at) Fail("a value is neither text, number nor list");
  return end;
}

static void Read(char* at, Request* request) {
  memset(request, 0, sizeof *request);
  at = SkipBlanks(at + (*at == '{'));
  while (*at == '"') {
    char* key;
    at = SkipBlanks(ReadText(at, &key));
    at = SkipBlanks(ReadValue(SkipBlanks(at + (*at == ':')), request, key));
    if (*at == ',') at = SkipBlanks(at + 1);
  }
  if (*at != '}') Fail("a request is not an object");
}

static const Member* Find(const Request* request, const char* key) {
  for (int i = 0; i < request->count; i++) {
    if (strcmp(request->members[i].key, key) == 0) return &request->members[i];
  }
  return NULL;
}

static const char* Text(const Request* request, const char* key) {
  const Member* member = Find(request, key);
  return member ? member->text : NULL;
}

static long Number(const Request* request, const char* key, long otherwise) {
  const Member* member = Find(request, key);
  return member ? member->number : otherwise;
}

/* ---- Answers --------------------------------------------------------------------------------- */

static void PrintText(const char* text) {
  putchar('"');
  for (; *text; text++) {
    const unsigned char byte = (unsigned char)*text;
    if (byte < 32 || byte > 126 || byte == '"' || byte == '\\') {
      printf("\\u%04x", (unsigned)byte);
    } else {
      putchar(byte);
    }
  }
  putchar('"');
}

static int Compare(const void* a, const void* b) {
  return strcmp(*(const char* const*)a, *(const char* const*)b);
}

/* The files of a list, named relative to the directory, in byte order. */
static void PrintFiles(const char* name, const FileItem* list, const char* directory) {
  const char* names[1024];
  size_t count = 0;
  const size_t prefix = directory ? strlen(directory) + 1 : 0;
  for (; list && count < 1024; list = list->next) {
    if (!list->isDirectory) names[count++] = list->name + prefix;
  }
  qsort(names, count, sizeof *names, Compare);
  printf(", \"%s\": [", name);
  for (size_t i = 0; i < count; i++) {
    if (i) printf(", ");
    PrintText(names[i]);
  }
  printf("]");
}

static void PrintLists(Manifest* manifest, const char* directory) {
  PrintFiles("changed", GetInvalidEntries(manifest), directory);
  PrintFiles("missing", GetMissingEntries(manifest), directory);
  PrintFiles("unlisted", GetExtraEntries(manifest), directory);
}

/* ---- Questions ------------------------------------------------------------------------------- */

static void ReadChain(const Request* request) {
  Vesk2CertInfoStruct* chain = NULL;
  printf(", \"code\": %d", Vesk2CertRead(&chain, Text(request, "file")));
  int count = 0;
  for (const Vesk2CertInfoStruct* one = chain; one; one = one->next) count++;
  printf(", \"certificates\": %d", count);
  if (chain) Vesk2CertFree(chain);
}

static void VerifyChain(const Request* request) {
  if (Text(request, "at_text")) {
    printf(", \"unsupported\": true");
    return;
  }
  printf(", \"code\": %d",
         Vesk2CertVerifyFile(Text(request, "file"), Text(request, "tag"),
                             Number(request, "not_before", 0), Number(request, "not_after", 0)));
}

static void ReadList(const Request* request) {
  Vesk2CrlInfoStruct* list = NULL;
  printf(", \"code\": %d", Vesk2CrlRead(&list, Text(request, "file"), NULL));
  Vesk2CrlFree(list);
}

static void VerifyList(const Request* request) {
  printf(", \"code\": %d", Vesk2CrlVerifyFile(Text(request, "file"), Text(request, "tag"),
                                              Number(request, "not_before", 0),
                                              Number(request, "not_after", 0), NULL));
}

static void FindList(const Request* request) {
  Vesk2CrlInfoStruct* list = NULL;
  printf(", \"code\": %d", Vesk2CrlFindA(&list, Text(request, "tag"), NULL));
  Vesk2CrlFree(list);
}

static void ImportLists(const Request* request) {
  printf(", \"code\": %d", Vesk2ImportCrls(Text(request, "directory")));
}

static void SetIgnored(Manifest* manifest, const Request* request) {
  FileItem items[MAX_MEMBERS];
  FileItem* first = NULL;
  for (int i = 0; i < request->count; i++) {
    if (strcmp(request->members[i].key, "ignore") != 0) continue;
    memset(&items[i], 0, sizeof items[i]);
    items[i].name = request->members[i].text;
    items[i].next = first;
    first = &items[i];
  }
  SetIgnoredEntries(manifest, first);
}

static void VerifyTree(const Request* request) {
  Manifest* manifest = NULL;
  const char* directory = Text(request, "directory");
  int code =
      CreateManifestContext(&manifest, directory, Text(request, "file"), Text(request, "tag"));
  if (code == 0) {
    if (Number(request, "refuse_unlisted", 0)) FailOnExtraEntries(manifest);
    SetExtraAclDirectory(manifest, Text(request, "acl_directory"));
    SetStoreUpdate(manifest, (int)Number(request, "update_store", 1));
    SetIgnored(manifest, request);
    code =
        VerifyManifest(manifest, Number(request, "not_before", 0), Number(request, "not_after", 0));
    PrintLists(manifest, directory);
  }
  printf(", \"code\": %d", code);
  DeleteManifestContext(manifest);
}

static void CompareManifests(const Request* request) {
  Manifest* manifest = NULL;
  int code = CreateManifestContext(&manifest, ".", Text(request, "file"), "x");
  if (code == 0) {
    code = CompareManifest(manifest, Text(request, "other"));
    PrintLists(manifest, NULL);
  }
  printf(", \"code\": %d", code);
  DeleteManifestContext(manifest);
}

static void Escape(const Request* request) {
  const char* text = Text(request, "text");
  char* escaped = Vesk2Escape(text, strlen(text));
  printf(", \"code\": %d, \"text\": ", escaped ? 0 : VESK2_ERR_MEM_ALLOC);
  PrintText(escaped ? escaped : "");
  Vesk2Free(escaped);
}

static void Hello(const Request* request) {
  (void)request;
  printf(", \"column\": \"library\", \"name\": \"the C interface\"");
}

static const struct {
  const char* name;
  void (*answer)(const Request*);
} kOperations[] = {
    {"hello", Hello},
    {"read-chain", ReadChain},
    {"verify-chain", VerifyChain},
    {"read-list", ReadList},
    {"verify-list", VerifyList},
    {"find-list", FindList},
    {"import-lists", ImportLists},
    {"verify-manifest", VerifyTree},
    {"compare-manifests", CompareManifests},
    {"escape", Escape},
};

static void Answer(const Request* request) {
  const char* operation = Text(request, "operation");
  Vesk2GlobalDirectory(Text(request, "global"));
  Vesk2HomeDirectory(Text(request, "home"));
  printf("{\"id\": %ld", Number(request, "id", 0));
  size_t i = 0;
  const size_t count = sizeof kOperations / sizeof *kOperations;
  while (i < count && (!operation || strcmp(operation, kOperations[i].name) != 0)) i++;
  if (i < count) {
    kOperations[i].answer(request);
  } else {
    printf(", \"unsupported\": true");
  }
  printf("}\n");
  fflush(stdout);
}

int main(void) {
  static char line[MAX_LINE];
  static Request request;
  while (fgets(line, sizeof line, stdin)) {
    Read(line, &request);
    Answer(&request);
  }
  return 0;
}

/* SPDX-License-Identifier: Apache-2.0 */
/* why: asks about a chain of certificates now, or about a signed directory, and tells why the
 * answer is what it is and until when it holds. A C program that uses vesk2.h alone.
 *
 *   why HOME GLOBAL TAG SEQUENCE
 *   why HOME GLOBAL TAG MANIFEST DIRECTORY
 *
 * HOME and GLOBAL are the store roots, TAG the body of a tag, such as "(install (app calc))". Exits
 * with 0 for yes, 1 for no, 2 when nothing could be asked. */
#include <vesk2.h>

#include <stdio.h>
#include <time.h>

enum { YES = 0, NO = 1, FAILED = 2 };

static void print_time(const char* label, time_t when) {
  char text[64];
  const struct tm* const utc = when != 0 ? gmtime(&when) : NULL; /* 0: it has none */
  if (utc == NULL || strftime(text, sizeof text, "%Y-%m-%d %H:%M:%S UTC", utc) == 0) return;
  printf("%s %s\n", label, text);
}

/* All texts of an explanation can be printed as they are. */
static void print_facts(const Vesk2ExplanationStruct* why) {
  if (why->signer != NULL) printf("signed by %s\n", why->signer);
  print_time("signed at", why->signedAt);
  if (why->listed == 0) return;
  printf("%lu files listed, %lu as signed, %lu changed, %lu missing, %lu entries too many\n",
         (unsigned long)why->listed, (unsigned long)why->valid, (unsigned long)why->changed,
         (unsigned long)why->missing, (unsigned long)why->extra);
}

static void print_reasons(const Vesk2ExplanationStruct* why) {
  const Vesk2ReasonStruct* reason;
  for (reason = why->reasons; reason != NULL; reason = reason->next) {
    printf("%s: %s\n", reason->kind, reason->text);
  }
  if (!why->isComplete) printf("there may be more reasons\n");
}

static void print_path(const Vesk2ExplanationStruct* why) {
  uint32_t i;
  if (why->entry == NULL) return;
  printf("authority: %s", why->entry);
  for (i = 0; i < why->certificateCount; ++i) printf(" -> %u", (unsigned)why->certificates[i]);
  printf("\n");
  if (why->endedBy == NULL) {
    printf("it has no end\n");
    return;
  }
  print_time("it holds until", why->holdsUntil);
  printf("then ends: %s", why->endedBy);
  if (why->endCertificate != 0) printf(" %u", (unsigned)why->endCertificate);
  printf("\n");
}

static int ask_about_tree(const char* directory, const char* path, const char* tag,
                          Vesk2ExplanationStruct** why) {
  Manifest* manifest = NULL;
  int code = CreateManifestContext(&manifest, directory, path, tag);
  if (code != 0) return code;
  FailOnExtraEntries(manifest);
  code = VerifyManifestExplained(manifest, 0, 0, why);
  DeleteManifestContext(manifest);
  return code;
}

int main(int count, char** arguments) {
  Vesk2ExplanationStruct* why = NULL;
  const time_t now = time(NULL);
  int code;
  if (count != 5 && count != 6) {
    fprintf(stderr,
            "usage: why HOME GLOBAL TAG SEQUENCE | why HOME GLOBAL TAG MANIFEST DIRECTORY\n");
    return FAILED;
  }
  Vesk2HomeDirectory(arguments[1]);
  Vesk2GlobalDirectory(arguments[2]);
  code = count == 6 ? ask_about_tree(arguments[5], arguments[4], arguments[3], &why)
                    : Vesk2CertVerifyFileExplained(arguments[4], arguments[3], now, now, &why);
  if (code == 0) {
    printf("yes\n");
  } else {
    printf("no: %s (%s)\n", Vesk2ErrorWords(code), Vesk2ErrorName(code));
  }
  if (why == NULL) return code == 0 ? YES : FAILED; /* the tag or the file cannot be read */
  print_facts(why);
  print_reasons(why);
  print_path(why);
  Vesk2FreeExplanation(why);
  return code == 0 ? YES : NO;
}

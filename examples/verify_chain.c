/* SPDX-License-Identifier: Apache-2.0 */
/* verify_chain: reads a certificate sequence, shows what each certificate says, and asks whether
 * the chain grants an authorization now, on this machine. A C program that uses vesk2.h alone.
 *
 *   verify_chain HOME GLOBAL SEQUENCE TAG
 *
 * HOME and GLOBAL are the store roots, TAG the body of a tag, such as "(install (app calc))". Exits
 * with 0 when the tag is granted, 1 when it is not, 2 when the sequence cannot be read. */
#include <vesk2.h>

#include <stdio.h>
#include <string.h>
#include <time.h>

enum { GRANTED = 0, REFUSED = 1, FAILED = 2 };

/* Prints bytes that somebody else chose: none of them may reach the terminal as a command. */
static void print_escaped(const char* label, const char* text, size_t length) {
  char* const safe = Vesk2Escape(text, length);
  if (safe != NULL) printf("  %-10s %s\n", label, safe);
  Vesk2Free(safe);
}

static void print_text(const char* label, const char* text) {
  if (text != NULL) print_escaped(label, text, strlen(text));
}

static void print_time(const char* label, time_t when) {
  char text[64];
  const struct tm* const utc = when != 0 ? gmtime(&when) : NULL; /* 0: it has none */
  if (utc == NULL || strftime(text, sizeof text, "%Y-%m-%d %H:%M:%S UTC", utc) == 0) return;
  print_text(label, text);
}

static void print_chain(const Vesk2CertInfoStruct* chain) {
  unsigned number = 0;
  for (; chain != NULL; chain = chain->next) {
    printf("certificate %u\n", ++number);
    print_text("grants", chain->tag);
    if (chain->keyData != NULL) {
      printf("  %-10s a key, %u bytes\n", "to", (unsigned)chain->keyLength);
    } else {
      printf("  %-10s a subject that is no key\n", "to");
    }
    print_text("owned by", chain->owner);
    print_time("from", chain->notBefore);
    print_time("until", chain->notAfter);
    print_escaped("signed", chain->hashText, chain->hashTextLength);
  }
}

int main(int count, char** arguments) {
  Vesk2CertInfoStruct* chain = NULL;
  time_t now;
  int code;
  if (count != 5) {
    fprintf(stderr, "usage: verify_chain HOME GLOBAL SEQUENCE TAG\n");
    return FAILED;
  }
  Vesk2HomeDirectory(arguments[1]);
  Vesk2GlobalDirectory(arguments[2]);
  code = Vesk2CertRead(&chain, arguments[3]);
  if (code != 0) {
    fprintf(stderr, "verify_chain: cannot read the sequence: %s\n", Vesk2ErrorWords(code));
    return FAILED;
  }
  if (chain == NULL) {
    fprintf(stderr, "verify_chain: the sequence is empty\n");
    return FAILED;
  }
  print_chain(chain);
  /* Without a moment to ask about, a chain that has run out would pass. */
  now = time(NULL);
  code = Vesk2CertVerify(chain, arguments[4], now, now);
  if (code == 0) {
    printf("granted\n");
  } else {
    printf("refused: %s (%s)\n", Vesk2ErrorWords(code), Vesk2ErrorName(code));
  }
  Vesk2CertFree(chain);
  return code == 0 ? GRANTED : REFUSED;
}

/* SPDX-License-Identifier: Apache-2.0 */
/* plugin_host: loads the plug-ins of two vendors, each trusted under a tag of its own, and tells
 * why another one is not loaded.
 *
 *   plugin_host HOME GLOBAL PLACE
 *
 * HOME and GLOBAL are the store roots. PLACE is where plug-ins are installed:
 * PLACE/red/lib/plugin.so with the manifest PLACE/red.manifest, and the same for blue. Exits with 0
 * when all that are there were loaded, 1 when one was refused, 2 when nothing could be asked. */
#define _GNU_SOURCE
#include <vesk2.h>

#include <dlfcn.h>
#include <stdio.h>
#include <string.h>
#include <sys/stat.h>
#include <time.h>
#include <unistd.h>

enum { LOADED = 0, REFUSED = 1, FAILED = 2 };

/* What one vendor signs is no plug-in of the other's: a vendor's tag is asked for its own place. */
static const struct {
  const char* name;
  const char* tag;
} vendors[] = {{"red", "(plugin (vendor red))"}, {"blue", "(plugin (vendor blue))"}};

typedef const char* (*greet_function)(void);

/* Between the verification and dlopen anybody who can write there could change what was verified:
 * only a directory that is ours or root's, and no link, is one that plug-ins are installed in. */
static int is_installed(const char* path) {
  struct stat status;
  if (lstat(path, &status) != 0 || !S_ISDIR(status.st_mode)) return 0;
  return (status.st_uid == 0 || status.st_uid == geteuid()) && (status.st_mode & 022) == 0;
}

/* The texts of an explanation can be printed as they are. */
static void tell_why(const char* name, int code, const Vesk2ExplanationStruct* why) {
  const Vesk2ReasonStruct* reason;
  printf("%s: refused: %s (%s)\n", name, Vesk2ErrorWords(code), Vesk2ErrorName(code));
  if (why == NULL) return;
  if (why->listed != 0) {
    printf("%s:   %lu changed, %lu missing, %lu too many\n", name, (unsigned long)why->changed,
           (unsigned long)why->missing, (unsigned long)why->extra);
  }
  for (reason = why->reasons; reason != NULL; reason = reason->next) {
    printf("%s:   %s: %s\n", name, reason->kind, reason->text);
  }
}

/* Unlisted entries are looked for below the top directory only, as a manifest may lie in it. What
 * is loaded lies in lib, where a file too many is refused.
 *
 * Asks about now: a plug-in whose vendor was revoked since it was signed is not loaded. */
static int verify(const char* name, const char* directory, const char* path, const char* tag) {
  Manifest* manifest = NULL;
  Vesk2ExplanationStruct* why = NULL;
  const time_t now = time(NULL);
  int code = CreateManifestContext(&manifest, directory, path, tag);
  if (code == 0) {
    FailOnExtraEntries(manifest);
    code = VerifyManifestExplained(manifest, now, now, &why);
    DeleteManifestContext(manifest);
  }
  if (code != 0) tell_why(name, code, why);
  Vesk2FreeExplanation(why);
  return code;
}

static int run(const char* name, const char* file) {
  greet_function greet = NULL;
  void* const plugin = dlopen(file, RTLD_NOW | RTLD_LOCAL);
  void* const symbol = plugin != NULL ? dlsym(plugin, "plugin_greet") : NULL;
  if (symbol == NULL) {
    printf("%s: cannot be loaded: %s\n", name, dlerror());
    if (plugin != NULL) dlclose(plugin);
    return FAILED;
  }
  memcpy(&greet, &symbol, sizeof greet);
  printf("%s: loaded, and says: %s\n", name, greet());
  dlclose(plugin);
  return LOADED;
}

static int load(const char* place, const char* name, const char* tag) {
  char directory[4096];
  char manifest[4096];
  char file[4096];
  const int longest = snprintf(directory, sizeof directory, "%s/%s", place, name) +
                      (int)strlen(".manifest/lib/plugin.so");
  struct stat status;
  if (longest >= (int)sizeof file) return FAILED;
  snprintf(manifest, sizeof manifest, "%s/%s.manifest", place, name);
  snprintf(file, sizeof file, "%s/%s/lib/plugin.so", place, name);
  if (lstat(directory, &status) != 0) {
    printf("%s: not installed\n", name);
    return LOADED;
  }
  if (!is_installed(place) || !is_installed(directory)) {
    printf("%s: refused: others could change it\n", name);
    return REFUSED;
  }
  return verify(name, directory, manifest, tag) == 0 ? run(name, file) : REFUSED;
}

int main(int count, char** arguments) {
  size_t i;
  int worst = LOADED;
  if (count != 4) {
    fprintf(stderr, "usage: plugin_host HOME GLOBAL PLACE\n");
    return FAILED;
  }
  Vesk2HomeDirectory(arguments[1]);
  Vesk2GlobalDirectory(arguments[2]);
  for (i = 0; i < sizeof vendors / sizeof *vendors; ++i) {
    const int answer = load(arguments[3], vendors[i].name, vendors[i].tag);
    if (answer > worst) worst = answer;
  }
  return worst;
}

/* SPDX-License-Identifier: Apache-2.0 */
/* A C program that knows nothing but vesk2.h and the shared library: what it uses must have C
 * linkage and be exported. */
#include <vesk2.h>

#include <stdio.h>
#include <string.h>

static int failures = 0;

static void check(int holds, const char* what) {
  if (holds) return;
  fprintf(stderr, "failed: %s\n", what);
  ++failures;
}

static void check_context(void) {
  Vesk2ContextStruct* context = NULL;
  unsigned int length = 0;
  char* copy;
  check(Vesk2Init(NULL, 5) == VESK2_SUCCESS, "Vesk2Init without an output");
  check(Vesk2Init(&context, 5) == VESK2_SUCCESS && context->cryptoHandle == 5, "Vesk2Init");
  check(Vesk2FreeContext(context) == 0 && Vesk2FreeContext(NULL) == 0, "Vesk2FreeContext");
  Vesk2DoNothing();
  copy = Vesk2WideToAscii("name", 9, &length);
  check(copy != NULL && strcmp(copy, "name") == 0 && length == 4, "Vesk2WideToAscii");
  Vesk2Free(copy);
  copy = Vesk2AsciiToWide("name", 2, NULL);
  check(copy != NULL && strcmp(copy, "na") == 0, "Vesk2AsciiToWide");
  Vesk2Free(copy);
  check(Vesk2AsciiToWide(NULL, 2, &length) == NULL && length == 0, "no text");
  Vesk2Free(NULL);
}

static void check_version(void) {
  check(Vesk2VersionNumber() == 10100, "Vesk2VersionNumber");
  check(strcmp(Vesk2VersionExtra(), "r2441") == 0, "Vesk2VersionExtra");
  check(Vesk2VersionExtra() == Vesk2VersionExtraA(), "Vesk2VersionExtraA");
  check(strcmp(Vesk2ErrorMessage(VESK2_ERR_WRITE_FILE), "VESK2_ERR_WRITE_FILE") == 0, "code 76");
  check(strcmp(Vesk2ErrorMessage(VESK2_MAX_ERROR), "VESK_UNKNOWN_ERROR") == 0, "code 77");
}

static int end_it(void* user, const char* path, uint64_t bytes) {
  return user == NULL && path != NULL && bytes > 0;
}

static void check_manifest(void) {
  Manifest* manifest = NULL;
  FileItem ignored;
  Vesk2FileCallbacks callbacks;
  char name[] = "build";
  memset(&ignored, 0, sizeof ignored);
  ignored.name = name;
  memset(&callbacks, 0, sizeof callbacks);
  callbacks.fileStart = end_it;
  Vesk2HomeDirectory("/nonexistent");
  Vesk2GlobalDirectoryA("/nonexistent");
  check(CreateManifestContext(&manifest, "/nonexistent", "/nonexistent/m", "(install)") == 0,
        "CreateManifestContext");
  FailOnExtraEntries(manifest);
  SetExtraAclDirectory(manifest, "/nonexistent");
  SetIgnoredEntries(manifest, &ignored);
  SetStoreUpdate(manifest, 0);
  check(SetFileCallbacks(manifest, &callbacks) == VESK2_ERR_INVALID_PARAM, "a record of no size");
  callbacks.size = sizeof callbacks;
  check(SetFileCallbacks(manifest, &callbacks) == 0, "SetFileCallbacks");
  check(SetFileCallbacks(manifest, NULL) == 0, "no callbacks");
  check(VerifyManifest(manifest, 0, 0) == VESK2_ERR_OPEN_MANIFEST_FILE, "VerifyManifest");
  check(CompareManifestA(manifest, "/m") == VESK2_ERR_OPEN_MANIFEST_FILE, "CompareManifestA");
  check(GetTimeOfSigning(manifest) == 0, "GetTimeOfSigning");
  check(GetValidEntries(manifest) == NULL && GetInvalidEntries(manifest) == NULL &&
            GetMissingEntries(manifest) == NULL && GetExtraEntries(manifest) == NULL,
        "result lists");
  DeleteManifestContext(manifest);
  check(FreeFileItemList(NULL) == 0, "FreeFileItemList");
}

static void check_certificates(void) {
  Vesk2CertInfoStruct* chain = NULL;
  FileItem* found = CertFindA("/nonexistent");
  check(found == NULL && CertFind(NULL) == NULL, "CertFind");
  check(Vesk2CertReadCtx(&chain, "/nonexistent", NULL) == VESK2_ERR_FILE_OPEN, "Vesk2CertReadCtx");
  check(Vesk2CertReadCtxA(&chain, NULL, NULL) == VESK2_ERR_PARAM_NULL, "Vesk2CertReadCtxA");
  check(Vesk2CertRead(&chain, "/n") == Vesk2CertReadA(&chain, "/n"), "Vesk2CertRead");
  check(chain == NULL && Vesk2CertFree(chain) == VESK2_ERR_PARAM_NULL, "Vesk2CertFree");
  check(Vesk2CertVerify(chain, "(install)", 0, 0) == VESK2_ERR_PARAM_NULL, "Vesk2CertVerify");
  check(Vesk2CertVerifyFile(NULL, "(install)", 0, 0) == VESK2_ERR_PARAM_NULL, "a null path");
  check(Vesk2CertVerifyFileA("/nonexistent", "(install)", 0, 0) == VESK2_ERR_FILE_OPEN,
        "Vesk2CertVerifyFileA");
}

static void check_lists(void) {
  Vesk2CrlInfoStruct mark;
  Vesk2CrlInfoStruct* list = &mark;
  const int missing = VESK2_ERR_FILE_NOT_FOUND;
  check(Vesk2CrlRead(&list, "/nonexistent", NULL) == missing && list == NULL, "Vesk2CrlRead");
  list = &mark;
  check(Vesk2CrlReadA(&list, NULL, NULL) == missing && list == NULL, "Vesk2CrlReadA");
  list = &mark;
  check(Vesk2CrlFindA(&list, "a", NULL) == VESK2_ERR_FIND_DIR && list == NULL, "Vesk2CrlFindA");
  check(Vesk2CrlFree(list) == 0, "Vesk2CrlFree");
  check(Vesk2CrlVerify(NULL, NULL, 0, 0) == VESK2_ERR_PARAM_NULL, "Vesk2CrlVerify");
  check(Vesk2CrlVerifyFile("/n", NULL, 0, 0, NULL) == missing, "Vesk2CrlVerifyFile");
  check(Vesk2CrlVerifyFileA("/n", NULL, 0, 0, NULL) == missing, "Vesk2CrlVerifyFileA");
  check(Vesk2CrlImport("/n", NULL) == missing, "Vesk2CrlImport");
  check(Vesk2CrlImportA("/n", NULL) == missing, "Vesk2CrlImportA");
  check(Vesk2ImportCrls("/n") == missing && Vesk2ImportCrlsA("/n") == missing, "Vesk2ImportCrls");
}

int main(void) {
  check_context();
  check_version();
  check_manifest();
  check_certificates();
  check_lists();
  return failures == 0 ? 0 : 1;
}

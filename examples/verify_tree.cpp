// SPDX-License-Identifier: Apache-2.0
// verify_tree: asks whether a directory is exactly what its signed manifest says, by a signer who
// may say so on this machine, and names what differs. A C++ program over the exported classes.
//
//   verify_tree GLOBAL DIRECTORY MANIFEST TAG
//
// GLOBAL is the store root, TAG the body of a tag, such as "(install (app calc))". Exits with 0 for
// yes, 1 for no and 2 for wrong usage.
#include <cstdio>
#include <memory>
#include <vesk2.hpp>

namespace {

struct Delete {
  void operator()(ZvVesk2::Manifest* manifest) const { DeleteManifestContext(manifest); }
};

// Prints a name that somebody else chose: no byte of it may reach the terminal as a command.
void PrintName(const char* what, const char* name) {
  std::printf("  %s ", what);
  for (; *name != 0; ++name) {
    const auto c = static_cast<unsigned char>(*name);
    if (c >= 0x20 && c < 0x7F && c != '\\') {
      std::putchar(c);
    } else {
      std::printf("\\x%02X", static_cast<unsigned>(c));
    }
  }
  std::putchar('\n');
}

void PrintList(const char* what, const FileItem* list) {
  for (; list != nullptr; list = list->next) PrintName(what, list->name);
}

}  // namespace

int main(int count, char** arguments) {
  if (count != 5) {
    std::fprintf(stderr, "usage: verify_tree GLOBAL DIRECTORY MANIFEST TAG\n");
    return 2;
  }
  Vesk2GlobalDirectory(arguments[1]);
  ZvVesk2::Manifest* made = nullptr;
  int code = CreateManifestContext(&made, arguments[2], arguments[3], arguments[4]);
  const std::unique_ptr<ZvVesk2::Manifest, Delete> manifest(made);
  if (code == 0) {
    manifest->SetFailOnExtraEntries(true);  // nothing may be there that was not signed
    code = manifest->VerifyManifest(0, 0);  // authorized at the time of signing
    PrintList("changed", manifest->GetInvalid());
    PrintList("missing", manifest->GetMissing());
    PrintList("not listed", manifest->GetExtra());
  }
  std::printf("%s\n", code == 0  ? "yes"
                      : code > 0 ? Vesk2ErrorMessage(code)
                                 : ZvVesk2::V2SpkiError(code));
  return code == 0 ? 0 : 1;
}

// SPDX-License-Identifier: Apache-2.0
// files.h: reading small files whole, and writing files whole or not at all.
#ifndef VESK2_TOOLS_FILES_H
#define VESK2_TOOLS_FILES_H

#include <sys/types.h>

#include <functional>
#include <string>
#include <string_view>

#include "tools/vesk2/options/options.h"
#include "tools/vesk2/say/report.h"

namespace vesk2_command {

// "-" names standard input where a file is read, and standard output where one is written.
inline constexpr char kStandard[] = "-";

// What a file that is read is called in a message: its path, escaped, or "standard input".
std::string InputName(const std::string& path);

// A Trouble "PATH: TEXT" that names the file for machines too.
Trouble FileTrouble(const std::string& path, const std::string& text, const std::string& reason);

// Why a file that the library could not open cannot be read, in words.
std::string WhyUnreadable(const std::string& path);

// ReadFile returns the contents of a regular file or of standard input; Trouble when it cannot, or
// past `limit` bytes. Standard input is read once and kept: a file may be looked at twice.
std::string ReadFile(const std::string& path, size_t limit);

// InputPath returns a path under which the library can open what `path` names: for standard input
// that of a file without a name that holds all of it.
std::string InputPath(const std::string& path);

// Trouble if something is at `path`, unless `force`; what is no file is never replaced.
void RefuseExisting(const std::string& path, bool force);

// Trouble unless there is a directory for a file at `path`: asked before work that takes long.
void RequireDirectory(const std::string& path);

// --force and --dry-run, of a command that writes.
struct WriteFlags {
  bool force = false;   // replace what is there
  bool dryRun = false;  // check only, and note what would be written
};
void AddWriteFlags(OptionList& list, WriteFlags& flags,
                   const std::string& dryRun = "Say what would be written, and write nothing");

struct WriteOptions {
  WriteFlags flags = {};
  // Called with a path of the finished file before it has its name; throws to refuse it.
  std::function<void(const std::string&)> check = nullptr;
  std::string said = {};  // what the note "wrote PATH" goes on with
  mode_t mode = 0666;     // less the umask
  // A file of the global store: its directory is made, and all can read both whatever the umask. An
  // entry that only root can read trusts, and revokes, for nobody else.
  bool inStore = false;
};

// WriteFile writes a file that has no name until it is finished and checked: what stands at `path`
// is the old file or the whole new one, whatever happens. It notes that, but for standard output of
// which there is nothing else to say. Returns false for a dry run, which writes nothing. The path
// goes into "written" of the answer, or into "would_write". Throws Trouble.
bool WriteFile(const std::string& path, std::string_view bytes, const WriteOptions& options);

}  // namespace vesk2_command

#endif  // VESK2_TOOLS_FILES_H

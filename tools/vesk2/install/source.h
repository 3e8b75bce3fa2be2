// SPDX-License-Identifier: Apache-2.0
// source.h: where an installation comes from, a directory or an archive: entries with their bytes,
// one after the other. Nothing that they say is proved; who takes them compares the names with what
// is listed, and has what was taken verified.
#ifndef VESK2_TOOLS_SOURCE_H
#define VESK2_TOOLS_SOURCE_H

#include <cstdint>
#include <memory>
#include <optional>
#include <string>

#include "tools/vesk2/install/wanted.h"

namespace vesk2_command {

struct SourceEntry {
  std::string path = {};   // below the root of what is installed; empty for what cannot be there
  std::string outer = {};  // of an archive, below its own root
  EntryKind kind = EntryKind::kOther;
  std::string problem = {};  // why there is no such file to be taken: "a link"
  bool executable = false;
  uint64_t size = 0;  // as the source says
};

class Source {
 public:
  virtual ~Source() = default;

  // Next gives the next entry, and nothing at the end. Trouble for what cannot be read.
  virtual std::optional<SourceEntry> Next() = 0;
  // Read gives up to `size` bytes of the file that Next gave; 0 at its end.
  virtual size_t Read(char* out, size_t size) = 0;
  // The bytes that were read to get here, where that can be more than Read gave.
  virtual uint64_t Unpacked() const { return 0; }
};

// OpenSource opens a directory, whose listed files are given in the order of `wanted`, or an
// archive, whose entries are given as they come: tar, which gzip, xz or zstd may have compressed,
// or zip; "-" for one on standard input. With `below` they are those below this directory of the
// archive. Trouble for anything else. `wanted` must outlive the source.
std::unique_ptr<Source> OpenSource(const std::string& path, const std::string& below,
                                   const Wanted& wanted);

// The two kinds. Each takes over the descriptor.
std::unique_ptr<Source> OpenDirectory(const std::string& path, int directory, const Wanted& wanted);
std::unique_ptr<Source> OpenArchive(const std::string& path, int file, const std::string& below);

// LoadArchiveLibrary loads what reads archives, if this machine has it. A command that confines
// itself calls this before: libraries cannot be opened then.
void LoadArchiveLibrary();

}  // namespace vesk2_command

#endif  // VESK2_TOOLS_SOURCE_H

// SPDX-License-Identifier: Apache-2.0
// archive_library.h: libarchive, which is loaded when something is installed. It brings a dozen
// libraries along; a verification would load them all for nothing, and start twice as slowly.
#pragma once

#include <archive.h>
#include <archive_entry.h>

namespace vesk2_command {

// The functions that are used, each under its own name.
#define VESK2_ARCHIVE_FUNCTIONS(X)    \
  X(archive_entry_filetype)           \
  X(archive_entry_hardlink)           \
  X(archive_entry_pathname)           \
  X(archive_entry_perm)               \
  X(archive_entry_size)               \
  X(archive_errno)                    \
  X(archive_error_string)             \
  X(archive_filter_bytes)             \
  X(archive_read_data)                \
  X(archive_read_free)                \
  X(archive_read_new)                 \
  X(archive_read_next_header)         \
  X(archive_read_open_fd)             \
  X(archive_read_support_filter_gzip) \
  X(archive_read_support_filter_xz)   \
  X(archive_read_support_filter_zstd) \
  X(archive_read_support_format_tar)  \
  X(archive_read_support_format_zip)

struct ArchiveLibrary {
#define VESK2_DECLARE(name) decltype(&::name) name = nullptr;
  VESK2_ARCHIVE_FUNCTIONS(VESK2_DECLARE)
#undef VESK2_DECLARE
};

// Archives gives its functions; Trouble when this machine does not have it.
const ArchiveLibrary& Archives();

}  // namespace vesk2_command

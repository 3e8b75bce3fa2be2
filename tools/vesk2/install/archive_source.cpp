// SPDX-License-Identifier: Apache-2.0
// archive_source.cpp: installing from an archive, which anybody may have made.
#include <locale.h>

#include <algorithm>
#include <cerrno>
#include <new>
#include <string_view>

#include "tools/vesk2/files/descriptor.h"
#include "tools/vesk2/files/files.h"
#include "tools/vesk2/install/archive_library.h"
#include "tools/vesk2/install/source.h"

namespace vesk2_command {
namespace {

struct ArchiveDeleter {
  void operator()(archive* reader) const { Archives().archive_read_free(reader); }
};

// Archives tell names in encodings, manifests in bytes. With this locale a name in UTF-8 is the
// same in both, and any other is passed through; where there is no such locale, ASCII is.
class Utf8Names {
 public:
  Utf8Names() : locale_(newlocale(LC_CTYPE_MASK, "C.UTF-8", nullptr)) {
    if (locale_ != nullptr) old_ = uselocale(locale_);
  }
  ~Utf8Names() {
    if (locale_ == nullptr) return;
    uselocale(old_);
    freelocale(locale_);
  }
  Utf8Names(const Utf8Names&) = delete;
  Utf8Names& operator=(const Utf8Names&) = delete;

 private:
  locale_t locale_;
  locale_t old_ = nullptr;
};

// "./sub//one/" as "sub/one", "." as "". Nothing for what no listing names: an absolute path, and
// one that climbs.
std::optional<std::string> Normal(std::string_view path) {
  std::string normal;
  if (path.starts_with('/')) return std::nullopt;
  while (!path.empty()) {
    const std::string_view part = path.substr(0, path.find('/'));
    path.remove_prefix(std::min(path.size(), part.size() + 1));
    if (part == "..") return std::nullopt;
    if (part.empty() || part == ".") continue;
    if (!normal.empty()) normal += '/';
    normal += part;
  }
  return normal;
}

std::string NormalBelow(const std::string& below) {
  const std::optional<std::string> normal = Normal(below);
  if (!normal) throw Trouble("--below names a directory within the archive", "usage");
  return *normal;
}

class ArchiveSource : public Source {
 public:
  ArchiveSource(std::string path, int file, const std::string& below)
      : path_(std::move(path)),
        file_(file),
        below_(NormalBelow(below)),
        library_(Archives()),
        reader_(library_.archive_read_new()) {
    if (!reader_) throw std::bad_alloc();
    archive* const reader = reader_.get();
    // Where the library was built without one of these, it would start a program to do it.
    for (const int code : {library_.archive_read_support_filter_gzip(reader),
                           library_.archive_read_support_filter_xz(reader),
                           library_.archive_read_support_filter_zstd(reader),
                           library_.archive_read_support_format_tar(reader),
                           library_.archive_read_support_format_zip(reader)}) {
      if (code != ARCHIVE_OK) throw Trouble("this machine's libarchive cannot unpack by itself");
    }
    Require(library_.archive_read_open_fd(reader, file_.get(), size_t{64} << 10));
  }

  std::optional<SourceEntry> Next() override {
    const Utf8Names names;
    archive_entry* entry = nullptr;
    const int code = library_.archive_read_next_header(reader_.get(), &entry);
    if (code == ARCHIVE_EOF) return std::nullopt;
    Require(code);
    const char* const name = library_.archive_entry_pathname(entry);
    SourceEntry found;
    const std::optional<std::string> path = Normal(name != nullptr ? name : "/");
    found.outer = path.value_or("");
    found.path = path ? Below(*path) : "";
    found.problem = Problem(*entry);
    if (found.problem.empty()) {
      const bool isFile = library_.archive_entry_filetype(entry) == AE_IFREG;
      found.kind = isFile ? EntryKind::kFile : EntryKind::kDirectory;
    }
    found.executable = (library_.archive_entry_perm(entry) & 0100) != 0;
    const la_int64_t size = library_.archive_entry_size(entry);
    found.size = size > 0 ? static_cast<uint64_t>(size) : 0;
    return found;
  }

  size_t Read(char* out, size_t size) override {
    const la_ssize_t got = library_.archive_read_data(reader_.get(), out, size);
    if (got < 0) Require(static_cast<int>(got));
    return got > 0 ? static_cast<size_t>(got) : 0;
  }

  uint64_t Unpacked() const override {
    const la_int64_t bytes = library_.archive_filter_bytes(reader_.get(), 0);
    return bytes > 0 ? static_cast<uint64_t>(bytes) : 0;
  }

 private:
  // Throws unless the library went on; a warning is about what is not taken from it, or about what
  // the verification looks at.
  void Require(int code) const {
    if (code == ARCHIVE_OK || code == ARCHIVE_WARN) return;
    if (library_.archive_errno(reader_.get()) == ENOMEM) throw std::bad_alloc();
    const char* const why = library_.archive_error_string(reader_.get());
    throw FileTrouble(path_, "no archive that can be read: " + Escape(why != nullptr ? why : "?"),
                      "malformed");
  }

  // Empty for what is not below.
  std::string Below(const std::string& path) const {
    if (below_.empty()) return path;
    return path.starts_with(below_ + "/") ? path.substr(below_.size() + 1) : "";
  }

  std::string Problem(archive_entry& entry) const {
    if (library_.archive_entry_hardlink(&entry) != nullptr) return "a link to another entry";
    switch (library_.archive_entry_filetype(&entry)) {
      case AE_IFREG:
      case AE_IFDIR:
        return "";
      case AE_IFLNK:
        return "a link";
      default:
        return "neither a file nor a directory";
    }
  }

  const std::string path_;
  const Descriptor file_;
  const std::string below_;
  const ArchiveLibrary& library_;
  const std::unique_ptr<archive, ArchiveDeleter> reader_;
};

}  // namespace

std::unique_ptr<Source> OpenArchive(const std::string& path, int file, const std::string& below) {
  return std::make_unique<ArchiveSource>(path, file, below);
}

}  // namespace vesk2_command

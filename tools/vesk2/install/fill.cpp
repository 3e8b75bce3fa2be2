// SPDX-License-Identifier: Apache-2.0
// fill.cpp: from a source to a stage.
#include "tools/vesk2/install/fill.h"

#include <algorithm>
#include <charconv>
#include <limits>
#include <set>
#include <vector>

namespace vesk2_command {
namespace {

// Of an archive, beside what is installed: entries that are not listed, and the bytes around and
// between the files.
constexpr size_t kMostUnlisted = 100'000;
constexpr uint64_t kAround = uint64_t{64} << 20;
constexpr size_t kPiece = size_t{256} << 10;

class Filling {
 public:
  Filling(Stage& stage, Source& source, const Wanted& wanted, uint64_t most,
          const Vesk2FileCallbacks* callbacks, Filled& filled)
      : stage_(stage),
        source_(source),
        wanted_(wanted),
        most_(most),
        callbacks_(callbacks),
        filled_(filled),
        piece_(kPiece) {}

  std::optional<ExitCode> Run() {
    while (const std::optional<SourceEntry> entry = source_.Next()) {
      const EntryKind kind = wanted_.KindOf(entry->path);
      if (kind == EntryKind::kOther) {
        PassOver(*entry);
      } else if (kind == EntryKind::kFile && !seen_.insert(entry->path).second) {
        return No("named-twice", "there are two entries " + Escape(entry->path));
      } else if (entry->kind != kind && kind == EntryKind::kDirectory) {
        return No("not-a-directory",
                  Escape(entry->path) + " is listed as a directory, and is none");
      } else if (entry->kind != kind) {
        filled_.problems[entry->path] = entry->problem.empty() ? "a directory" : entry->problem;
        Charge(entry->size);
      } else if (kind == EntryKind::kFile && entry->size <= Left()) {
        Take(*entry);
      } else {
        Charge(entry->size);
      }
      if (TooMuch()) return RefuseSize();
    }
    return std::nullopt;
  }

 private:
  void PassOver(const SourceEntry& entry) {
    if (++entries_ > kMostUnlisted) return;
    Charge(entry.size);  // which may have to be unpacked to get past it
    if (entry.kind == EntryKind::kDirectory) return;
    ++filled_.passedOver;
    const size_t slash = entry.outer.find('/');
    const std::string top = slash != std::string::npos ? entry.outer.substr(0, slash) : "";
    filled_.common = filled_.common.value_or(top) == top ? top : "";
  }

  uint64_t Left() const { return most_ - std::min(most_, spent_); }
  void Charge(uint64_t bytes) {
    spent_ = bytes > std::numeric_limits<uint64_t>::max() - spent_
                 ? std::numeric_limits<uint64_t>::max()
                 : spent_ + bytes;
  }
  bool TooMuch() const {
    return spent_ > most_ || entries_ > kMostUnlisted ||
           source_.Unpacked() - std::min(source_.Unpacked(), kAround) > most_;
  }

  void Take(const SourceEntry& entry) {
    stage_.WriteFile(entry.path, entry.executable, [&]() -> std::string_view {
      const size_t got = source_.Read(piece_.data(), piece_.size());
      Charge(got);
      // The rest is not written any more.
      if (spent_ > most_) return {};
      if (callbacks_ != nullptr) (void)callbacks_->fileBytes(callbacks_->user, got);
      return {piece_.data(), got};
    });
    if (callbacks_ != nullptr) callbacks_->fileEnd(callbacks_->user, entry.path.c_str(), 0);
  }

  ExitCode RefuseSize() const {
    if (entries_ > kMostUnlisted) {
      return No("too-large", "there are more than " + std::to_string(kMostUnlisted) +
                                 " entries that are not listed");
    }
    return No("too-large",
              "there are more than " + std::to_string(most_) + " bytes (--max-bytes allows more)");
  }

  Stage& stage_;
  Source& source_;
  const Wanted& wanted_;
  const uint64_t most_;
  const Vesk2FileCallbacks* const callbacks_;
  Filled& filled_;
  std::vector<char> piece_;
  std::set<std::string> seen_;
  uint64_t spent_ = 0;
  size_t entries_ = 0;  // that are not listed
};

}  // namespace

void AddSizeOption(OptionList& list, std::string& text) {
  text = "4G";
  list.Add("--max-bytes", text, "The most that is taken, unpacked; K, M, G or T may follow")
      .ShowPreset();
}

uint64_t ParseSize(const std::string& text) {
  constexpr std::string_view units = "KMGT";
  uint64_t size = 0;
  const char* const end = text.data() + text.size();
  const auto [rest, error] = std::from_chars(text.data(), end, size);
  const size_t unit = rest != end ? units.find(*rest) : 0;
  const unsigned shift = rest == end ? 0 : 10 * (static_cast<unsigned>(unit) + 1);
  if (error != std::errc() || end - rest > 1 || unit == std::string_view::npos || size == 0 ||
      size > std::numeric_limits<uint64_t>::max() >> shift) {
    throw Trouble("--max-bytes: a number is expected that may end in K, M, G or T: " + Escape(text),
                  "usage");
  }
  return size << shift;
}

std::optional<ExitCode> Fill(Stage& stage, Source& source, const Wanted& wanted, uint64_t most,
                             const Vesk2FileCallbacks* callbacks, Filled& filled) {
  return Filling(stage, source, wanted, most, callbacks, filled).Run();
}

}  // namespace vesk2_command

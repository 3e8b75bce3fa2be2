// SPDX-License-Identifier: Apache-2.0
// descriptor.h: open files that are closed with their owner, and paths where nothing is.
#ifndef VESK2_TOOLS_DESCRIPTOR_H
#define VESK2_TOOLS_DESCRIPTOR_H

#include <unistd.h>

#include <cerrno>
#include <string>
#include <string_view>
#include <utility>

namespace vesk2_command {

class Descriptor {
 public:
  explicit Descriptor(int number = -1) : number_(number) {}
  ~Descriptor() { Take(-1); }
  Descriptor(const Descriptor&) = delete;
  Descriptor& operator=(const Descriptor&) = delete;
  void Take(int number) {
    if (number_ >= 0) close(number_);
    number_ = number;
  }
  // The open file is the caller's from now on.
  int Give() { return std::exchange(number_, -1); }
  int get() const { return number_; }
  // A path under which anybody in this process can open the file.
  std::string Path() const { return "/proc/self/fd/" + std::to_string(number_); }

 private:
  int number_;
};

// Whether an error of looking at a path says that nothing is there.
inline bool IsNothing(int error) { return error == ENOENT || error == ENOTDIR; }

// MemoryFile makes a file in memory that holds `bytes`, read from its beginning. Trouble.
int MemoryFile(std::string_view bytes);

}  // namespace vesk2_command

#endif  // VESK2_TOOLS_DESCRIPTOR_H

// SPDX-License-Identifier: Apache-2.0
#include "fuzz/fuzz_support.h"

using namespace ZvVesk2;

namespace vesk2fuzz {

std::string Token(std::string_view bytes) {
  return std::to_string(bytes.size()) + ":" + std::string(bytes);
}

std::string Print(DExpression* value) {
  char* text = nullptr;
  size_t size = 0;
  FILE* stream = open_memstream(&text, &size);
  const int code = value->PrintCanonical(stream);
  std::fclose(stream);
  std::string out(text, size);
  std::free(text);
  FUZZ_CHECK(code == 0);
  return out;
}

std::string ExportOf(SExpression* value) {
  unsigned char* out = nullptr;
  unsigned int length = 0;
  if (value->Export(out, length) != 0) return "";
  const Bytes owned(out);
  FUZZ_CHECK(length == value->CanonicalLength());
  return {reinterpret_cast<const char*>(out), length};
}

std::string WithoutZeros(std::string_view canonical) {
  std::string out;
  for (size_t i = 0; i < canonical.size();) {
    const bool hint = canonical[i] == '[';
    if (hint || canonical[i] == '(' || canonical[i] == ')') {
      const size_t end = hint ? canonical.find(']', i) + 1 : i + 1;
      out += canonical.substr(i, end - i);
      i = end;
      continue;
    }
    size_t length = 0;
    for (; canonical[i] != ':'; ++i) length = length * 10 + static_cast<size_t>(canonical[i] - '0');
    out += std::to_string(length);
    out += canonical.substr(i, length + 1);
    i += length + 1;
  }
  return out;
}

std::string_view Choices::Take(size_t limit) {
  const std::string_view taken = rest_.substr(0, limit);
  rest_.remove_prefix(taken.size());
  return taken;
}

unsigned Choices::Byte() {
  if (rest_.empty()) return 0;
  const auto byte = static_cast<unsigned char>(rest_.front());
  rest_.remove_prefix(1);
  return byte;
}

}  // namespace vesk2fuzz

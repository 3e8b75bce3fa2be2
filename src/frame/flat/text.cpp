// SPDX-License-Identifier: Apache-2.0
// Flat functions: conversion between the two forms of text, and escaping. Both forms are bytes
// here; on a system with wide file names they would differ.
#include <vesk2/wording.h>

#include <cstring>

#include "src/platform/text.h"

char* Vesk2WideToAscii(const char* text, uint32_t length, unsigned int* outLength) {
  char* const copy = ZVsysutil::zv_ftoa_copy_n(text, length);
  if (outLength != nullptr) {
    *outLength = copy != nullptr ? static_cast<unsigned int>(std::strlen(copy)) : 0;
  }
  return copy;
}

char* Vesk2AsciiToWide(const char* text, uint32_t length, unsigned int* outLength) {
  char* const copy = ZVsysutil::zv_atof_copy_n(text, length);
  if (outLength != nullptr) {
    *outLength = static_cast<unsigned int>(ZVsysutil::zv_fstrlen(copy));
  }
  return copy;
}

char* Vesk2Escape(const void* bytes, size_t length) {
  return bytes != nullptr ? ZvVesk2::Wording::Escape(bytes, length) : nullptr;
}

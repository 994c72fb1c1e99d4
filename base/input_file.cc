// SPDX-License-Identifier: Apache-2.0
#include "base/input_file.h"

#include <cerrno>
#include <cstdio>
#include <cstring>
#include <memory>

#include "base/error.h"

namespace qz::base {
namespace {

struct Closer {
  void operator()(std::FILE* file) const { std::fclose(file); }
};

[[noreturn]] void Fail(const std::string& path, const char* what) {
  const int error = errno;
  throw InputError(path + ": " + what + ": " + std::strerror(error));
}

}  // namespace

std::vector<uint8_t> ReadWholeFile(const std::string& path, size_t max_bytes) {
  const std::unique_ptr<std::FILE, Closer> file(std::fopen(path.c_str(), "rb"));
  if (!file) Fail(path, "can't be opened");
  std::vector<uint8_t> bytes;
  uint8_t buffer[4096];
  size_t got;
  while ((got = std::fread(buffer, 1, sizeof(buffer), file.get())) > 0) {
    bytes.insert(bytes.end(), buffer, buffer + got);
    if (bytes.size() > max_bytes) {
      throw InputError(path + ": has more than " + std::to_string(max_bytes) + " bytes");
    }
  }
  if (std::ferror(file.get()) != 0) Fail(path, "can't be read");
  return bytes;
}

}  // namespace qz::base

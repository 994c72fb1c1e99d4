// Unnamed temporary files: nothing of them stays, however the program ends.
#pragma once

#include <cstddef>
#include <string>

#include "file_descriptor.h"

namespace qz::tools {

// All throw AudioError.
FileDescriptor OpenTemporaryFile();
void WriteToTemporaryFile(const FileDescriptor& file, const void* bytes, size_t count);

// Throws AudioError with what errno says: "NAME: WHAT: Reason".
[[noreturn]] void ThrowSystemError(const std::string& name, const char* what);

}  // namespace qz::tools

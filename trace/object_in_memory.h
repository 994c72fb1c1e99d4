// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <cstddef>
#include <cstdint>
#include <string>

namespace qz::trace {

// Finds a static object in the library or program that `inside` points into, by the symbol table of
// its file, which knows objects of unnamed namespaces too. Several may have that name; the one
// meant has at least `min_bytes`. Null with a message in `*error` if it isn't there, as in a
// file without symbols.
const uint8_t* FindObject(const void* inside, const std::string& name, size_t min_bytes,
                          std::string* error);

}  // namespace qz::trace

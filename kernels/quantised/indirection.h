// SPDX-License-Identifier: Apache-2.0
// Row lists: arrays of row addresses, or of offsets that a call turns into addresses. Entries are
// read as numbers, since an offset is no pointer until the base has been added.
#pragma once

#include <cstddef>
#include <cstdint>
#include <cstring>

namespace qz {

static inline uintptr_t ListEntry(const int8_t* const* list, size_t index) {
  uintptr_t entry;
  std::memcpy(&entry, list + index, sizeof entry);
  return entry;
}

static inline const int8_t* RowAt(uintptr_t address) {
  return reinterpret_cast<const int8_t*>(address);
}

// The row of an entry: `offset` bytes further, except for the entry that means a row of zeros.
static inline const int8_t* ListedRow(const int8_t* const* list, size_t index, size_t offset,
                                      const int8_t* zero) {
  const uintptr_t entry = ListEntry(list, index);
  return RowAt(entry == reinterpret_cast<uintptr_t>(zero) ? entry : entry + offset);
}

static inline const int8_t* const* Advance(const int8_t* const* list, size_t bytes) {
  return reinterpret_cast<const int8_t* const*>(reinterpret_cast<uintptr_t>(list) + bytes);
}

}  // namespace qz

// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <new>
#include <utility>

namespace chre {

// One object of type T in static storage, built and destroyed by hand: no heap, no code at load.
template <typename T>
class Singleton {
 public:
  // Constructs the object unless it exists. The flag is set first.
  template <typename... Args>
  static void init(Args&&... args) {
    if (sIsInitialized) return;
    sIsInitialized = true;
    new (sObject) T(std::forward<Args>(args)...);
  }

  // Destroys the object if it exists.
  static void deinit() {
    if (!sIsInitialized) return;
    get()->~T();
    sIsInitialized = false;
  }

  // The object; it must exist.
  static T* get() { return std::launder(reinterpret_cast<T*>(sObject)); }

 private:
  alignas(T) static inline unsigned char sObject[sizeof(T)];
  static inline bool sIsInitialized = false;
};

}  // namespace chre

// SPDX-License-Identifier: Apache-2.0
// What the compiler and nanopb's library expect of a C and C++ run-time library and a nanoapp does
// not have. Part of the module alone: linked into a program, these would replace the real ones.

#include <cstddef>
#include <cstdint>

// Nothing here allocates with new. The operators are here so that the module needs no library for
// them: an address that faults at first use where there would be an allocation, and nothing where
// there would be a release (virtual destructors refer to operator delete).

void* operator new[](size_t) { return reinterpret_cast<void*>(uintptr_t{0xDEADBEEF}); }
// NOLINTBEGIN(misc-new-delete-overloads): the single operator new is never called, not even
// referred to.
void operator delete(void*) noexcept {}
void operator delete[](void*) noexcept {}
void operator delete(void*, size_t) noexcept {}
void operator delete[](void*, size_t) noexcept {}
// NOLINTEND(misc-new-delete-overloads)

// The compiler knows these names as another library's: they are hidden here like all else.
#pragma GCC visibility push(hidden)
extern "C" {

// A call of an abstract function: there is nobody to report it to.
void __cxa_pure_virtual() { __builtin_trap(); }

// nanopb's library is built with stack checks, which on some processors take the value that they
// watch from here, and can grow pointer fields, of which our messages have none: the linker hands
// its calls of realloc and free to these.
void __stack_chk_fail() { __builtin_trap(); }
extern const uintptr_t __stack_chk_guard;
const uintptr_t __stack_chk_guard = 0xFF0A000D;
void* __wrap_realloc(void*, size_t) { return nullptr; }
void __wrap_free(void*) {}

#ifdef __arm__
// Where the compiler's division routines go that nanopb's library calls; nothing divides by zero.
void __aeabi_idiv0() { __builtin_trap(); }
#endif
}
#pragma GCC visibility pop

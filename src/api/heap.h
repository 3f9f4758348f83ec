#pragma once
// The library's own allocation path. Every object the library hands out is allocated here, so that
// DllSetMemoryErrorHandler can install a routine that runs when memory is exhausted. The process's
// global allocator is left alone.

#include <cstddef>

namespace zel::heap {

using FailureRoutine = void (*)(int errorCode);

// Error code passed to the failure routine when an allocation cannot be satisfied.
inline constexpr int kOutOfMemory = 12;

// Returns memory, or null when memory is exhausted and the installed routine returned (or none is
// installed). The routine normally ends the process and never returns.
void* allocate(std::size_t bytes) noexcept;
void release(void* block) noexcept;

// Runs the installed failure routine as for a failed allocation; for memory that ran out outside
// this heap (a std::bad_alloc caught at the interface). Returns when no routine is installed or the
// routine returned.
void reportExhaustion() noexcept;

// Installs a failure routine and returns the previous one (null when none was installed).
FailureRoutine setFailureRoutine(FailureRoutine routine) noexcept;

// Test seam: the next `count` allocations fail as if memory were exhausted.
void failNextAllocations(unsigned count) noexcept;

}  // namespace zel::heap

namespace zel {

// Base of every class whose objects the library allocates: routes `new` and `delete` through the
// library's heap. `new` yields null instead of throwing when memory is exhausted.
struct HeapObject {
    static void* operator new(std::size_t bytes) noexcept { return heap::allocate(bytes); }
    static void operator delete(void* block) noexcept { heap::release(block); }
    static void* operator new[](std::size_t bytes) noexcept { return heap::allocate(bytes); }
    static void operator delete[](void* block) noexcept { heap::release(block); }
};

}  // namespace zel

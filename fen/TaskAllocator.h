#pragma once
/// \file
/// The storage allocator of the library's strings and vectors.
///
/// The raw calls return null on failure; the checked calls throw
/// BadAllocation. A reallocation to size zero may return null without that
/// being a failure. Tests can make allocations fail through a hook.

#include <cstddef>

namespace qv::fen {

/// Allocates `bytes`; null on failure.
void* TaskMemAlloc(std::size_t bytes) noexcept;
/// Resizes `block` (null allocates); null on failure, `block` then stays valid.
void* TaskMemRealloc(void* block, std::size_t bytes) noexcept;
/// Frees `block`; null is ignored.
void TaskMemFree(void* block) noexcept;

/// TaskMemAlloc that throws BadAllocation on failure.
void* CheckedAlloc(std::size_t bytes);
/// TaskMemRealloc that throws BadAllocation on failure of a non-zero request.
void* CheckedRealloc(void* block, std::size_t bytes);

/// Decides whether an allocation of `bytes` should fail; for tests only.
using AllocationFailureHook = bool (*)(std::size_t bytes);
/// Installs `hook` (null removes it) and returns the previous one.
AllocationFailureHook SetAllocationFailureHook(AllocationFailureHook hook) noexcept;

} // namespace qv::fen

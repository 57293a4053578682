#include "fen/TaskAllocator.h"

#include "fen/BadAllocation.h"

#include <atomic>
#include <cstdlib>

namespace qv::fen {
namespace {

std::atomic<AllocationFailureHook> failureHook{nullptr};

bool ShouldFail(std::size_t bytes) noexcept
{
    AllocationFailureHook hook = failureHook.load(std::memory_order_acquire);
    return hook != nullptr && hook(bytes);
}

} // namespace

void* TaskMemAlloc(std::size_t bytes) noexcept
{
    if (ShouldFail(bytes))
        return nullptr;
    // malloc(0) may return null; a zero-byte block is still a valid block here.
    return std::malloc(bytes == 0 ? 1 : bytes);
}

void* TaskMemRealloc(void* block, std::size_t bytes) noexcept
{
    if (bytes == 0) {
        std::free(block);
        return nullptr;
    }
    if (ShouldFail(bytes))
        return nullptr;
    return std::realloc(block, bytes);
}

void TaskMemFree(void* block) noexcept
{
    std::free(block);
}

void* CheckedAlloc(std::size_t bytes)
{
    void* block = TaskMemAlloc(bytes);
    if (block == nullptr)
        throw BadAllocation();
    return block;
}

void* CheckedRealloc(void* block, std::size_t bytes)
{
    void* resized = TaskMemRealloc(block, bytes);
    if (resized == nullptr && bytes != 0)
        throw BadAllocation();
    return resized;
}

AllocationFailureHook SetAllocationFailureHook(AllocationFailureHook hook) noexcept
{
    return failureHook.exchange(hook, std::memory_order_acq_rel);
}

} // namespace qv::fen

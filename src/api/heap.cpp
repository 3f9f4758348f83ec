#include "api/heap.h"

#include <atomic>
#include <cstdlib>

namespace zel::heap {
namespace {

std::atomic<FailureRoutine> failureRoutine{nullptr};
std::atomic<unsigned> pendingFailures{0};

// Takes one simulated failure if the test seam has any left; the compare-exchange keeps the count
// exact when several threads allocate at once.
bool consumeSimulatedFailure() noexcept
{
    unsigned left = pendingFailures.load(std::memory_order_relaxed);
    while (left != 0) {
        if (pendingFailures.compare_exchange_weak(left, left - 1, std::memory_order_relaxed)) {
            return true;
        }
    }
    return false;
}

}  // namespace

void* allocate(std::size_t bytes) noexcept
{
    // malloc(0) may legitimately return null, which would read as exhaustion.
    void* block = consumeSimulatedFailure() ? nullptr : std::malloc(bytes == 0 ? 1 : bytes);
    if (block == nullptr) {
        reportExhaustion();
    }
    return block;
}

void reportExhaustion() noexcept
{
    if (FailureRoutine routine = failureRoutine.load(std::memory_order_acquire)) {
        routine(kOutOfMemory);
    }
}

void release(void* block) noexcept { std::free(block); }

FailureRoutine setFailureRoutine(FailureRoutine routine) noexcept
{
    return failureRoutine.exchange(routine, std::memory_order_acq_rel);
}

void failNextAllocations(unsigned count) noexcept { pendingFailures.store(count, std::memory_order_relaxed); }

}  // namespace zel::heap

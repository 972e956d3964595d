#include "support/Allocations.h"

#include <atomic>
#include <cstdint>
#include <cstdlib>
#include <new>

namespace {

constexpr std::size_t kLarge = 1024 * 1024;

thread_local bool gArmed = false;
thread_local std::size_t gLeft = 0;
std::atomic<std::size_t> gLargeBlocks{0};

// Precedes each block.
struct alignas(std::max_align_t) Header {
    std::size_t size;
};

} // namespace

void* operator new(std::size_t size)
{
    if (gArmed && gLeft-- == 0) {
        gArmed = false;
        throw std::bad_alloc();
    }
    void* const memory =
        size <= SIZE_MAX - sizeof(Header) ? std::malloc(sizeof(Header) + size) : nullptr;
    if (memory == nullptr)
        throw std::bad_alloc();
    gLargeBlocks += size >= kLarge ? 1U : 0U;
    return new (memory) Header{size} + 1;
}

void operator delete(void* block) noexcept
{
    if (block == nullptr)
        return;
    Header* const header = static_cast<Header*>(block) - 1;
    gLargeBlocks -= header->size >= kLarge ? 1U : 0U;
    std::free(header);
}

void operator delete(void* block, std::size_t /*size*/) noexcept
{
    operator delete(block);
}

// By default these call those above, but not with the address sanitizer, which has its own.
void* operator new(std::size_t size, const std::nothrow_t& /*noThrow*/) noexcept
{
    try {
        return operator new(size);
    } catch (const std::bad_alloc&) {
        return nullptr;
    }
}

void* operator new[](std::size_t size)
{
    return operator new(size);
}

void operator delete[](void* block) noexcept
{
    operator delete(block);
}

void operator delete[](void* block, std::size_t /*size*/) noexcept
{
    operator delete(block);
}

namespace assay_test {

FailingAllocation::FailingAllocation(std::size_t number)
{
    gLeft = number;
    gArmed = true;
}

FailingAllocation::~FailingAllocation()
{
    gArmed = false;
}

bool FailingAllocation::HasFailed() const
{
    return !gArmed;
}

std::size_t LargeBlocks()
{
    return gLargeBlocks;
}

} // namespace assay_test

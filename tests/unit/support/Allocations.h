// The operator new of this test program: fails on demand and counts large blocks.
#pragma once

#include <cstddef>

namespace assay_test {

// While it lives, one allocation of this thread throws std::bad_alloc.
class FailingAllocation {
public:
    // `number` is the allocation that fails, counted from 0 after the construction.
    explicit FailingAllocation(std::size_t number);
    ~FailingAllocation();
    FailingAllocation(const FailingAllocation&) = delete;
    FailingAllocation& operator=(const FailingAllocation&) = delete;

    // Returns whether the allocation has been made and has failed.
    bool HasFailed() const;
};

// Returns the number of allocated blocks of 1 MB or more.
std::size_t LargeBlocks();

} // namespace assay_test

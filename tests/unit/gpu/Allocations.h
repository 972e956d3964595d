// This test program's own operator new: it fails on demand, and counts large blocks.
#pragma once

#include <cstddef>

namespace assay_test {

// While it lives, one allocation of this thread throws std::bad_alloc: the one with that number,
// counted from 0 from here on.
class FailingAllocation {
public:
    explicit FailingAllocation(std::size_t number);
    ~FailingAllocation();
    FailingAllocation(const FailingAllocation&) = delete;
    FailingAllocation& operator=(const FailingAllocation&) = delete;

    // Whether it has failed.
    bool HasFailed() const;
};

// How many blocks of a megabyte or more are allocated now.
std::size_t LargeBlocks();

} // namespace assay_test

// Keeps exceptions from crossing the C interface.
#pragma once

#include <new>

#include "assay_host.h"

namespace assay_host {

// Calls `action`, and returns its error, or that of an exception.
template <typename Action>
assay_host_error Try(const Action& action) noexcept
{
    try {
        return action();
    } catch (const std::bad_alloc&) {
        return ASSAY_HOST_NO_MEMORY;
    } catch (...) {
        return ASSAY_HOST_INTERNAL;
    }
}

} // namespace assay_host

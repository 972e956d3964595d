// Reads texts and lists from an OpenCL driver in two calls: the size, then the content.
#pragma once

#include <cstddef>
#include <string>
#include <vector>

#include "qgf/TextBuffer.h"
#include "qgf/qgf_ocl/Status.h"

namespace QGF {
namespace OCL {

// A driver that reports a longer list is taken as broken.
inline constexpr cl_uint kMaxListEntries = 4096;

// Returns the text that `query(size, value, actualSize)` reads, up to its first zero byte. Throws
// LogicalException with the call's name if a query fails, and std::bad_alloc if memory for the
// reported size can't be allocated.
template <typename Query>
std::string ReadText(const char* call, const Query& query)
{
    std::size_t size = 0;
    CheckStatus(call, query(std::size_t{0}, nullptr, &size));
    if (size == 0)
        return {};
    Core::TextBuffer text(size);
    CheckStatus(call, query(size, text.data(), nullptr));
    return text.beforeFirstZero();
}

// Returns the handles that `query(count, handles, actualCount)` reads; none if the query's status
// is `emptyStatus`. Throws LogicalException with the call's name if a query fails otherwise or the
// driver reports more than kMaxListEntries.
template <typename Handle, typename Query>
std::vector<Handle> ReadList(const char* call, cl_int emptyStatus, const Query& query)
{
    cl_uint count = 0;
    const cl_int status = query(cl_uint{0}, nullptr, &count);
    if (status == emptyStatus)
        return {};
    CheckStatus(call, status);
    if (count > kMaxListEntries)
        ThrowBadAnswer(call, "the driver reports a list of " + std::to_string(count) + " entries");
    std::vector<Handle> handles(count, nullptr);
    if (count == 0)
        return handles;
    cl_uint actualCount = count;
    CheckStatus(call, query(count, handles.data(), &actualCount));
    if (actualCount < count)
        handles.resize(actualCount);
    return handles;
}

} // namespace OCL
} // namespace QGF

// Reading the texts and lists that an OpenCL driver answers in two calls: how much, then what.
#pragma once

#include <cstddef>
#include <string>
#include <vector>

#include "qgf/TextRoom.h"
#include "qgf/qgf_ocl/Status.h"

namespace QGF {
namespace OCL {

// What a driver may claim before it isn't believed any more.
inline constexpr cl_uint kMaxListEntries = 4096;

// The text that `query(size, value, actualSize)` gives, up to its first zero byte. Throws
// LogicalException with the call's name if the driver refuses, and std::bad_alloc if there is no
// room for what it claims.
template <typename Query>
std::string ReadText(const char* call, const Query& query)
{
    std::size_t size = 0;
    CheckStatus(call, query(std::size_t{0}, nullptr, &size));
    if (size == 0)
        return {};
    Core::TextRoom room(size);
    CheckStatus(call, query(size, room.data(), nullptr));
    return room.beforeFirstZero();
}

// The handles that `query(count, handles, actualCount)` gives; none if it answers `emptyStatus`.
// Throws LogicalException with the call's name if the driver refuses otherwise or claims more than
// kMaxListEntries.
template <typename Handle, typename Query>
std::vector<Handle> ReadList(const char* call, cl_int emptyStatus, const Query& query)
{
    cl_uint count = 0;
    const cl_int status = query(cl_uint{0}, nullptr, &count);
    if (status == emptyStatus)
        return {};
    CheckStatus(call, status);
    if (count > kMaxListEntries)
        RefuseAnswer(call, "the driver claims a list of " + std::to_string(count) + " entries");
    std::vector<Handle> handles(count, nullptr);
    if (count == 0)
        return handles;
    cl_uint given = count;
    CheckStatus(call, query(count, handles.data(), &given));
    if (given < count)
        handles.resize(given);
    return handles;
}

} // namespace OCL
} // namespace QGF

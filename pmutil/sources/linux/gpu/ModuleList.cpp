#include "all/gpu/ModuleList.h"

#include <algorithm>
#include <cerrno>

#include <link.h>

namespace pmutil {

namespace {

bool IsListed(const std::string& path)
{
    // The program and the kernel's own library have none.
    return path.find('/') != std::string::npos &&
           std::none_of(path.begin(), path.end(),
                        [](char byte) { return static_cast<unsigned char>(byte) < ' '; });
}

// Called under the loader's lock, and by a C function that exceptions must not pass.
int AddName(dl_phdr_info* info, std::size_t, void* names) noexcept
try {
    static_cast<std::vector<std::string>*>(names)->emplace_back(info->dlpi_name);
    return 0;
} catch (const std::bad_alloc&) {
    return 1;
}

int TakeCount(dl_phdr_info* info, std::size_t, void* count)
{
    *static_cast<std::uint64_t*>(count) = info->dlpi_adds;
    return 1;
}

} // namespace

std::vector<std::string> ListModules()
{
    std::vector<std::string> names;
    if (dl_iterate_phdr(AddName, &names) != 0)
        throw std::bad_alloc();
    names.erase(std::remove_if(names.begin(), names.end(),
                               [](const std::string& name) { return !IsListed(name); }),
                names.end());
    return names;
}

std::uint64_t CountLoads() noexcept
{
    std::uint64_t count = 0;
    dl_iterate_phdr(TakeCount, &count);
    return count;
}

LastError::LastError() noexcept : fValue(static_cast<unsigned long>(errno)) {}

LastError::~LastError()
{
    errno = static_cast<int>(fValue);
}

} // namespace pmutil

#include "output/Stream.h"

#include <algorithm>

#include "output/win/WriteAll.h"

namespace assay_host {

namespace {

constexpr std::size_t kMaxWriteBytes = std::size_t{1} << 20;

} // namespace

std::error_code WriteAll(HANDLE handle, std::string_view text)
{
    while (!text.empty()) {
        DWORD count = 0;
        if (::WriteFile(handle, text.data(),
                        static_cast<DWORD>(std::min(text.size(), kMaxWriteBytes)), &count,
                        nullptr) == 0)
            return {static_cast<int>(::GetLastError()), std::system_category()};
        text.remove_prefix(count);
    }
    return {};
}

std::error_code WriteStream(StandardStream stream, std::string_view text)
{
    return WriteAll(
        ::GetStdHandle(stream == StandardStream::kOutput ? STD_OUTPUT_HANDLE : STD_ERROR_HANDLE),
        text);
}

} // namespace assay_host

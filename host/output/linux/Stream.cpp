#include "output/Stream.h"

#include <cerrno>
#include <poll.h>
#include <unistd.h>

#include "output/linux/WriteAll.h"

namespace assay_host {

std::error_code WriteAll(int descriptor, std::string_view text)
{
    while (!text.empty()) {
        const ::ssize_t count = ::write(descriptor, text.data(), text.size());
        if (count >= 0) {
            text.remove_prefix(static_cast<std::size_t>(count));
        } else if (errno == EAGAIN) {
            pollfd room{descriptor, POLLOUT, 0};
            ::poll(&room, 1, -1);
        } else if (errno != EINTR) {
            return {errno, std::generic_category()};
        }
    }
    return {};
}

std::error_code WriteStream(StandardStream stream, std::string_view text)
{
    return WriteAll(stream == StandardStream::kOutput ? STDOUT_FILENO : STDERR_FILENO, text);
}

} // namespace assay_host

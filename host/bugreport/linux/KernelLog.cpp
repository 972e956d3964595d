#include "bugreport/KernelLog.h"

#include <algorithm>
#include <array>
#include <cerrno>
#include <exception>
#include <optional>
#include <system_error>

#include <boost/algorithm/string/classification.hpp>
#include <boost/algorithm/string/split.hpp>
#include <boost/process/search_path.hpp>
#include <fcntl.h>
#include <fmt/format.h>
#include <unistd.h>

#include "pmutil/RunProgram.h"

namespace assay_host {

namespace {

using Lines = std::vector<std::string>;

// Returns nothing if the device can't be read, and then the reason. A record that has another form
// is an empty line.
std::optional<Lines> ReadDevice(const std::string& path, std::string& reason)
{
    const int file = ::open(path.c_str(), O_RDONLY | O_NONBLOCK | O_CLOEXEC);
    if (file < 0) {
        reason = fmt::format("{}: {}", path, std::generic_category().message(errno));
        return std::nullopt;
    }
    Lines lines;
    std::array<char, 8192> record; // the kernel's own limit
    int error = 0;
    // EPIPE: the record was overwritten before it was read.
    while (error == 0 || error == EPIPE || error == EINTR) {
        const ::ssize_t size = ::read(file, record.data(), record.size());
        if (size == 0)
            break;
        error = size < 0 ? errno : 0;
        lines.push_back(ReadKernelRecord(
            {record.data(), static_cast<std::size_t>(std::max<::ssize_t>(size, 0))}));
    }
    ::close(file);
    // EAGAIN: there are no more messages.
    if (error != 0 && error != EAGAIN) {
        reason = fmt::format("{}: {}", path, std::generic_category().message(error));
        return std::nullopt;
    }
    return lines;
}

std::string GetFirstLine(const std::string& text)
{
    return text.substr(0, text.find('\n'));
}

std::optional<Lines> AskProgram(const KernelLogSource& source, std::string& reason)
{
    const std::string path = source.fProgram.find('/') == std::string::npos
                                 ? boost::process::search_path(source.fProgram).string()
                                 : source.fProgram;
    if (path.empty()) {
        reason = source.fProgram + " is not installed";
        return std::nullopt;
    }
    try {
        pmutil::RunOptions options;
        options.fTimeoutSeconds = source.fTimeoutSeconds;
        const pmutil::RunResult run = pmutil::RunProgram(
            path, {"--dmesg", "--boot", "--no-pager", "--quiet", "--output=short-monotonic"},
            options);
        Lines lines;
        if (run.fEnd == pmutil::State::kFinished && run.fExitCode == 0 && !run.fOutput.empty()) {
            boost::algorithm::split(lines, run.fOutput, boost::algorithm::is_any_of("\n"));
            return lines;
        }
        reason = fmt::format("{}: {}", source.fProgram,
                             run.fTimedOut          ? "no end within its time"
                             : !run.fErrors.empty() ? GetFirstLine(run.fErrors)
                             : run.fExitCode != 0   ? fmt::format("status {}", run.fExitCode)
                                                    : "no messages");
    } catch (const std::exception& failure) {
        reason = fmt::format("{}: {}", source.fProgram, failure.what());
    }
    return std::nullopt;
}

} // namespace

KernelLog ReadKernelLog(const KernelLogSource& source)
{
    std::string first;
    std::string second;
    std::optional<Lines> lines = ReadDevice(source.fDevice, first);
    if (!lines)
        lines = AskProgram(source, second);
    if (!lines)
        return {{}, fmt::format("{}; {}", first, second)};
    return {SelectGraphicsMessages(std::move(*lines)), {}};
}

} // namespace assay_host

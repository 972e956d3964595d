#include "pmutil/LogSinks.h"

#include <set>
#include <utility>

#include <boost/filesystem/operations.hpp>
#include <boost/thread/lock_guard.hpp>

#include "all/LogTimer.h"
#include "all/PathCodecvt.h"
#include "pmutil/PutLine.h"
#include "pmutil/System.h"

namespace pmutil {

namespace {

constexpr char kDefaultLogFile[] = "pmlog.txt";

const char* NameOfStream(std::FILE* stream)
{
    if (stream != nullptr && stream == stdout)
        return "stdout";
    if (stream != nullptr && stream == stderr)
        return "stderr";
    return "FILE*";
}

boost::filesystem::path NativePath(const std::wstring& path)
{
    return boost::filesystem::path(path, GetPathCodecvt());
}

std::wstring JoinPath(const std::wstring& folder, const std::string& name)
{
    constexpr auto kSeparator = static_cast<wchar_t>(boost::filesystem::path::preferred_separator);
    const std::wstring file =
        boost::filesystem::path(name, GetPathCodecvt()).wstring(GetPathCodecvt());
    return folder.empty() ? file : folder + kSeparator + file;
}

// Removes the regular file at that path if the condition holds for it.
template <typename Condition>
void RemoveIf(const std::wstring& file, const Condition& condition) noexcept
{
    try {
        const boost::filesystem::path path = NativePath(file);
        boost::system::error_code failed;
        if (boost::filesystem::is_regular_file(path, failed) && condition(path))
            boost::filesystem::remove(path, failed);
    } catch (...) {
        // Write reports a path that can't be converted to narrow characters.
    }
}

// Returns true for the first logger of the process on that path. Call it with the log mutex held.
bool ClaimPath(const std::wstring& path)
{
    static std::set<std::wstring>& paths = *new std::set<std::wstring>; // never destroyed
    return paths.insert(path).second;
}

} // namespace

PMNullLogger::PMNullLogger() : PMLogger("PMNullLogger") {}

PMNullLogger::~PMNullLogger() = default;

bool PMNullLogger::IsEnabled(int /*level*/)
{
    return false;
}

void PMNullLogger::Log(const char* /*file*/, int /*line*/, const char* /*format*/,
                       std::va_list /*arguments*/)
{}

void PMNullLogger::Write(const char* /*data*/, std::size_t /*size*/) {}

PMStdioLogger::PMStdioLogger(std::FILE* stream) : PMLogger(NameOfStream(stream)), fFile(stream) {}

PMStdioLogger::~PMStdioLogger() = default;

void PMStdioLogger::Flush()
{
    const LogTimer timer;
    // The report may use the same stream: a lost log line must not make later lines fail.
    if (fFile != nullptr && std::fflush(fFile) != 0)
        DiscardUnwritten(fFile);
}

void PMStdioLogger::Write(const char* data, std::size_t size)
{
    const LogTimer timer;
    if (fFile != nullptr)
        std::fwrite(data, 1, size, fFile);
}

AssayLogger::AssayLogger() : PMStdioLogger(stdout) {}

AssayLogger::~AssayLogger()
{
    try {
        AssayLogger::Flush();
    } catch (...) {
        // The rest of the line is lost, as after a failed write.
    }
}

std::string AssayLogger::GetPrefix(const char* file, int line)
{
    return "# " + PMStdioLogger::GetPrefix(file, line);
}

void AssayLogger::Flush()
{
    const LogTimer timer;
    const std::string line = std::exchange(fLine, {});
    const bool isWhole = line.empty() || PutLine(stdout, line, [](const std::string& text) {
                             return std::fwrite(text.data(), 1, text.size(), stdout);
                         });
    if (isWhole)
        PMStdioLogger::Flush();
}

void AssayLogger::Write(const char* data, std::size_t size)
{
    const LogTimer timer;
    fLine.append(data, size);
}

PMFileLogger::PMFileLogger(const char* name) : PMFileLogger(GetDesktopFolder(), name) {}

PMFileLogger::PMFileLogger(const std::wstring& folder, const char* name)
    : PMLogger(name != nullptr ? name : kDefaultLogFile), fPath(JoinPath(folder, GetName()))
{
    const boost::lock_guard<boost::recursive_mutex> lock(GetLogMutex());
    if (ClaimPath(fPath))
        RemoveIf(fPath, [](const boost::filesystem::path&) { return true; });
}

PMFileLogger::~PMFileLogger()
{
    if (fFile != nullptr)
        std::fclose(fFile);
    RemoveIf(fPath, [](const boost::filesystem::path& path) {
        boost::system::error_code failed;
        return boost::filesystem::is_empty(path, failed) && !failed;
    });
}

bool PMFileLogger::Open()
{
    fFile = OpenSharedAppend(NativePath(fPath).string(GetPathCodecvt()));
    if (fFile == nullptr && !fOpenFailureReported) {
        fOpenFailureReported = true;
        std::fprintf(stderr, "PMFileLogger: the log file %s can't be opened\n",
                     NativePath(fPath).string(GetPathCodecvt()).c_str());
    }
    return fFile != nullptr;
}

void PMFileLogger::Flush()
{
    const LogTimer timer;
    fLineLost = false;
    if (fFile == nullptr)
        return;
    std::fclose(fFile);
    fFile = nullptr;
}

void PMFileLogger::Write(const char* data, std::size_t size)
{
    const LogTimer timer;
    // If the first part of a line is lost, discard the rest of the line.
    if (fLineLost || (fFile == nullptr && !Open())) {
        fLineLost = true;
        return;
    }
    std::fwrite(data, 1, size, fFile);
}

} // namespace pmutil

#include "pmutil/PMLogging.h"

#include <algorithm>

#include <boost/thread/lock_guard.hpp>

#include "all/LogPrefix.h"
#include "all/LogTimer.h"
#include "all/MessageStream.h"
#include "pmutil/LogSinks.h"
#include "pmutil/System.h"
#include "pmutil/Threads.h"

namespace pmutil {

namespace {

using LogLock = boost::lock_guard<boost::recursive_mutex>;

std::atomic<bool> gLoggingStarted{false};

// Logs one line to the current logger and ignores all exceptions.
template <typename InsertMessage>
void LogToCurrent(const char* file, int line, const InsertMessage& insertMessage) noexcept
{
    try {
        const LoggerHolder logger = GetCurrentLogger();
        const LogLock lock(GetLogMutex());
        if (!logger || !logger->IsEnabledWrapper())
            return;
        MessageStream message;
        insertMessage(message.Out());
        logger->LogPrintf(file, line, "%s", message.Text());
    } catch (...) {
        // A failure of logging must not affect the program.
    }
}

} // namespace

LogIndent gLogIndent;

std::ostream& operator<<(std::ostream& out, const LogIndent& indent)
{
    const std::int32_t blanks = std::max(indent.fDepth.load() - 1, 0);
    return out << std::string(static_cast<std::size_t>(blanks), ' ');
}

boost::recursive_mutex& GetLogMutex()
{
    static boost::recursive_mutex& mutex = *new boost::recursive_mutex; // never destroyed
    return mutex;
}

void InitLogging()
{
    const LogLock lock(GetLogMutex());
    if (gLoggingStarted)
        return;
    gLoggingStarted = true;
    detail::PrepareDebugValues();
}

LoggerHolder GetCurrentLogger()
{
    const LogTimer timer;
    if (!gLoggingStarted)
        return {};
    LoggerHolder top = PMLogger::Top();
    if (top)
        return top;
    // Hold the stack's mutex, since the null logger is on the stack before it is complete.
    const LogLock logLock(GetLogMutex());
    const LogLock stackLock(PMLogger::Mutex());
    if (!PMLogger::Top())
        static const PMNullLogger nullLogger;
    return PMLogger::Top();
}

PMLogger::PMLogger(const std::string& name) : fName(name)
{
    if (!gLoggingStarted)
        return;
    try {
        if (PMLogger* const previous = Below(this))
            previous->LogPrintf(__FILE__, __LINE__, "Activating new logger %s", fName.c_str());
    } catch (...) {
        // The previous logger's failure doesn't affect this one.
    }
}

PMLogger::~PMLogger() = default;

bool PMLogger::IsEnabled(int /*level*/)
{
    return true;
}

std::string PMLogger::GetBaseName(const char* path)
{
    if (path == nullptr)
        return {};
    const char* base = path;
    for (const char* at = path; *at != '\0'; ++at)
        if ((*at == '\\' || *at == '/') && at[1] != '\0')
            base = at + 1;
    return base;
}

void PMLogger::Log(const char* file, int line, const char* format, std::va_list arguments)
{
    const LogLock lock(GetLogMutex());
    char last = '\0';
    const auto writePiece = [&](const std::string& text) {
        if (text.empty())
            return;
        Write(text.data(), text.size());
        last = text.back();
    };
    writePiece(GetPrefix(file, line));
    writePiece(FormatStringV(format, arguments));
    if (last != '\r' && last != '\n') {
        const std::string end = WriteLineEnd();
        Write(end.data(), end.size());
    }
    Flush();
}

std::string PMLogger::GetPrefix(const char* /*file*/, int /*line*/)
{
    const LogTimer timer;
    const double now = GetClockSeconds();
    const double delta = fLastTime > 0 ? now - fLastTime : 0;
    fLastTime = now;
    return MakeLogPrefix(fLineNumber++, now, delta, GetCurrentThreadName());
}

std::string PMLogger::GetSuffix()
{
    return {};
}

void PMLogger::Flush() {}

std::string PMLogger::GetLineEnd()
{
    return "\n";
}

bool PMLogger::IsEnabledWrapper()
{
    const LogTimer timer;
    return IsEnabled(0);
}

void PMLogger::LogPrintf(const char* file, int line, const char* format, ...)
{
    const LogTimer timer;
    std::va_list arguments;
    va_start(arguments, format);
    try {
        Log(file, line, format, arguments);
    } catch (...) {
        va_end(arguments);
        throw;
    }
    va_end(arguments);
}

std::string PMLogger::WriteLineEnd()
{
    const LogTimer timer;
    return GetLineEnd();
}

void PMLogger::WriteText(const char* data, std::size_t size)
{
    const LogTimer timer;
    Write(data, size);
}

PMLogScope::PMLogScope(const std::string& name, const char* file, int line)
    : fStartTime(GetClockSeconds()), fFile(file), fLine(line), fName(name)
{
    LogToCurrent(fFile, fLine, [this](std::ostream& out) { out << "BEGIN " << fName; });
    fStartTime = GetClockSeconds(); // exclude the time of the line above
}

PMLogScope::~PMLogScope()
{
    const double duration = GetClockSeconds() - fStartTime;
    LogToCurrent(fFile, fLine,
                 [&](std::ostream& out) { out << "END " << fName << ", duration=" << duration; });
}

void detail::WriteStatement(DebugValue& record, const char* file, int line, MessageInserter insert,
                            const void* message) noexcept
{
    try {
        if (GetDebugValue(record) == 0)
            return;
    } catch (...) {
        return; // the name can't be resolved: don't log
    }
    LogToCurrent(file, line, [&](std::ostream& out) { insert(out, message); });
}

} // namespace pmutil

// SPDX-FileCopyrightText: 2026 the assay authors
// SPDX-License-Identifier: MIT

// Logging. The most recently made live logger is the current one; all log statements of the process
// write to it. A named debug value enables or disables a statement.
//
// Any thread may log. The log mutex keeps the lines of several threads apart.
#pragma once

#include <atomic>
#include <cstdarg>
#include <cstddef>
#include <cstdint>
#include <ostream>
#include <string>

#include <boost/thread/recursive_mutex.hpp>

#include "pmutil/DebugValues.h"
#include "pmutil/Format.h"
#include "pmutil/Stackable.h"

namespace pmutil {

// The base class of the loggers: formats and assembles lines; a sink implements Write. Make and
// destroy a logger on any thread, but only while no other thread logs, makes or destroys one: it
// becomes the current logger before the sink's constructor has run.
class PMLogger : public Stackable<PMLogger> {
public:
    // Becomes the current logger. After InitLogging, writes the line "Activating new logger NAME"
    // to the previous logger; a failure of that is ignored.
    explicit PMLogger(const std::string& name);
    ~PMLogger() override;

    // Returns true. All callers pass level 0.
    virtual bool IsEnabled(int level);

    // Returns the text after the last "\" or "/" that is followed by a character; empty for null.
    virtual std::string GetBaseName(const char* path);

    // Writes one line: prefix, formatted message, and a line end unless the message has one; then
    // calls Flush. Holds the log mutex.
    virtual void Log(const char* file, int line, const char* format, std::va_list arguments)
        PMUTIL_PRINTF(4, 0);

    // Returns "NNNNN.YYYY.MM.DD_HH:MM:SS.mmm(+S.mmm)[tid=T] ": line number, universal time, seconds
    // since this logger's previous line (0 for its first), thread name or id. Increments the line
    // number. Doesn't use `file` and `line`; overrides may.
    virtual std::string GetPrefix(const char* file, int line);

    // Returns an empty text. Log doesn't use it.
    virtual std::string GetSuffix();

    // Called after each line, with the log mutex held. Does nothing.
    virtual void Flush();

    // Returns "\n".
    virtual std::string GetLineEnd();

    // Writes a part of a line. Called with the log mutex held.
    virtual void Write(const char* data, std::size_t size) = 0;

    // Forward to IsEnabled(0), Log, GetLineEnd and Write, and add their time to GetLogTime. Callers
    // use these. WriteLineEnd only returns the text.
    bool IsEnabledWrapper();
    void LogPrintf(const char* file, int line, const char* format, ...) PMUTIL_PRINTF(4, 5);
    std::string WriteLineEnd();
    void WriteText(const char* data, std::size_t size);

    const std::string& GetName() const { return fName; }

private:
    double fLastTime = 0;
    std::uint32_t fLineNumber = 0;
    std::string fName;
};

// The current logger. Shares ownership of the stack, not of the logger: hold it for one statement
// only. Empty before InitLogging.
using LoggerHolder = StackableHolder<PMLogger>;

// Starts logging. Before that, log statements write nothing and debug values aren't resolved.
// Further calls do nothing.
void InitLogging();

// Returns the current logger; if there is none, a PMNullLogger. Before InitLogging, returns an
// empty holder.
LoggerHolder GetCurrentLogger();

// Guards log lines and the registry of debug values. Recursive, so that a sink may log.
boost::recursive_mutex& GetLogMutex();

// Returns the seconds that the process has spent in logging; nested calls count once.
double GetLogTime();

// Logs "BEGIN NAME" and, at the end of the scope, "END NAME, duration=SECONDS", if the current
// logger is enabled at that time. `file` must outlive the scope.
class PMLogScope {
public:
    PMLogScope(const std::string& name, const char* file, int line);
    ~PMLogScope();
    PMLogScope(const PMLogScope&) = delete;
    PMLogScope& operator=(const PMLogScope&) = delete;

private:
    double fStartTime;
    const char* fFile;
    int fLine;
    std::string fName;
};

// The depth of indented log output, for callers that insert it into their messages. Any thread may
// use it.
class LogIndent {
public:
    void Increment() { ++fDepth; }
    void Decrement() { --fDepth; }

private:
    friend std::ostream& operator<<(std::ostream& out, const LogIndent& indent);

    std::atomic<std::int32_t> fDepth{0};
};
// Writes depth - 1 blanks.
std::ostream& operator<<(std::ostream& out, const LogIndent& indent);
extern LogIndent gLogIndent;

namespace detail {
// Inserts a statement's message into a stream; `message` points to the statement's functor.
using MessageInserter = void (*)(std::ostream& out, const void* message);

// The slow path of a log statement: if the debug value is set and the current logger is enabled,
// assembles the message under the log mutex and writes it as one line. Ignores all exceptions.
void WriteStatement(DebugValue& record, const char* file, int line, MessageInserter insert,
                    const void* message) noexcept;

template <typename Message>
void LogStatement(DebugValue& record, const char* file, int line, const Message& message) noexcept
{
    WriteStatement(
        record, file, line,
        [](std::ostream& out, const void* erased) { (*static_cast<const Message*>(erased))(out); },
        &message);
}
} // namespace detail

// A log statement: PM_LOG(gLog, "wmiNumDevices=" << count). While the debug value is 0, the message
// isn't evaluated. If the message throws, the line is lost and the exception is ignored.
#define PM_LOG(debugValue, ...)                                                                    \
    do {                                                                                           \
        if (::pmutil::detail::MayBeSet(debugValue))                                                \
            ::pmutil::detail::LogStatement(                                                        \
                debugValue, __FILE__, __LINE__,                                                    \
                [&](std::ostream& pmLogOut) { pmLogOut << __VA_ARGS__; });                         \
    } while (false)

} // namespace pmutil

// Logging. The most recently constructed live logger is the current one, and every log statement
// of the process writes to it. Whether a statement logs at all is decided by a named debug value.
//
// Any thread may log. The log mutex makes each line whole.
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

// Formats and assembles lines; a sink derives from it and supplies Write. A logger is made and
// destroyed on any thread, but only while no other thread logs, makes or destroys one: it is the
// current logger before its sink is complete.
class PMLogger : public Stackable<PMLogger> {
public:
    // Becomes the current logger. If logging has started, the logger that was current until now
    // gets the line "Activating new logger NAME"; its failure to write it is ignored.
    explicit PMLogger(const std::string& name);
    ~PMLogger() override;

    // True here, whatever the level; all callers pass 0.
    virtual bool IsEnabled(int level);

    // The text behind the last "\" or "/" that has something behind it; empty for null.
    virtual std::string GetBaseName(const char* path);

    // Assembles and writes one line: prefix, formatted message, a line end unless the text has one
    // already, then Flush. Holds the log mutex.
    virtual void Log(const char* file, int line, const char* format, std::va_list arguments)
        PMUTIL_PRINTF(4, 0);

    // "NNNNN.YYYY.MM.DD_HH:MM:SS.mmm(+S.mmm)[tid=T] ": line number, universal time, seconds since
    // this logger's previous line (0 for its first), thread name or id. Counts the line. The place
    // isn't shown here; overrides may.
    virtual std::string GetPrefix(const char* file, int line);

    // Empty, and not used by Log.
    virtual std::string GetSuffix();

    // Called at the end of each line, with the log mutex held. Does nothing here.
    virtual void Flush();

    // "\n" here.
    virtual std::string GetLineEnd();

    // The sink's output operation. Called with the log mutex held.
    virtual void Write(const char* data, std::size_t size) = 0;

    // The timed entry points that callers use; each only forwards to the operation of its purpose:
    // IsEnabled at level 0, Log, GetLineEnd (whose text it gives, without writing it) and Write.
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

// The current logger together with a share of the stack it stands on; empty before InitLogging.
// Doesn't keep the logger alive: hold it for one statement only.
using LoggerHolder = StackableHolder<PMLogger>;

// Starts logging, once per process: before it statements write nothing and debug values are not
// resolved. A second call does nothing.
void InitLogging();

// The logger on top of the stack, a PMNullLogger made on demand if the stack is empty; an empty
// holder before InitLogging.
LoggerHolder GetCurrentLogger();

// Serialises log lines and the registry of debug values. Recursive, so a sink may log.
boost::recursive_mutex& GetLogMutex();

// Total seconds that the process spent in logging, nested calls counted once.
double GetLogTime();

// Logs "BEGIN NAME" now and "END NAME, duration=SECONDS" at the end of the scope, if the current
// logger is enabled then. `file` must outlive the scope.
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

// The depth of indented log output. Nothing indents by itself. Any thread.
class LogIndent {
public:
    void Increment() { ++fDepth; }
    void Decrement() { --fDepth; }

private:
    friend std::ostream& operator<<(std::ostream& out, const LogIndent& indent);

    std::atomic<std::int32_t> fDepth{0};
};
// Writes one blank fewer than the depth.
std::ostream& operator<<(std::ostream& out, const LogIndent& indent);
extern LogIndent gLogIndent;

namespace detail {
// Inserts a statement's message, whatever its type, into a stream.
using MessageInserter = void (*)(std::ostream& out, const void* message);

// The slow road of a log statement: if the debug value is set and the current logger is enabled,
// assembles the message under the log mutex and writes it as one line. Swallows every exception.
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

// A log statement: PM_LOG(gLog, "wmiNumDevices=" << count). While the debug value is 0, nothing of
// the message is evaluated. A message that throws costs the line, nothing else.
#define PM_LOG(debugValue, ...)                                                                    \
    do {                                                                                           \
        if (::pmutil::detail::MayBeSet(debugValue))                                                \
            ::pmutil::detail::LogStatement(                                                        \
                debugValue, __FILE__, __LINE__,                                                    \
                [&](std::ostream& pmLogOut) { pmLogOut << __VA_ARGS__; });                         \
    } while (false)

} // namespace pmutil

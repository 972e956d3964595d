// Where log lines go: the concrete loggers.
#pragma once

#include <cstdio>
#include <string>

#include "pmutil/PMLogging.h"

namespace pmutil {

// Swallows everything; stands in when no other logger lives. Its name is "PMNullLogger".
class PMNullLogger : public PMLogger {
public:
    PMNullLogger();
    ~PMNullLogger() override;
    bool IsEnabled(int level) override;
    void Log(const char* file, int line, const char* format, std::va_list arguments) override;
    void Write(const char* data, std::size_t size) override;
};

// Writes to a C stream, flushed after each line. Named "stdout", "stderr" or "FILE*". The stream is
// not owned; a null one swallows everything. A line that the stream refuses is lost, and doesn't
// turn up in front of what is written to the stream later.
class PMStdioLogger : public PMLogger {
public:
    explicit PMStdioLogger(std::FILE* stream);
    ~PMStdioLogger() override;
    void Flush() override;
    void Write(const char* data, std::size_t size) override;

private:
    std::FILE* fFile;
};

// Writes to standard output in the form of a comment of the report: each line begins with "# ". A
// line goes out in one piece when it is flushed, at the latest when the logger is destroyed. If
// standard output takes only a part of it, the next line, of the log or of the report, begins on a
// line of its own (PutLine).
class AssayLogger : public PMStdioLogger {
public:
    AssayLogger();
    ~AssayLogger() override;
    std::string GetPrefix(const char* file, int line) override;
    void Flush() override;
    void Write(const char* data, std::size_t size) override;

private:
    std::string fLine;
};

// Writes to a file in the user's desktop folder, "pmlog.txt" for a null name; the bare name in the
// current directory if there is no such folder. The file is open only for the length of a line, so
// that what was logged is on disk if the process dies at the next statement. It begins anew with
// the first logger of the process that uses it; a logger that wrote nothing leaves no empty file.
// A file that can't be opened costs the line, and is told once per logger on standard error. A
// path that can't be told in narrow characters costs it too: Write throws a boost::system error
// with the text "boost::filesystem::path codecvt to string".
class PMFileLogger : public PMLogger {
public:
    explicit PMFileLogger(const char* name);

    // The same in another folder; an empty one stands for the current directory.
    PMFileLogger(const std::wstring& folder, const char* name);
    ~PMFileLogger() override;
    void Flush() override;
    void Write(const char* data, std::size_t size) override;

    const std::wstring& GetPath() const { return fPath; }

private:
    bool Open();

    std::FILE* fFile = nullptr;
    std::wstring fPath;
    bool fLineLost = false;
    bool fOpenFailureTold = false;
};

} // namespace pmutil

// SPDX-FileCopyrightText: 2026 the assay authors
// SPDX-License-Identifier: MIT

// The concrete loggers.
#pragma once

#include <cstdio>
#include <string>

#include "pmutil/PMLogging.h"

namespace pmutil {

// Discards all lines. Used if there is no other logger. Its name is "PMNullLogger".
class PMNullLogger : public PMLogger {
public:
    PMNullLogger();
    ~PMNullLogger() override;
    bool IsEnabled(int level) override;
    void Log(const char* file, int line, const char* format, std::va_list arguments) override;
    void Write(const char* data, std::size_t size) override;
};

// Writes to a C stream and flushes it after each line. Its name is "stdout", "stderr" or "FILE*".
// The stream is not owned; with a null stream all lines are discarded. A line whose write fails is
// discarded and not retried.
class PMStdioLogger : public PMLogger {
public:
    explicit PMStdioLogger(std::FILE* stream);
    ~PMStdioLogger() override;
    void Flush() override;
    void Write(const char* data, std::size_t size) override;

private:
    std::FILE* fFile;
};

// Writes to standard output as comments of the report: each line begins with "# ". A line is
// written in one call when it is flushed, at the latest by the destructor. If only a part of it is
// written, the next line, of the log or of the report, starts on a new line (PutLine).
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

// Writes to a file in the user's desktop folder, or in the current directory if there is no such
// folder. The file is opened for each line and closed after it, so that the line is on disk if the
// process crashes next. The first logger of the process on a path deletes an older file there; a
// logger that wrote nothing leaves no empty file. If the file can't be opened, the line is lost and
// the failure is reported on standard error, once per logger. If the path can't be converted to
// narrow characters, Write throws a boost::system error with the text "boost::filesystem::path
// codecvt to string".
class PMFileLogger : public PMLogger {
public:
    // `name` is the file's name; null is "pmlog.txt".
    explicit PMFileLogger(const char* name);

    // The same in another folder; an empty folder is the current directory.
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
    bool fOpenFailureReported = false;
};

} // namespace pmutil

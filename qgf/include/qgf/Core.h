// QGF::Core: what the other halves of the graphics foundation library stand on: its exceptions,
// its start and the loading of dynamic libraries.
#pragma once

#include <exception>
#include <memory>
#include <string>

namespace QGF {

// Root of what the library throws. what() and message() give the same text.
class ExceptionBase : public std::exception {
public:
    explicit ExceptionBase(std::string message) : fMessage(std::move(message)) {}
    const char* what() const noexcept override { return fMessage.c_str(); }

    // What failed and why, in one line; " | " stands between the lines of a shader log. Never null;
    // virtual so that a derived exception may give none.
    virtual const char* message() const noexcept { return fMessage.c_str(); }

private:
    std::string fMessage;
};

// A request that this machine, driver or state can't fulfil.
class LogicalException : public ExceptionBase {
public:
    using ExceptionBase::ExceptionBase;
};

// A violated expectation of the library's own: "file(line): text".
class InternalException : public ExceptionBase {
public:
    InternalException(const char* file, int line, const char* text);

    const char* file() const noexcept { return fFile; }
    int line() const noexcept { return fLine; }
    // The violated expectation alone.
    const char* text() const noexcept { return fText; }

private:
    const char* fFile;
    int fLine;
    const char* fText;
};

namespace Core {

// An entry point of a dynamic library, to be cast to its real type.
using Proc = void (*)();

// A dynamic library held open. Not copyable; closed by the destructor.
class DynamicLibrary {
public:
    virtual ~DynamicLibrary() = default;
    // Null if the library has no such entry point.
    virtual Proc getProc(const char* name) const = 0;
};

// Opens the first library of a null-terminated list of file names that the platform's loader finds,
// on Windows in the system's folder. Throws LogicalException naming each with the loader's reason.
std::unique_ptr<DynamicLibrary> OpenLibrary(const char* const* names);

class Library {
public:
    // Starts the library: makes sure that the platform's dynamic loader answers. Repeating it does
    // nothing. Throws LogicalException.
    static void Initialize();
};

// Asks the platform's dynamic loader for a sign of life. Throws LogicalException if it gives none.
using LoaderCheck = void (*)();

// Puts `check` in the place of the platform's own and forgets an earlier start; null brings the
// platform's own back. For tests.
void ReplaceLoaderCheck(LoaderCheck check);

} // namespace Core
} // namespace QGF

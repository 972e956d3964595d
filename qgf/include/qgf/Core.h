// QGF::Core: the base of the graphics foundation library: its exceptions, its initialization and
// the loading of dynamic libraries.
#pragma once

#include <exception>
#include <memory>
#include <string>

namespace QGF {

// Base class of the library's exceptions. what() and message() return the same text.
class ExceptionBase : public std::exception {
public:
    explicit ExceptionBase(std::string message) : fMessage(std::move(message)) {}
    const char* what() const noexcept override { return fMessage.c_str(); }

    // What failed and why, on one line; the lines of a shader log are joined by " | ". Never null
    // here; virtual so that a derived class may return null.
    virtual const char* message() const noexcept { return fMessage.c_str(); }

private:
    std::string fMessage;
};

// A request that fails on this machine, with this driver or in the present state.
class LogicalException : public ExceptionBase {
public:
    using ExceptionBase::ExceptionBase;
};

// An internal error, a violated condition of the library: "file(line): text".
class InternalException : public ExceptionBase {
public:
    InternalException(const char* file, int line, const char* text);

    const char* file() const noexcept { return fFile; }
    int line() const noexcept { return fLine; }
    // The violated condition without file and line.
    const char* text() const noexcept { return fText; }

private:
    const char* fFile;
    int fLine;
    const char* fText;
};

namespace Core {

// An entry point of a dynamic library, to be cast to its real type.
using Proc = void (*)();

// An open dynamic library. The destructor closes it.
class DynamicLibrary {
public:
    virtual ~DynamicLibrary() = default;
    // Returns the entry point, null if the library has none of that name.
    virtual Proc getProc(const char* name) const = 0;
};

// Opens the first library of a null-terminated list of file names that the platform's loader can
// open; on Windows only the system folder is searched. If none can be opened, throws
// LogicalException with each name and the loader's reason.
std::unique_ptr<DynamicLibrary> OpenLibrary(const char* const* names);

class Library {
public:
    // Initializes the library: checks that the platform's dynamic loader works. After a success,
    // further calls do nothing. Throws LogicalException.
    static void Initialize();
};

// Checks that the platform's dynamic loader works. Throws LogicalException if it doesn't.
using LoaderCheck = void (*)();

// Replaces the platform's check by `check` and makes the library uninitialized; null restores the
// platform's check. For tests.
void ReplaceLoaderCheck(LoaderCheck check);

} // namespace Core
} // namespace QGF

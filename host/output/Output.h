// The destination of a command's result. Every failure throws std::runtime_error with the text
// "cannot write PLACE: REASON", where PLACE is the file or "to standard output".
#pragma once

#include <memory>
#include <string>
#include <string_view>

namespace assay_host {

// One thread at a time, except for Abandon.
class Output {
public:
    virtual ~Output() = default;
    Output(const Output&) = delete;
    Output& operator=(const Output&) = delete;

    // Call first. May block until there is a reader, for example of a named pipe.
    virtual void Open() {}

    // Writes all of the text, without a buffer. May block.
    virtual void Write(std::string_view text) = 0;

    // Call after the last Write. Gives a temporary file its final name.
    virtual void Finish() = 0;

    // Deletes a temporary file: there will be no result. May be called by another thread while one
    // of the other functions runs or blocks. Never throws.
    virtual void Abandon() {}

protected:
    Output() = default;
};

// Returns an output that writes to this program's standard output.
std::unique_ptr<Output> OpenStandardOutput();

// Returns an output that replaces or creates a file. It writes to a temporary file in the same
// folder, whose name begins with a dot. Finish renames it; otherwise it is deleted. An existing
// device or pipe is written to directly. The path is UTF-8. Throws if the temporary file can't be
// created.
std::unique_ptr<Output> OpenFile(const std::string& path);

// The same for a file that must not exist. Throws if the path exists, even as a link that leads
// nowhere; Finish throws and deletes the temporary file if it exists by then.
std::unique_ptr<Output> OpenNewFile(const std::string& path);

} // namespace assay_host

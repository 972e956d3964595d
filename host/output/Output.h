// Where a command's result goes. Every failure throws std::runtime_error that names the place and
// says what the system says.
#pragma once

#include <memory>
#include <string>
#include <string_view>

namespace assay_host {

class Output {
public:
    virtual ~Output() = default;
    Output(const Output&) = delete;
    Output& operator=(const Output&) = delete;

    // Called first. May wait for a reader, for example when it opens a named pipe.
    virtual void Open() {}

    // Has reached the system when it returns.
    virtual void Write(std::string_view text) = 0;

    // Nothing more comes. A file gets its name here.
    virtual void Finish() = 0;

    // Deletes a temporary file, as no result will come. Another thread may call it while one of the
    // other functions runs or blocks.
    virtual void Abandon() {}

protected:
    Output() = default;
};

std::unique_ptr<Output> OpenStandardOutput();

// A file that takes its place only when it is finished: until then it is a temporary one in the
// same folder, deleted if it never comes to that. What exists there and is no file, as a device or
// a pipe, is written to directly.
std::unique_ptr<Output> OpenFile(const std::string& path);

} // namespace assay_host

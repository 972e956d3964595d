// The files that a child loaded for OpenGL and OpenCL, from its log.
#pragma once

#include <string>
#include <string_view>
#include <vector>

#include "report/KnownKeys.h"
#include "report/RunFacts.h"

namespace assay_host {

struct LoadedFile {
    DeviceKind fInterface = DeviceKind::kOpenGL;
    std::string fPath; // raw bytes; UTF-8 on Windows
    Fact fVersion{{}, "not read"};
    Fact fBuildId{{}, "not read"}; // in lower-case hexadecimal
};

struct LoadedFiles {
    static constexpr std::size_t kMaxFiles = 4096; // no driver loads a tenth as many

    std::vector<LoadedFile> fFiles; // in the order in which they were loaded, each once
    std::string fReason;            // why the list isn't known; empty if it is

    bool IsKnown() const { return fReason.empty(); }
};

// Takes the text of a log line. Returns false if it isn't about these files. "driver files are
// logged" makes the list known. "loaded for INTERFACE: PATH" also adds a file, except one that the
// list has, the C and C++ runtime, and one beyond kMaxFiles. Any thread may call.
bool TakeLoadedFile(std::string_view text, LoadedFiles& files);

} // namespace assay_host

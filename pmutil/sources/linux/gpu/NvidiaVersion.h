// Parses /proc/driver/nvidia/version.
#pragma once

#include <string>

namespace pmutil {

struct NvidiaVersion {
    std::string version; // such as "535.104.05"; empty if the text has none
    std::string date;    // of the build, in WMI's form; empty if the text has no complete date
};

// Parses the line that starts with "NVRM version:", such as "NVRM version: NVIDIA UNIX x86_64
// Kernel Module  535.104.05  Sat Aug 19 01:15:15 UTC 2023".
NvidiaVersion ParseNvidiaVersion(const std::string& text);

} // namespace pmutil

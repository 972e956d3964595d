// The kernel's messages about graphics, as far as this user may read them.
#pragma once

#include <string>
#include <string_view>
#include <vector>

namespace assay_host {

struct KernelLog {
    std::vector<std::string> fLines; // raw bytes; the last kMaxKernelLines about graphics
    std::string fReason;             // why they aren't known; empty if they are
};

constexpr std::size_t kMaxKernelLines = 2000;

// Where the messages come from.
struct KernelLogSource {
    std::string fDevice = "/dev/kmsg"; // a device with one record for each read
    std::string fProgram =
        "journalctl";            // asked if the device can't be read: a path, or a name of the PATH
    double fTimeoutSeconds = 10; // of the program
};

// Reads the messages since the start of the system. On Windows they are never known. Throws only
// std::bad_alloc. Any thread may call.
KernelLog ReadKernelLog(const KernelLogSource& source = {});

// Returns "[    1.234567] text" of a record of /dev/kmsg ("6,339,1234567,-;text"), and an empty
// text of anything else.
std::string ReadKernelRecord(std::string_view record);

// Whether the message is about graphics, or about a crash of assay.
bool IsGraphicsMessage(std::string_view line);

// Returns the lines that IsGraphicsMessage() selects, at most the last kMaxKernelLines.
std::vector<std::string> SelectGraphicsMessages(std::vector<std::string> lines);

} // namespace assay_host

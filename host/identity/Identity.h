// The identity of what draws and computes on a machine: its adapters with their drivers, the files
// that OpenGL and OpenCL would load, the variables that select among them, the system and assay.
// What a run found holds for one identity.
#pragma once

#include <cstdint>
#include <string>
#include <vector>

#include "report/KnownKeys.h"

namespace assay_host {

// A display adapter. A fact that the system doesn't provide is empty or 0.
struct AdapterIdentity {
    // Where the adapter is: on Linux its PCI address ("0000:01:00.0") or the path of its device
    // below /sys/devices; on Windows the device's instance ("PCI\VEN_10DE&DEV_2484&...").
    std::string fSlot;
    unsigned fVendor = 0; // PCI ids; 0 if the adapter isn't on PCI
    unsigned fDevice = 0;
    std::string fDriver;        // the kernel's driver; empty if none is bound
    std::string fDriverVersion; // its own version; empty if it has none besides the system's
};

// A file that an interface would load: its loader library, a list of drivers or a driver.
struct DriverFile {
    DeviceKind fInterface = DeviceKind::kOpenGL;
    std::string fPath;       // absolute, without symbolic links; UTF-8 on Windows
    std::uint64_t fSize = 0; // bytes
    std::int64_t fTime = 0;  // of the last change: nanoseconds since 1970 in UTC
    std::string fBuildId;    // the GNU build id in lower-case hexadecimal; empty if there is none
};

struct Identity {
    std::vector<AdapterIdentity> fAdapters; // sorted by all fields in their order
    std::vector<DriverFile> fFiles;         // sorted by all fields in their order, each once
    std::vector<std::string> fVariables;    // "NAME=value" of ListVariables()
    std::string fSystem;                    // the operating system's build and the kernel's
    std::string fAssayVersion;              // of the program's file; empty if it can't be read
};

bool operator==(const AdapterIdentity& left, const AdapterIdentity& right);
bool operator==(const DriverFile& left, const DriverFile& right);
bool operator==(const Identity& left, const Identity& right);
bool operator!=(const Identity& left, const Identity& right);

// Brings the lists of an identity into their order and removes files that are listed twice.
void SortIdentity(Identity& identity);

// Collects the identity of the machine at this moment. Loads no driver, opens no device and wakes
// no card. `assayProgram` is the path of assay's file, which isn't run. Files that are missing or
// can't be read are left out. The environment of this process counts as far as it selects drivers,
// so the process that draws must have the same. Throws only std::bad_alloc. Any thread may call,
// while no other thread changes the environment.
Identity GetIdentity(const std::string& assayProgram);

} // namespace assay_host

// What the identity of a Windows machine is made from. A test replaces it.
#pragma once

#include <cstdint>
#include <optional>
#include <string>
#include <vector>

#include "identity/Identity.h"

namespace assay_host {

// A value of a registry key. It has texts, or a number, or neither.
struct RegistryValue {
    std::string fName;
    std::vector<std::string> fTexts; // variables are expanded
    std::optional<std::uint32_t> fNumber;
};

// All texts are UTF-8. Keys are paths below HKEY_LOCAL_MACHINE. What can't be read is as if it
// weren't there. Throws only std::bad_alloc. One thread at a time.
class WindowsSource {
public:
    WindowsSource() = default;
    virtual ~WindowsSource() = default;
    WindowsSource(const WindowsSource&) = delete;
    WindowsSource& operator=(const WindowsSource&) = delete;

    virtual std::vector<std::string> ListKeys(const std::string& key) = 0;
    virtual std::vector<RegistryValue> ListValues(const std::string& key) = 0;

    // Returns the instances of the present devices of a class, such as
    // "PCI\VEN_10DE&DEV_2484&SUBSYS_00000000&REV_A1\4&1&0&0008".
    virtual std::vector<std::string> ListPresentDevices(const std::string& classId) = 0;

    // Returns the file without an interface; none if it is missing or no regular file.
    virtual std::optional<DriverFile> FindFile(const std::string& path) = 0;

    virtual std::string GetSystemFolder() = 0; // "C:\Windows\System32"
    virtual std::string GetVariable(const std::string& name) = 0;
};

} // namespace assay_host

// Names from the PCI id database.
#pragma once

#include <cstdint>
#include <string>

namespace QGF {

// The names that the text of a database, as the file pci.ids holds it, has for a device: "vendor
// device". Empty if it lacks either.
std::string FindPciName(const std::string& database, std::uint16_t vendor, std::uint16_t device);

// Looks names up, with the libraries and files of this machine.
class PciIds {
public:
    // The name of a device, "vendor device"; empty if no database has it.
    std::string name(std::uint16_t vendor, std::uint16_t device);

private:
    std::string fDatabase;
    bool fRead = false;
};

} // namespace QGF

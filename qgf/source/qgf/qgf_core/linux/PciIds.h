// Names from the PCI id database.
#pragma once

#include <cstdint>
#include <string>

namespace QGF {

// Looks a device's name up in a database, the text of a file pci.ids. Returns "vendor device", with
// the two names; empty if the database lacks either.
std::string FindPciName(const std::string& database, std::uint16_t vendor, std::uint16_t device);

// Looks names up in this machine's database.
class PciIds {
public:
    // Returns the names "vendor device"; empty if the database lacks either. The first call that
    // needs the database's file reads it.
    std::string name(std::uint16_t vendor, std::uint16_t device);

private:
    std::string fDatabase;
    bool fRead = false;
};

} // namespace QGF

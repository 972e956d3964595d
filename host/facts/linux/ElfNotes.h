// The notes of an ELF file.
#pragma once

#include <cstdint>
#include <istream>
#include <string>

namespace assay_host {

// The bytes of the note with that owner and type; empty if the file has none, is no ELF file of
// this machine's word size and byte order, or is damaged. Reads no more than 64 KiB of notes.
std::string FindElfNote(std::istream& file, const std::string& owner, std::uint32_t type);

} // namespace assay_host

// Reads the notes of an ELF file.
#pragma once

#include <cstdint>
#include <istream>
#include <string>

namespace assay_host {

// Returns the bytes of the note with this owner and type. Empty if the file has none, isn't an ELF
// file of this machine's word size and byte order, or is damaged. Reads at most 64 KiB of notes.
std::string FindElfNote(std::istream& file, const std::string& owner, std::uint32_t type);

// Finds the note in the bytes of one segment of notes. Empty if it has none or is damaged.
std::string FindNote(const std::string& notes, const std::string& owner, std::uint32_t type);

// Returns the bytes in lower-case hexadecimal, as a build id is written.
std::string MakeHexText(const std::string& bytes);

} // namespace assay_host

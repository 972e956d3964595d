// Parses numbers that the kernel prints.
#pragma once

#include <cstdint>
#include <string>

namespace pmutil {

// Parses a line that is a single number, decimal or hexadecimal with "0x". Returns false, with
// `number` unchanged, for any other text, for a sign and on overflow.
bool ParseSystemNumber(const std::string& line, std::uint64_t& number);

// Parses the first line of a file under the system root in the same way.
bool ReadSystemNumber(const std::string& path, std::uint64_t& number);

// Parses MemTotal in the text of /proc/meminfo, in bytes. Returns false, with `bytes` unchanged, if
// it is missing or malformed.
bool ParseMemoryTotal(const std::string& meminfo, std::uint64_t& bytes);

} // namespace pmutil

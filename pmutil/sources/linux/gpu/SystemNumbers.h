// Numbers as the kernel prints them.
#pragma once

#include <cstdint>
#include <string>

namespace pmutil {

// A line that is one number and nothing else, in decimal or hexadecimal with "0x". False, with
// `number` left alone, for anything else, for a sign and for what 64 bits don't hold.
bool ParseSystemNumber(const std::string& line, std::uint64_t& number);

// The first line of that file under the system root as such a number.
bool ReadSystemNumber(const std::string& path, std::uint64_t& number);

// MemTotal of the text of /proc/meminfo, in bytes.
bool ParseMemoryTotal(const std::string& meminfo, std::uint64_t& bytes);

} // namespace pmutil

// Parses the size of a card's dedicated memory from drivers' answers and kernel texts. No file is
// read here.
#pragma once

#include <cstdint>
#include <optional>
#include <string>

namespace pmutil {

// Returns the bytes of dedicated memory from the driver's answer to QueryDrmNode: the sum over all
// tiles, 0 if the card has none. Returns nothing if `answer` is not an answer of that driver.
std::optional<std::uint64_t> ParseDedicatedMemory(const std::string& driver,
                                                  const std::string& answer);

// Returns the size in bytes of the largest prefetchable memory BAR in the text of a PCI function's
// "resource" file; 0 if there is none. Only the first six lines are BARs. A BAR shows the part of
// the card's memory that the processor can access: often less than all of it, or, after a resize,
// its size rounded up to a power of two.
std::uint64_t LargestPrefetchableBar(const std::string& resource);

} // namespace pmutil

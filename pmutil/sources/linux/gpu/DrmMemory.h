// What the kernel's texts and the drivers' answers say of a card's own memory. Nothing is fetched
// here: a test can feed all of it.
#pragma once

#include <cstdint>
#include <optional>
#include <string>

namespace pmutil {

// The bytes of a card's own memory by what its driver has answered (AskDrmNode); 0 if it answered
// that there is none, nothing if that is no answer of that driver. Memory of several tiles is added
// up.
std::optional<std::uint64_t> MemoryInAnswer(const std::string& driver, const std::string& answer);

// The size in bytes of the largest prefetchable memory BAR by the text of a PCI function's
// "resource" file; 0 if there is none. Only the first six lines are BARs. It is what the processor
// can see of the card's memory: often less than there is, and once it has been resized the power of
// two that holds it.
std::uint64_t LargestPrefetchableBar(const std::string& resource);

} // namespace pmutil

// The NVIDIA driver's entries under /proc/driver/nvidia/gpus.
#pragma once

#include <string>
#include <vector>

namespace QGF {

// Returns the value of a line "key: value" in the text of an "information" file, without leading
// and trailing blanks; empty if there is no such line.
std::string NvidiaField(const std::string& information, const std::string& key);

// Returns the driver's model text of the card at that address; empty if the driver doesn't list the
// card, has no text for it, or the card is suspended.
std::string NvidiaModel(const std::string& pciAddress);

// Returns the addresses of the driver's cards in ascending order.
std::vector<std::string> NvidiaCards();

} // namespace QGF

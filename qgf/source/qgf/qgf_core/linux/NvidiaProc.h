// What the NVIDIA driver tells of its cards under /proc/driver/nvidia/gpus.
#pragma once

#include <string>
#include <vector>

namespace QGF {

// The value of a line "key: value" in the text of an "information" file, without the blanks around
// it; empty if there is no such line.
std::string NvidiaField(const std::string& information, const std::string& key);

// The driver's model text of the card at that address; empty if it isn't this driver's, has none,
// or is suspended.
std::string NvidiaModel(const std::string& pciAddress);

// The addresses of the driver's cards in ascending order.
std::vector<std::string> NvidiaCards();

} // namespace QGF

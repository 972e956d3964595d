// The one place where a PCI graphics adapter gets its name. The display devices of QGF::OGL and the
// system's adapter list both ask here, so that their names match.
#pragma once

#include <string>

namespace QGF {

// A folder that stands for the root of the file system wherever adapters are looked up; empty for
// the real one. Set it before anything else is asked. For tests and recorded machines.
void SetSystemRoot(const std::string& root);
const std::string& SystemRoot();

// The name of the adapter at a PCI address such as "0000:01:00.0": the first that is known of the
// NVIDIA driver's own model text, amdgpu's product name, the PCI id database's "vendor device", and
// "vendor:device" in hexadecimal. If another display adapter of the machine would get the same
// name, " (PCI address)" is appended to each. Empty if there is no such adapter.
std::string AdapterName(const std::string& pciAddress);

} // namespace QGF

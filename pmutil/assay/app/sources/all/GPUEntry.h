// A device under test, the element of the tester's lists.
#pragma once

#include <list>
#include <string>

#include <boost/shared_ptr.hpp>

#include "pmutil_gpu/GPU.h"

namespace assay {

// `tag` is "glgpu[N]" or "clgpu[N]" with the device's index in the enumeration; it never changes.
// `gpu` is a GLGPU or a CLGPU, depending on the list.
struct GPUEntry {
    std::string tag;
    boost::shared_ptr<pmutil::GPU> gpu;
};

using GPUEntries = std::list<GPUEntry>;

} // namespace assay

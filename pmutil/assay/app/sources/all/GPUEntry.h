// A device under test, as the tester's lists hold it.
#pragma once

#include <list>
#include <string>

#include <boost/shared_ptr.hpp>

#include "pmutil_gpu/GPU.h"

namespace assay {

// `tag` is "glgpu[N]" or "clgpu[N]" with the index that the device had when it was enumerated; it
// never changes. `gpu` is a GLGPU or a CLGPU, according to the list that the entry lies in.
struct GPUEntry {
    std::string tag;
    boost::shared_ptr<pmutil::GPU> gpu;
};

using GPUEntries = std::list<GPUEntry>;

} // namespace assay

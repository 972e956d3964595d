// The frame of an OpenCL measurement: a context and a profiling queue of its own on one device.
#pragma once

#include "qgf/OCL.h"

namespace pmutil {

using CLMeasurement = double (*)(const QGF::OCL::Context& context,
                                 const QGF::OCL::CommandQueue& queue);

// What `measure` gives on a fresh context and queue of the device. Logs the two risky calls before
// they are made, and then the result: behind `resultLabel`, and by `name`, which is also the log
// scope's. Failures of the library and of `measure` pass through.
double OnProfilingQueue(const char* name, const char* resultLabel, const QGF::OCL::Device& device,
                        CLMeasurement measure);

} // namespace pmutil

// Runs an OpenCL measurement on a context and a profiling queue of its own.
#pragma once

#include "qgf/OCL.h"

namespace pmutil {

using CLMeasurement = double (*)(const QGF::OCL::Context& context,
                                 const QGF::OCL::CommandQueue& queue);

// Makes a context and a queue on the device, calls `measure` with them and returns its result. Logs
// the two calls before they are made, since a driver may crash in them. Logs the result twice:
// after `resultLabel`, and as "result=" after `name`, which also names the log scope. Exceptions
// pass through.
double OnProfilingQueue(const char* name, const char* resultLabel, const QGF::OCL::Device& device,
                        CLMeasurement measure);

} // namespace pmutil

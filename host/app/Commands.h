// What the commands do. Each gives the exit status; what throws is trouble.
#pragma once

#include "app/CommandLine.h"

namespace assay_host {

int Run(const RunChoice& choice);
int Torture(const TortureChoice& choice);
int Diff(const DiffChoice& choice);

} // namespace assay_host

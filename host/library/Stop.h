// The stop object of the C interface.
#pragma once

#include "assay_host.h"
#include "pmutil/StopRequest.h"

struct assay_host_stop {
    pmutil::StopRequest fRequest;
};

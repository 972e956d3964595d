// The options object of the C interface.
#pragma once

#include "assay_host.h"
#include "memory/Adviser.h"
#include "supervise/ChildRun.h"

struct assay_host_options {
    assay_host::ChildOptions fChild; // an empty program is the default one
    bool fIdentify = false;

    assay_host_line_callback fOnLine = nullptr;
    void* fLineContext = nullptr;
    assay_host_line_callback fOnErrorLine = nullptr;
    void* fErrorLineContext = nullptr;
    assay_host_tick_callback fOnTick = nullptr;
    void* fTickContext = nullptr;

    // Of an advice.
    assay_host::AdviceRequest fRequest;
    bool fDryRun = false;
};

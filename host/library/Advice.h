// The advice object of the C interface.
#pragma once

#include <cstdint>
#include <optional>
#include <string>

#include "assay_host.h"
#include "memory/Adviser.h"

// What an advice says of one interface, as the functions return it.
struct AdvicePart {
    AdvicePart(const assay_host::Advice& advice, assay_host::DeviceKind kind);

    const assay_host::InterfaceAdvice& fAdvice;
    const std::string fReason;
    const std::string fText;
    const char* const fSource;
    const char* const fEnd;
    const std::string fEndText;
    const std::string fWarning;
    const std::string fChange;
    const std::optional<std::int64_t> fAge;
    const std::optional<std::int64_t> fNext; // seconds from the advice
};

// Constant after construction.
struct assay_host_advice {
    assay_host_advice(assay_host::Advice advice, int status);
    assay_host_advice(const assay_host_advice&) = delete;
    assay_host_advice& operator=(const assay_host_advice&) = delete;

    const assay_host::Advice fAdvice;
    const AdvicePart fParts[2]; // by assay_host_interface
    const std::string fDocument;
};

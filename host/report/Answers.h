// What a report answers of what it is asked: each key of each device with its line, or with the
// reason why there is none.
#pragma once

#include <cstddef>
#include <cstdint>
#include <string>
#include <vector>

#include "report/KnownKeys.h"
#include "report/Report.h"

namespace assay_host {

enum class Missing {
    kNot,
    kNotPrinted,   // the device has nothing to print
    kDeviceFailed, // a test of the device failed before
    kRunEnded,     // the run ended before
    kNoOpenCL,     // the machine has no OpenCL
    kUnreadable    // later keys are there, so its line is lost or garbled
};

// "not printed by this device", "device failed before", "run ended before", "no OpenCL",
// "no readable line"; the empty text of kNot.
const char* GetMissingText(Missing missing);

struct Answer {
    std::string fKey;        // behind the tag and its point
    const KnownKey* fKnown;  // null of a key that the report has besides
    const ReportLine* fLine; // null if missing
    Missing fMissing = Missing::kNot;
};

struct DeviceAnswers {
    std::string fTag;
    DeviceKind fKind;
    std::uint32_t fIndex;
    bool fComplete;               // it went through all its tests
    bool fFailed;                 // one of its tests failed
    std::vector<Answer> fAnswers; // the known keys in the report's order, then the others

    const ReportLine* Find(std::string_view key) const;
    std::string GetValue(std::string_view key) const; // empty if missing
};

struct Answers {
    std::vector<Answer> fReport;         // the report's own keys, then the others without a tag
    std::vector<DeviceAnswers> fDevices; // OpenGL first, then by index
    // Devices of an index from kMaxDevices on, which no machine has.
    std::size_t fDevicesLeftOut;
    // As SequenceReader::GetNextKey() says of the whole report.
    std::string fNext;
};

// The answers point into the report. A device that the report counts but doesn't name is one too.
Answers GetAnswers(const Report& report);

} // namespace assay_host

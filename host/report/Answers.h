// A report by device and key: for each key its line, or the reason why there is none.
#pragma once

#include <cstddef>
#include <cstdint>
#include <string>
#include <vector>

#include "report/KnownKeys.h"
#include "report/Report.h"
#include "report/RunOutcome.h"
#include "report/Unknown.h"

namespace assay_host {

// Why a key has no line.
enum class Missing {
    kNot,          // it has one
    kNotPrinted,   // the device has no value to print
    kDeviceFailed, // a test of the device failed before
    kRunEnded,     // the run ended before
    kNoOpenCL,     // the machine has no OpenCL
    kUnreadable    // later lines are there, so its line is lost or garbled
};

// Returns "not printed by this device", "device failed before", "run ended before", "no OpenCL" or
// "no readable line"; an empty text for kNot.
const char* GetMissingText(Missing missing);

struct Answer {
    std::string fKey;        // without the tag and its point
    const KnownKey* fKnown;  // null if the key isn't in the table
    const ReportLine* fLine; // null if missing; owned by the report
    Missing fMissing = Missing::kNot;
    Unknown fUnknown = Unknown::kNot; // why the line's value stands for "not known"
    double fLowerBound = 0;           // of the value, by another clock; 0 without one

    // Whether there is a value that says something.
    bool IsKnown() const { return fLine != nullptr && fUnknown == Unknown::kNot; }
};

struct DeviceAnswers {
    std::string fTag;
    DeviceKind fKind;
    std::uint32_t fIndex;
    bool fComplete;               // it has the line of its last key
    bool fFailed;                 // one of its tests failed
    std::vector<Answer> fAnswers; // the keys of the table in the report's order, then the others

    // Returns the key's line; null if it is missing. The key is without the tag.
    const ReportLine* Find(std::string_view key) const;

    // Returns the key's value; empty if it is missing.
    std::string GetValue(std::string_view key) const;

    // Returns the first answer that is missing because a test of the device failed; null without
    // one.
    const Answer* FindFailed() const;
};

struct Answers {
    std::vector<Answer> fReport;         // keys without a tag: those of the table, then the others
    std::vector<DeviceAnswers> fDevices; // OpenGL devices, then OpenCL devices, by index
    std::size_t fDevicesLeftOut;         // devices of an index from kMaxDevices on
    std::string fNext;                   // SequenceReader::GetNextKey() after the last line
};

// Collects the answers. They point into the report, which must outlive them. A device that the
// report counts but never names is included.
Answers GetAnswers(const Report& report);

// The same with the lower bounds of the outcome.
Answers GetAnswers(const Report& report, const RunOutcome& outcome);

} // namespace assay_host

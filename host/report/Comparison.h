// What differs between two runs, in groups. All forms of `assay-host diff` are made of it.
#pragma once

#include <optional>
#include <string>
#include <vector>

#include "report/Answers.h"

namespace assay_host {

// In the order in which the forms show them.
enum class DiffGroup {
    kRun,          // how the run ended, and how far its report goes
    kUsable,       // whether OpenGL and OpenCL can be used
    kTrials,       // what can be answered with yes or no by trying it, and failed tests
    kDevices,      // which devices there are, and their order
    kFacts,        // everything else that a device or the report says
    kMeasurements, // speeds
    kIdentity,     // the machine's name and the times
    kOthers        // lines that aren't part of a report, and the constants of gputag lines
};

// A difference is of an answer, of a device that one report doesn't have or has at another place,
// or of something else, which has a key and two texts.
struct Difference {
    DiffGroup fGroup = DiffGroup::kFacts;

    // In the first and the second report; null without a device, or if one report doesn't have it.
    const DeviceAnswers* fDeviceBefore = nullptr;
    const DeviceAnswers* fDeviceAfter = nullptr;

    // Null if this isn't of an answer, or if one report doesn't have the key.
    const Answer* fAnswerBefore = nullptr;
    const Answer* fAnswerAfter = nullptr;

    // Of something else: an identifier such as "verdict" or "opengl.usable", and the texts, which
    // may be any bytes; nothing if one report doesn't have it.
    std::string fKey;
    std::optional<std::string> fBefore;
    std::optional<std::string> fAfter;

    // The same for people, safe to write to a terminal. Empty: as they are.
    std::string fTextBefore{};
    std::string fTextAfter{};

    // What more there is to say, safe to write to a terminal; may be empty.
    std::string fNote{};

    bool IsOfAnswer() const { return fAnswerBefore != nullptr || fAnswerAfter != nullptr; }
    bool IsOfDevice() const { return !IsOfAnswer() && fKey.empty(); }
};

// An answer that both reports have. The same value, or a measurement that doesn't count as changed.
struct SameAnswer {
    const DeviceAnswers* fDevice; // null without a device
    const Answer* fBefore;
    const Answer* fAfter;
    std::string fNote{}; // of a measurement: why it doesn't count as changed; may be empty
};

// Points into the reports, which must outlive it. Can be moved; one thread at a time.
struct Comparison {
    Comparison() = default;
    Comparison(const Comparison&) = delete;
    Comparison& operator=(const Comparison&) = delete;
    Comparison(Comparison&&) = default;
    Comparison& operator=(Comparison&&) = default;

    bool IsSame() const { return fDifferences.empty(); }

    Answers fBefore;
    Answers fAfter;
    std::vector<Difference> fDifferences; // by group; in a group in the order of the first report
    std::vector<SameAnswer> fSame;        // those with a note; all if asked for
};

} // namespace assay_host

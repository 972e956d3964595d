// Follows a report line by line through the child's sequence of tests. This is the only place that
// decides which line comes next and whether a device has failed.
#pragma once

#include <cstddef>
#include <map>
#include <optional>
#include <set>
#include <string>

#include "report/KnownKeys.h"
#include "report/LineForm.h"
#include "report/ReportLine.h"

namespace assay_host {

// Tolerates lines that are missing, unknown or forged: a later line is proof that the child went
// past everything before it, and an earlier line never moves the reader back.
//
// One thread at a time.
class SequenceReader {
public:
    // Reads the next line of the report. Any line is accepted.
    void Add(const ReportLine& line);

    // Returns the number of steps that the lines so far show to be taken.
    std::size_t GetSteps() const;

    // Returns the key of the line that comes next, which is the child's current operation: a key
    // without a tag, a device's key with its tag, or "gputag.NAME". Empty after a whole end stamp.
    std::string GetNextKey() const;

    // The same with the device's key, and its tag, instead of "gputag.NAME" before its line.
    std::string GetNextAnswerKey() const;

    // Whether a line has come that is printed after the key's line; for a device's key, after the
    // line of that device.
    bool HasPassed(const KnownKey& key, std::size_t device = 0) const;

    // Whether a test of the device failed: the log says so, or the report has gone past a line that
    // the device must print and has none from the device since.
    bool HasFailed(const DeviceTag& tag) const;

    // Returns the number of keys of GetDeviceKeys() up to the last one that has a line of the
    // device.
    std::size_t CountAnswered(const DeviceTag& tag) const;

private:
    // The position of a line, in the order of the report.
    struct Place {
        std::size_t fRow; // in GetKnownKeys()
        std::size_t fDevice;
        std::size_t fLine; // among the key's gputag lines, which are followed by its own
    };
    friend bool operator<(const Place& a, const Place& b);

    struct Device {
        std::size_t fAnswered = 0;       // as CountAnswered() returns it
        bool fTerminated = false;        // the log says that a test failed
        std::set<std::size_t> fSilent{}; // rows for which it prints no line
    };
    struct Kind {
        std::optional<std::size_t> fCount; // as the report says
        std::map<std::size_t, Device> fDevices;

        // Lines of a device beyond the count don't advance the reader.
        bool Has(std::size_t index) const { return !fCount || index < *fCount; }
    };

    void AddTermination(const std::string& text);
    void AddReportLine(const ReportLine& line);
    void AddDeviceLine(const DeviceTag& tag, const ReportLine& line);
    void AddTagLine(const std::string& key);
    void Advance(const Place& place);

    bool HasFailed(const DeviceTag& tag, const Device& device) const;
    bool HasOpenCL() const;
    std::size_t CountSteps(const DeviceTag& tag, const Device& device) const;
    std::string GetNext(bool withTagLines) const;
    std::optional<std::size_t> FindNextLine(std::size_t row, const DeviceTag& tag,
                                            const Device& device) const;

    std::map<DeviceKind, Kind> fKinds = {{DeviceKind::kOpenGL, {}}, {DeviceKind::kOpenCL, {}}};
    std::optional<Place> fLast; // the furthest line so far
    bool fEnded = false;        // a whole end stamp has come
};

} // namespace assay_host

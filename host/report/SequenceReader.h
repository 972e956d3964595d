// Where in its sequence a child is, from the lines of its report so far. Whatever names what comes
// next, or says that a device has failed, asks this.
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

// Lines may be lost, foreign or forged: what a later line shows counts, and no line leads back.
class SequenceReader {
public:
    void Add(const ReportLine& line);

    // Steps that are known to be taken.
    std::size_t GetSteps() const;

    // What stands before the '=' of the line that comes next, and so what the child is at: one of
    // the report's own keys, a device's key with its tag, or "gputag.NAME". Empty after a whole end
    // stamp.
    std::string GetNextKey() const;

    // Whether a line has come that follows the key's line, of that device if it is a device's.
    bool HasPassed(const KnownKey& key, std::size_t device = 0) const;

    // Whether a test of the device failed: the log says so, or a line has come that follows one
    // that the device would have printed, and none of its own.
    bool HasFailed(const DeviceTag& tag) const;

    // How many of GetDeviceKeys() there are up to the last one that the device has a line for.
    std::size_t CountAnswered(const DeviceTag& tag) const;

private:
    // Of a line: its key, the device, and how many lines of the two stand in front of it.
    struct Place {
        std::size_t fRow; // in GetKnownKeys()
        std::size_t fDevice;
        std::size_t fLine;
    };
    friend bool operator<(const Place& a, const Place& b);

    struct Device {
        std::size_t fAnswered = 0;
        bool fTerminated = false;        // by the log
        std::set<std::size_t> fSilent{}; // rows for which it has no line
    };
    struct Kind {
        std::optional<std::size_t> fCount; // as the report says
        std::map<std::size_t, Device> fDevices;

        // A device that the count leaves no room for leads nowhere.
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
    std::optional<std::size_t> FindNextLine(std::size_t row, const DeviceTag& tag,
                                            const Device& device) const;

    std::map<DeviceKind, Kind> fKinds = {{DeviceKind::kOpenGL, {}}, {DeviceKind::kOpenCL, {}}};
    std::optional<Place> fLast;
    bool fEnded = false;
};

} // namespace assay_host

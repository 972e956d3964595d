// A report, whole or not: its lines in order, with an index of its devices and keys.
#pragma once

#include <cstddef>
#include <string>
#include <unordered_map>
#include <utility>
#include <vector>

#include "report/ReportLine.h"

namespace assay_host {

// The lines of one device.
struct Device {
    std::string fTag; // "glgpu[0]", "clgpu[1]"
    // Each key without its tag, with the index of its line in Report::GetLines(), in the order of
    // the report. If a key comes twice, the last line counts.
    std::vector<std::pair<std::string, std::size_t>> fKeys;
};

// Not synchronized. Add invalidates the pointers and references that the other functions return.
class Report {
public:
    // Appends lines.
    void Add(ReportLine line);
    void Add(std::vector<ReportLine> lines);

    // Returns all lines in order.
    const std::vector<ReportLine>& GetLines() const { return fLines; }

    // Returns the devices that have a line, in the order of their first lines.
    const std::vector<Device>& GetDevices() const { return fDevices; }

    // Returns the last line of the key: "NumGLGPUs", "glgpu[0].GLName". Null if there is none.
    const ReportLine* Find(const std::string& key) const;

    // The same for a key of a device, without its tag.
    const ReportLine* Find(const Device& device, const std::string& key) const;

    // Whether it has a whole "assayStart" and a whole "assayEnd" line, as IsStamp() has it.
    bool IsWhole() const;

    // Whether it has a whole "assayEnd" line.
    bool HasEnd() const;

    // Returns all lines with their line ends, byte by byte as they came.
    std::string ToText() const;

private:
    // Where a key's last line is. fDevice and fKey are only of a device's key: the device and the
    // key's index among its keys.
    struct Place {
        std::size_t fLine;
        std::size_t fDevice;
        std::size_t fKey;
    };

    void AddDeviceKey(const std::string& tag, const std::string& key, std::size_t line);

    std::vector<ReportLine> fLines;
    std::vector<Device> fDevices;
    std::unordered_map<std::string, Place> fPlaces;     // by key with tag
    std::unordered_map<std::string, std::size_t> fTags; // index in fDevices
};

} // namespace assay_host

// A report as a whole: its lines in order, and its devices with what is known of each. Built from
// lines as they come, whole or not.
#pragma once

#include <cstddef>
#include <string>
#include <unordered_map>
#include <utility>
#include <vector>

#include "report/ReportLine.h"

namespace assay_host {

// One device: "glgpu[0]", "clgpu[1]".
struct Device {
    std::string fTag;
    // Key (behind the tag and its point) and the index of its line in Report::GetLines(); in the
    // report's order. Of a key that comes twice the last one counts.
    std::vector<std::pair<std::string, std::size_t>> fKeys;
};

class Report {
public:
    void Add(ReportLine line);
    void Add(std::vector<ReportLine> lines);

    const std::vector<ReportLine>& GetLines() const { return fLines; }
    const std::vector<Device>& GetDevices() const { return fDevices; }

    // The value of a key without a tag ("NumGLGPUs"), or of a device's key; null without one.
    const ReportLine* Find(const std::string& key) const;
    const ReportLine* Find(const Device& device, const std::string& key) const;

    // It has its start stamp and its end stamp.
    bool IsWhole() const;

    // It has its end stamp, quotes, line end and all.
    bool HasEnd() const;

    // All lines as they came, line ends and all.
    std::string ToText() const;

private:
    // Where the value of a key stands: its line, and for a device's key its device and its place
    // in the device's list.
    struct Place {
        std::size_t fLine;
        std::size_t fDevice;
        std::size_t fKey;
    };

    void AddDeviceKey(const std::string& tag, const std::string& key, std::size_t line);

    std::vector<ReportLine> fLines;
    std::vector<Device> fDevices;
    std::unordered_map<std::string, Place> fPlaces;     // of whole keys, tag and all
    std::unordered_map<std::string, std::size_t> fTags; // index in fDevices
};

} // namespace assay_host

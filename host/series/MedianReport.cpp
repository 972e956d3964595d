#include "series/MedianReport.h"

#include <map>
#include <string>

#include <fmt/format.h>

#include "report/Answers.h"
#include "report/LineForm.h"
#include "report/ValueText.h"
#include "series/SeriesStatistics.h"

namespace assay_host {

Report MakeMedianReport(const Report& shown, const Series& series)
{
    std::map<std::string, std::string> values; // by key with tag
    for (const DeviceAnswers& device : GetAnswers(shown).fDevices) {
        for (const Measurement& measurement : series.fMeasurements) {
            // The names distinguish devices that changed places.
            if (measurement.fKey == nullptr || measurement.fTag != device.fTag ||
                measurement.fName != GetDeviceName(device))
                continue;
            if (const auto value = GetTypicalValue(measurement))
                values[measurement.fKey->GetKey(device.fTag)] = fmt::format("{:.12g}", *value);
        }
    }
    Report report;
    for (const ReportLine& line : shown.GetLines()) {
        const auto value = values.find(line.fKey);
        if (value == values.end())
            report.Add(line);
        else
            report.Add(ReadLine(line.fKey + "=" + value->second, "\n", false));
    }
    return report;
}

Report GetTypicalReport(const StoredRun& run)
{
    return run.fSeries ? MakeMedianReport(run.fReport, *run.fSeries) : run.fReport;
}

} // namespace assay_host

#include "series/JsonSeries.h"

#include <cmath>
#include <stdexcept>
#include <utility>

#include <fmt/format.h>
#include <nlohmann/json.hpp>

#include "report/Bytes.h"
#include "report/Explanations.h"
#include "report/JsonBytes.h"
#include "report/JsonMembers.h"
#include "series/SeriesStatistics.h"

namespace assay_host {

namespace {

using Json = nlohmann::ordered_json;

// What the members of "statistics" are. docs/repeat.md says more.
constexpr std::pair<const char*, const char*> kDefinitions[] = {
    {"samples", "one for each run that has the device; run 1 is the first"},
    {"statistics", "of the known samples of run 2 and later; no sample is left out"},
    {"quantiles",
     "linear interpolation between the samples around the place (count - 1) * fraction: type 7 of "
     "Hyndman and Fan"},
    {"spread", "upperQuartile - lowerQuartile"},
    {"relativeSpread", "spread / median; 0 if the median is 0"},
    {"fences", "1.5 * spread below lowerQuartile and above upperQuartile"},
    {"outliers", "samples beyond the fences"},
};

constexpr Verdict kVerdicts[] = {
    Verdict::kComplete, Verdict::kFailedTests,  Verdict::kUsageError,  Verdict::kCrashed,
    Verdict::kHung,     Verdict::kNeverStarted, Verdict::kInterrupted,
};

constexpr Usability kUsabilities[] = {Usability::kHardware, Usability::kSoftware,
                                      Usability::kBroken, Usability::kAbsent, Usability::kUnknown};

constexpr SeriesEnd kEnds[] = {SeriesEnd::kDone, SeriesEnd::kInterrupted, SeriesEnd::kGivenUp,
                               SeriesEnd::kFull};

Json MakeTextOrNull(const std::string& text)
{
    return text.empty() ? Json() : Json(EncodeBytes(text));
}

Json MakeSample(const SeriesSample& sample)
{
    if (sample.IsKnown())
        return {{"run", sample.fRun}, {"known", true}, {"number", sample.fValue}};
    return {{"run", sample.fRun},
            {"known", false},
            {"value", MakeTextOrNull(sample.fText)},
            {"reason", EncodeBytes(sample.fReason)}};
}

Json MakeStatistics(const SeriesStatistics& statistics)
{
    if (!statistics.fSummary)
        return {{"known", false}, {"reason", "no run after the first has a known sample"}};
    const Summary& summary = *statistics.fSummary;
    Json outliers = Json::array();
    for (const SeriesSample& sample : statistics.fOutliers)
        outliers.push_back({{"run", sample.fRun}, {"number", sample.fValue}});
    return {
        {"known", true},
        {"count", statistics.fLater.size()},
        {"minimum", summary.fMinimum},
        {"lowerQuartile", summary.fLowerQuartile},
        {"median", summary.fMedian},
        {"upperQuartile", summary.fUpperQuartile},
        {"maximum", summary.fMaximum},
        {"spread", summary.GetSpread()},
        {"relativeSpread", summary.GetRelativeSpread()},
        {"lowerFence", summary.fLowerFence},
        {"upperFence", summary.fUpperFence},
        {"outliers", std::move(outliers)},
    };
}

void WriteMeasurement(JsonWriter& json, const Measurement& measurement)
{
    const SeriesStatistics statistics = GetStatistics(measurement);
    json.Open('{');
    json.Write("key", measurement.GetKeyName());
    json.Write("device", MakeTextOrNull(measurement.fTag));
    json.Write("name", MakeTextOrNull(measurement.fName));
    json.Write("unit",
               measurement.fKey != nullptr ? GetExplanation(*measurement.fKey).fUnit : "seconds");
    json.Write("first", statistics.fFirst ? Json(*statistics.fFirst) : Json());
    json.Write("statistics", MakeStatistics(statistics));
    json.Open('[', "samples");
    for (const SeriesSample& sample : measurement.fSamples)
        json.Write(MakeSample(sample));
    json.Close(']');
    json.Close('}');
}

Json MakeFinding(const SeriesFinding& finding)
{
    return {{"code", finding.fCode},
            {"device", MakeTextOrNull(finding.fTag)},
            {"text", EncodeBytes(finding.fText)},
            {"count", finding.fCount},
            {"runs", finding.fRuns}};
}

// Reads members of the series and of what is in it.
class Reader {
public:
    Reader(const Json& json, std::string where) : fJson(json), fWhere(std::move(where))
    {
        if (!json.is_object())
            throw std::runtime_error(fWhere + " is not an object");
    }

    std::size_t ReadCount(const char* name) const
    {
        return GetMember(fJson, fWhere, name, &Json::is_number_unsigned, "a count")
            .get<std::size_t>();
    }

    // Reads a number; 0 for null.
    double ReadNumberOrNull(const char* name) const { return IsNull(name) ? 0 : ReadNumber(name); }

    double ReadNumber(const char* name) const
    {
        return GetMember(fJson, fWhere, name, &Json::is_number, "a number").get<double>();
    }

    bool ReadFlag(const char* name) const
    {
        return GetMember(fJson, fWhere, name, &Json::is_boolean, "a bool").get<bool>();
    }

    std::string ReadText(const char* name) const
    {
        return DecodeBytes(GetString(fJson, fWhere, name));
    }

    std::string ReadTextOrNull(const char* name) const
    {
        return IsNull(name) ? std::string() : ReadText(name);
    }

    // Reads a name as `getName` returns it for one of the values.
    template <typename Values, typename GetName>
    auto ReadName(const char* name, const Values& values, GetName getName) const
    {
        const std::string text = ReadText(name);
        for (const auto value : values)
            if (text == getName(value))
                return value;
        throw std::runtime_error(
            fmt::format("{}: \"{}\" is \"{}\", which is none", fWhere, name, ShowBytes(text)));
    }

    Reader GetObject(const char* name) const
    {
        return {GetMember(fJson, fWhere, name, &Json::is_object, "an object"), fWhere + "." + name};
    }

    // Calls `take` with a reader of each element, which must be an object.
    template <typename Take>
    void ForEach(const char* name, Take take) const
    {
        std::size_t index = 0;
        for (const Json& element : GetMember(fJson, fWhere, name, &Json::is_array, "an array"))
            take(Reader(element, fmt::format("{}.{}[{}]", fWhere, name, index++)));
    }

    std::vector<std::size_t> ReadCounts(const char* name) const
    {
        std::vector<std::size_t> counts;
        for (const Json& element : GetMember(fJson, fWhere, name, &Json::is_array, "an array")) {
            if (!element.is_number_unsigned())
                throw std::runtime_error(
                    fmt::format("{}: \"{}\" has an element that is no count", fWhere, name));
            counts.push_back(element.get<std::size_t>());
        }
        return counts;
    }

    [[noreturn]] void Fail(const char* what) const { throw std::runtime_error(fWhere + what); }

private:
    bool IsNull(const char* name) const
    {
        const auto member = fJson.find(name);
        return member != fJson.end() && member->is_null();
    }

    const Json& fJson;
    const std::string fWhere;
};

SeriesSample ReadSample(const Reader& reader)
{
    SeriesSample sample;
    sample.fRun = reader.ReadCount("run");
    if (reader.ReadFlag("known")) {
        sample.fValue = reader.ReadNumber("number");
        return sample;
    }
    sample.fText = reader.ReadTextOrNull("value");
    sample.fReason = reader.ReadText("reason");
    if (sample.fReason.empty())
        sample.fReason = "no reason is given";
    return sample;
}

Measurement ReadMeasurement(const Reader& reader)
{
    Measurement measurement;
    measurement.fTag = reader.ReadTextOrNull("device");
    measurement.fName = reader.ReadTextOrNull("name");
    const std::string key = reader.ReadText("key");
    if (key != measurement.GetKeyName()) {
        measurement.fKey = FindKnownKey(DeviceKind::kOpenCL, key);
        if (measurement.fKey == nullptr || measurement.fKey->fMatch != Match::kNumber)
            reader.Fail(": \"key\" is no measurement");
    }
    reader.ForEach("samples", [&](const Reader& sample) {
        measurement.fSamples.push_back(ReadSample(sample));
    });
    return measurement;
}

SeriesFinding ReadFinding(const Reader& reader)
{
    return {reader.ReadText("code"), reader.ReadTextOrNull("device"),
            ShowBytes(reader.ReadText("text")), reader.ReadCount("count"),
            reader.ReadCounts("runs")};
}

} // namespace

void WriteSeries(JsonWriter& json, const Series& series)
{
    json.Open('{', "series");
    json.Write("repeat", series.fPlan.fRuns > 0 ? Json(series.fPlan.fRuns) : Json());
    json.Write("forSeconds", series.fPlan.fSeconds > 0 ? Json(series.fPlan.fSeconds) : Json());
    json.Write("end", GetSeriesEndName(series.fEnd));
    json.Write("runs", series.fRuns);
    json.Write("shown", series.fShown);
    json.Write("seconds", series.fSeconds);
    Json verdicts = Json::array();
    for (const VerdictCount& count : series.fVerdicts)
        verdicts.push_back({{"verdict", GetVerdictName(count.fVerdict)}, {"runs", count.fRuns}});
    json.Write("verdicts", verdicts);
    json.Write("usable", Json{{"opengl", GetUsabilityName(series.fOpenGL)},
                              {"opencl", GetUsabilityName(series.fOpenCL)}});
    Json findings = Json::array();
    for (const SeriesFinding& finding : series.fFindings)
        findings.push_back(MakeFinding(finding));
    json.Write("findings", findings);
    Json definitions = Json::object();
    for (const auto& [name, text] : kDefinitions)
        definitions[name] = text;
    json.Write("definitions", definitions);
    json.Open('[', "measurements");
    for (const Measurement& measurement : series.fMeasurements)
        WriteMeasurement(json, measurement);
    json.Close(']');
    json.Close('}');
}

Series ReadSeries(const Json& json, const std::string& where)
{
    const Reader reader(json, where);
    Series series;
    series.fPlan.fRuns = static_cast<std::size_t>(reader.ReadNumberOrNull("repeat"));
    series.fPlan.fSeconds = reader.ReadNumberOrNull("forSeconds");
    series.fEnd = reader.ReadName("end", kEnds, GetSeriesEndName);
    series.fRuns = reader.ReadCount("runs");
    series.fShown = reader.ReadCount("shown");
    series.fSeconds = reader.ReadNumber("seconds");
    reader.ForEach("verdicts", [&](const Reader& count) {
        series.fVerdicts.push_back(
            {count.ReadName("verdict", kVerdicts, GetVerdictName), count.ReadCount("runs")});
    });
    const Reader usable = reader.GetObject("usable");
    series.fOpenGL = usable.ReadName("opengl", kUsabilities, GetUsabilityName);
    series.fOpenCL = usable.ReadName("opencl", kUsabilities, GetUsabilityName);
    reader.ForEach("findings", [&](const Reader& finding) {
        series.fFindings.push_back(ReadFinding(finding));
    });
    reader.ForEach("measurements", [&](const Reader& measurement) {
        series.fMeasurements.push_back(ReadMeasurement(measurement));
    });
    return series;
}

} // namespace assay_host

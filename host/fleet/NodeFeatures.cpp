#include "fleet/NodeFeatures.h"

#include <algorithm>
#include <string>
#include <string_view>

#include <fmt/format.h>

#include "fleet/DeviceFacts.h"
#include "report/Answers.h"
#include "report/Usable.h"

namespace assay_host {

namespace {

constexpr DeviceKind kKinds[] = {DeviceKind::kOpenGL, DeviceKind::kOpenCL};
constexpr std::string_view kNamespace = "feature.node.kubernetes.io/";
constexpr std::size_t kMaxValueBytes = 63;
// For the line that counts what is left out.
constexpr std::size_t kLastLineBytes = 80;

bool IsLetterOrDigit(char byte)
{
    return (byte >= 'a' && byte <= 'z') || (byte >= 'A' && byte <= 'Z') ||
           (byte >= '0' && byte <= '9');
}

struct ValueText {
    std::string operator()(const std::string& text) const { return text; }
    std::string operator()(double number) const { return MakeNumberText(number); }
    std::string operator()(bool flag) const { return flag ? "true" : "false"; }
};

class FeatureFile {
public:
    explicit FeatureFile(std::ostream& out) : fOut(out) {}

    void AddLabel(const std::string& name, const std::string& text)
    {
        const std::string value = MakeLabelValue(text);
        if (!value.empty())
            Add(fmt::format("{}assay.{}={}\n", kNamespace, name, value));
    }

    // Adds a feature for rules only.
    void AddFeature(const std::string& name, const std::string& value)
    {
        Add(fmt::format("# +no-label\n{}assay.{}={}\n", kNamespace, name, value));
    }

    void Finish()
    {
        if (fLeftOut > 0)
            fOut << fmt::format("# left out beyond {} bytes: {}\n", kMaxFeatureFileBytes, fLeftOut);
    }

private:
    void Add(const std::string& lines)
    {
        if (fSize + lines.size() > kMaxFeatureFileBytes - kLastLineBytes) {
            ++fLeftOut;
            return;
        }
        fSize += lines.size();
        fOut << lines;
    }

    std::ostream& fOut;
    std::size_t fSize = 0;
    std::size_t fLeftOut = 0;
};

// The labels of an interface: those of a device are of the one that decided whether it can be used.
void AddLabels(FeatureFile& file, DeviceKind kind, const Answers& answers,
               const RunOutcome& outcome)
{
    const std::string api = GetApiName(kind);
    const Usable usable = JudgeUsable(kind, answers, outcome);
    file.AddLabel(api + ".usable", GetUsabilityName(usable.fUsability));
    if (const auto count = GetDeviceCount(kind, answers))
        file.AddLabel(api + ".devices", fmt::format("{}", *count));
    for (const DeviceAnswers& device : answers.fDevices) {
        if (device.fTag != usable.fTag || device.fKind != kind)
            continue;
        for (const DeviceFact& fact : GetDeviceFacts(device))
            if (fact.fKey->fIsStable)
                file.AddLabel(api + "." + fact.fKey->fName, std::visit(ValueText(), fact.fValue));
    }
}

} // namespace

std::string MakeLabelValue(std::string_view text)
{
    std::string value;
    for (const char byte : text) {
        const bool isKept = IsLetterOrDigit(byte) || byte == '-' || byte == '_' || byte == '.';
        if (IsLetterOrDigit(byte) || (isKept && !value.empty()))
            value += byte;
        else if (!value.empty() && value.back() != '-')
            value += '-';
    }
    value.resize(std::min(value.size(), kMaxValueBytes));
    while (!value.empty() && !IsLetterOrDigit(value.back()))
        value.pop_back();
    return value;
}

void WriteNodeFeatures(std::ostream& out, const Report& report, const RunOutcome& outcome)
{
    const Answers answers = GetAnswers(report);
    FeatureFile file(out);
    file.AddLabel("verdict", GetVerdictName(outcome.fVerdict));
    for (const DeviceKind kind : kKinds)
        AddLabels(file, kind, answers, outcome);
    for (const DeviceAnswers& device : answers.fDevices)
        for (const DeviceFact& fact : GetDeviceFacts(device))
            file.AddFeature(
                fmt::format("{}.{}.{}", GetApiName(device.fKind), device.fIndex, fact.fKey->fName),
                std::visit(ValueText(), fact.fValue));
    file.Finish();
}

} // namespace assay_host

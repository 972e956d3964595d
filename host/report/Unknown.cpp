#include "report/Unknown.h"

#include "report/LineForm.h"
#include "report/Numbers.h"

namespace assay_host {

namespace {

// No device is as fast: a larger measurement means that its clock is wrong.
constexpr double kMaxBytesPerSecond = 1e13;
constexpr double kMaxScore = 1e8;

Unknown JudgeMeasurement(const std::string& text, double max)
{
    const auto value = ReadDouble(text);
    if (value && *value == 0)
        return Unknown::kNoTime;
    return value && *value > 0 && *value <= max ? Unknown::kNot : Unknown::kImplausible;
}

Unknown JudgeForm(const KnownKey& key, const ReportLine& line, bool hasAdapter)
{
    const bool isZero = ReadUnsigned(line.fValue) == 0U;
    switch (key.fForm) {
    case ValueForm::kText:
    case ValueForm::kDate:
        return line.fQuoted && line.fValue == "?"    ? Unknown::kNotListed
               : line.fQuoted && line.fValue.empty() ? Unknown::kEmpty
                                                     : Unknown::kNot;
    case ValueForm::kAdapter:
        return line.fQuoted && line.fValue.empty() ? Unknown::kNoAdapter : Unknown::kNot;
    case ValueForm::kMebibytes:
        return isZero ? Unknown::kNoFigure : Unknown::kNot;
    case ValueForm::kId:
        if (!isZero)
            return Unknown::kNot;
        return key.fKind == DeviceKind::kOpenGL ? Unknown::kNoAdapter : Unknown::kNoFigure;
    case ValueForm::kFlag:
        return key.fNeedsAdapter && !hasAdapter ? Unknown::kNoAdapter : Unknown::kNot;
    case ValueForm::kBytesPerSecond:
        return JudgeMeasurement(line.fValue, kMaxBytesPerSecond);
    case ValueForm::kScore:
        return JudgeMeasurement(line.fValue, kMaxScore);
    case ValueForm::kCount:
    case ValueForm::kTexels:
        break;
    }
    return Unknown::kNot;
}

} // namespace

const char* GetUnknownText(Unknown unknown)
{
    switch (unknown) {
    case Unknown::kNot:
        break;
    case Unknown::kCut:
        return "only the beginning of the line came";
    case Unknown::kEmpty:
        return "the driver returned an empty text";
    case Unknown::kNoAdapter:
        return "no adapter of the system matches the device";
    case Unknown::kNotListed:
        return "the system's adapter lists do not have it";
    case Unknown::kNoFigure:
        return "no source has the value";
    case Unknown::kNoTime:
        return "the device's clock reported no elapsed time";
    case Unknown::kImplausible:
        return "the device's clock is unreliable";
    }
    return "";
}

Unknown JudgeUnknown(const ReportLine& line, const KnownKey* known, bool hasAdapter)
{
    if (!IsWholeValue(line))
        return Unknown::kCut;
    return known ? JudgeForm(*known, line, hasAdapter) : Unknown::kNot;
}

} // namespace assay_host

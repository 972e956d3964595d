#include "supervise/StepRules.h"

#include <algorithm>
#include <iterator>
#include <regex>
#include <set>
#include <stdexcept>

#include <fmt/format.h>

#include "report/Bytes.h"
#include "report/Numbers.h"
#include "report/RunLog.h"
#include "supervise/Judge.h"

namespace assay_host {

namespace {

constexpr int kFailedStatus = 2;

constexpr char kCrashText[] = "exception: programmed failure";
constexpr char kThrowText[] = "exception: Programmed throw";

// The messages that enumerating the OpenGL devices may print.
const std::set<std::string>& GetEnumerationTexts()
{
    static const std::set<std::string> texts = {
        "ContextOffscreen exception caught and ignored.",
        "DoGetGPUs fails with exception",
    };
    return texts;
}

// Returns the lines of each failure, in order. A failed query of a device prints its text twice,
// the second time as an exception.
std::vector<std::vector<std::string>> ListFailures(const std::vector<std::string>& errors)
{
    std::vector<std::vector<std::string>> result;
    for (std::size_t index = 0; index < errors.size(); ++index) {
        if (!IsFailureLine(errors[index]))
            continue;
        result.emplace_back();
        if (index > 0 && errors[index] == "exception: " + errors[index - 1])
            result.back().push_back(errors[index - 1]);
        result.back().push_back(errors[index]);
    }
    return result;
}

std::vector<std::string> ListEnumerationTexts(const std::vector<std::string>& errors)
{
    std::vector<std::string> result;
    std::copy_if(errors.begin(), errors.end(), std::back_inserter(result),
                 [](const std::string& line) { return GetEnumerationTexts().count(line) != 0; });
    return result;
}

// Returns the child's own messages, without those of drivers.
std::vector<std::string> ListOwnTexts(const std::vector<std::string>& errors)
{
    std::vector<std::string> result;
    for (std::size_t index = 0; index < errors.size(); ++index) {
        const bool announces =
            index + 1 < errors.size() && errors[index + 1] == "exception: " + errors[index];
        if (announces || IsFailureLine(errors[index]) ||
            GetEnumerationTexts().count(errors[index]) != 0)
            result.push_back(errors[index]);
    }
    return result;
}

std::vector<std::string> ListLines(const Report& report)
{
    std::vector<std::string> result;
    for (const ReportLine& line : report.GetLines())
        if (line.fKind != LineKind::kComment)
            result.push_back(line.fText);
    return result;
}

const ReportLine& Require(const Report& report, const std::string& key)
{
    const ReportLine* const line = report.Find(key);
    if (line == nullptr)
        throw std::runtime_error("the report has no line for " + key);
    return *line;
}

std::vector<std::string> ListTags(const Report& report, DeviceKind kind)
{
    const std::string& value = Require(report, GetCountKey(kind)).fValue;
    const std::uint64_t count = ReadUnsigned(value).value_or(0);
    if (count > kMaxDevices)
        throw std::runtime_error(fmt::format("the report counts {} devices", count));
    std::vector<std::string> tags;
    for (std::size_t index = 0; index < count; ++index)
        tags.push_back(MakeTag(kind, index));
    return tags;
}

// Returns the index of the device's test that failed, judged by its last line; the number of tests
// if none did. A test that may print no line is taken for passed.
std::size_t FindFailingTest(const SequenceReader& sequence, const DeviceTag& tag)
{
    const Table<KnownKey> keys = GetDeviceKeys(tag.fKind);
    const std::size_t next = sequence.CountAnswered(tag);
    return next < keys.size() && keys[next].MayBeSilent() ? next + 1 : next;
}

const std::regex& GetShape(Match match)
{
    static const std::regex stamp("\"\\d{4}-\\d\\d-\\d\\d_\\d\\d:\\d\\d:\\d\\d\"");
    static const std::regex integer("\\d+");
    static const std::regex number("\\d+(\\.\\d+)?(e[+-]\\d+)?");
    switch (match) {
    case Match::kStamp:
        return stamp;
    case Match::kInteger:
        return integer;
    default:
        return number;
    }
}

// Shows two lists of lines from a few lines before the first difference on.
std::string ShowLists(const std::string& title, const std::vector<std::string>& expected,
                      const std::vector<std::string>& found, std::size_t first)
{
    constexpr std::size_t kMaxBefore = 2;
    constexpr std::size_t kMaxAfter = 4;
    std::string text = title + "\n";
    for (std::size_t index = first - std::min(first, kMaxBefore); index < first; ++index)
        text += fmt::format("      {}\n", ShowBytes(found[index]));
    const auto show = [&](const char* mark, const std::vector<std::string>& lines) {
        const std::size_t end = std::min(lines.size(), first + kMaxAfter);
        for (std::size_t index = first; index < end; ++index)
            text += fmt::format("    {} {}\n", mark, ShowBytes(lines[index]));
        if (lines.size() > end)
            text += fmt::format("    {} ({} more)\n", mark, lines.size() - end);
        else
            text += fmt::format("    {} (the end)\n", mark);
    };
    show("-", expected);
    show("+", found);
    return text;
}

} // namespace

const char* GetOptionName(StepFailure failure)
{
    return failure == StepFailure::kCrash ? "crashAfter" : "throwAfter";
}

bool ExpectedLine::Matches(const std::string& text) const
{
    if (fMatch == Match::kExact)
        return text == fText;
    const std::size_t key = fText.find('=') + 1;
    // Longer than any time and any number. A longer text would exhaust the stack of std::regex.
    constexpr std::size_t kMaxValueBytes = 64;
    return text.size() - std::min(text.size(), key) <= kMaxValueBytes &&
           text.compare(0, key, fText, 0, key) == 0 &&
           std::regex_match(text.substr(key), GetShape(fMatch));
}

StepRules::StepRules(const Report& report, const RunOutcome& outcome)
{
    if (!report.IsWhole() || !outcome.fExitStatus)
        throw std::runtime_error("the undisturbed run did not complete: " + outcome.fReason);

    // Options such as -stdout= print before the first line of the report.
    Operation start;
    for (const std::string& line : ListLines(report)) {
        if (line == Require(report, "Tester").fText)
            break;
        start.fLines.push_back({line, Match::kExact});
    }
    fOperations.push_back(start);
    SequenceReader sequence;
    for (const ReportLine& line : report.GetLines())
        sequence.Add(line);
    for (const KnownKey* const key : GetReportKeys()) {
        if (key->fKey == GetCountKey(DeviceKind::kOpenCL)) {
            fHasOpenCL = report.Find(key->fKey) != nullptr;
            if (!fHasOpenCL)
                continue;
        }
        AddReportKey(report, *key);
        if (key->fKey == GetCountKey(DeviceKind::kOpenGL)) {
            fOperations.back().fErrors = ListEnumerationTexts(outcome.fErrorLines);
            fGLCount = AddDevices(report, sequence, DeviceKind::kOpenGL);
        } else if (key->fKey == GetCountKey(DeviceKind::kOpenCL)) {
            fCLCount = AddDevices(report, sequence, DeviceKind::kOpenCL);
        }
    }
    fOperations.push_back(Operation());

    AddFailureTexts(outcome);
    fStatus = *outcome.fExitStatus;
    fStepCount = static_cast<std::size_t>(
        std::count_if(fOperations.begin(), fOperations.end(), [](const Operation& operation) {
            return operation.fTakesStep && !operation.fFails;
        }));
    const std::string difference = ShowDifference(Predict(StepFailure::kNone, 0), report, outcome);
    if (!difference.empty())
        throw std::runtime_error("the undisturbed run does not follow the rules:\n" + difference);
}

void StepRules::AddReportKey(const Report& report, const KnownKey& key)
{
    Operation operation;
    operation.fLines.push_back({Require(report, key.fKey).fText, key.fMatch});
    fOperations.push_back(operation);
}

std::size_t StepRules::AddDevices(const Report& report, const SequenceReader& sequence,
                                  DeviceKind kind)
{
    const Table<KnownKey> keys = GetDeviceKeys(kind);
    const std::vector<std::string> tags = ListTags(report, kind);
    std::vector<std::size_t> failing; // the test that failed, by device
    failing.reserve(tags.size());
    for (std::size_t device = 0; device < tags.size(); ++device)
        failing.push_back(FindFailingTest(sequence, {kind, device}));

    for (std::size_t index = 0; index < keys.size(); ++index) {
        const KnownKey& known = keys[index];
        for (std::size_t device = 0; device < tags.size(); ++device) {
            if (index > failing[device])
                continue;
            Operation operation;
            operation.fTag = tags[device];
            operation.fTakesStep = known.fTakesStep;
            operation.fFails = index == failing[device];
            if (!operation.fFails || known.fTagsFirst)
                for (const std::string& line : known.fTagLines)
                    operation.fLines.push_back({line, Match::kExact});
            const std::string key = known.GetKey(tags[device]);
            if (!operation.fFails && (!known.MayBeSilent() || report.Find(key) != nullptr))
                operation.fLines.push_back({Require(report, key).fText, known.fMatch});
            fOperations.push_back(operation);
        }
    }
    return tags.size();
}

void StepRules::AddFailureTexts(const RunOutcome& outcome)
{
    const std::vector<std::vector<std::string>> failures = ListFailures(outcome.fErrorLines);
    auto failure = failures.begin();
    for (Operation& operation : fOperations) {
        if (!operation.fFails)
            continue;
        if (failure == failures.end())
            throw std::runtime_error(operation.fTag +
                                     " has lines missing, and standard error names no failure");
        operation.fErrors = *failure++;
    }
    if (failure != failures.end())
        throw std::runtime_error("standard error names a failure that no device had: " +
                                 failure->back());
}

Prediction StepRules::Predict(StepFailure failure, std::size_t step) const
{
    Prediction result;
    std::set<std::string> lost;
    std::size_t steps = 0;
    for (const Operation& operation : fOperations) {
        if (lost.count(operation.fTag) != 0)
            continue;
        result.fErrors.insert(result.fErrors.end(), operation.fErrors.begin(),
                              operation.fErrors.end());
        result.fLines.insert(result.fLines.end(), operation.fLines.begin(), operation.fLines.end());
        if (operation.fFails) {
            lost.insert(operation.fTag);
            continue;
        }
        if (!operation.fTakesStep)
            continue;
        const std::size_t number = steps++;
        const bool crashes = failure == StepFailure::kCrash && number >= step;
        const bool throws = failure == StepFailure::kThrow && number == step;
        if (!crashes && !throws)
            continue;
        result.fErrors.emplace_back(crashes ? kCrashText : kThrowText);
        if (operation.fTag.empty()) {
            result.fStatus = kFailedStatus;
            return result;
        }
        lost.insert(operation.fTag);
    }
    result.fStatus = lost.empty() ? fStatus : kFailedStatus;
    return result;
}

std::string ShowDifference(const Prediction& expected, const Report& report,
                           const RunOutcome& outcome)
{
    std::string text;
    const std::vector<std::string> lines = ListLines(report);
    const auto [line, unused] = std::mismatch(
        expected.fLines.begin(), expected.fLines.end(), lines.begin(), lines.end(),
        [](const ExpectedLine& wanted, const std::string& found) { return wanted.Matches(found); });
    const auto first = static_cast<std::size_t>(line - expected.fLines.begin());
    if (first < expected.fLines.size() || first < lines.size()) {
        std::vector<std::string> wanted;
        for (const ExpectedLine& each : expected.fLines)
            wanted.push_back(each.fText);
        text += ShowLists("  report (- predicted, + found):", wanted, lines, first);
    }
    const std::vector<std::string> errors = ListOwnTexts(outcome.fErrorLines);
    if (errors != expected.fErrors) {
        const auto differing = std::mismatch(expected.fErrors.begin(), expected.fErrors.end(),
                                             errors.begin(), errors.end());
        text += ShowLists("  standard error (- predicted, + found):", expected.fErrors, errors,
                          static_cast<std::size_t>(differing.first - expected.fErrors.begin()));
    }
    if (outcome.fExitStatus != expected.fStatus) {
        text += fmt::format("  exit status: predicted {}, found {}\n", expected.fStatus,
                            outcome.fExitStatus ? std::to_string(*outcome.fExitStatus)
                                                : "none: " + ShowBytes(outcome.fReason));
    }
    return text;
}

} // namespace assay_host

#include "memory/StateForms.h"

#include <fmt/format.h>

#include "facts/TimeText.h"
#include "memory/Policy.h"
#include "report/Bytes.h"

namespace assay_host {

namespace {

constexpr std::size_t kShortName = 8;

const char* GetAnswer(DeviceKind kind, const Knowledge& knowledge, std::int64_t now)
{
    return GetUsabilityName(Judge(kind, knowledge.fAttempts, now, Policy()).fFinding.fUsability);
}

std::string GetAdapterText(const AdapterIdentity& adapter)
{
    std::string text = ShowBytes(adapter.fSlot);
    if (adapter.fVendor != 0)
        text += fmt::format(" {:04x}:{:04x}", adapter.fVendor, adapter.fDevice);
    if (!adapter.fDriver.empty())
        text += " " + ShowBytes(adapter.fDriver);
    if (!adapter.fDriverVersion.empty())
        text += " " + ShowBytes(adapter.fDriverVersion);
    return text;
}

void AddFinding(std::string& text, const char* name, const Finding& finding)
{
    text += fmt::format("    {}: {}, {}\n", name, GetUsabilityName(finding.fUsability),
                        ShowBytes(finding.fText));
}

void AddAttempt(std::string& text, const Attempt& attempt)
{
    text +=
        fmt::format("  {} {}\n", MakeUtcText(attempt.fStarted), GetAttemptEndName(attempt.fEnd));
    if (attempt.fEnd == AttemptEnd::kOpen) {
        text += fmt::format("    process {} of boot {}\n", attempt.fHost.fProcess,
                            ShowBytes(attempt.fHost.fBoot));
        return;
    }
    text += "    " + ShowBytes(attempt.fReason) + "\n";
    if (!attempt.fLastLine.empty())
        text += "    last line: " + ShowBytes(attempt.fLastLine) + "\n";
    AddFinding(text, "OpenGL", attempt.fOpenGL);
    AddFinding(text, "OpenCL", attempt.fOpenCL);
}

void AddChoice(std::string& text, const char* name, const std::optional<InterfaceChoice>& chosen)
{
    if (chosen)
        text += fmt::format("choice: {}={} since {}\n", name, GetUsabilityName(chosen->fUsability),
                            MakeUtcText(chosen->fTime));
}

} // namespace

std::string MakeStateList(const std::vector<StoredKnowledge>& entries, const Choice& choice,
                          std::int64_t now)
{
    std::string text = fmt::format("{:<10}{:<22}{:<10}{:<10}{:<10}{}\n", "entry", "changed",
                                   "attempts", "OpenGL", "OpenCL", "adapters");
    for (const StoredKnowledge& entry : entries) {
        text += fmt::format("{:<10}{:<22}", entry.fName.substr(0, kShortName),
                            MakeUtcText(entry.fTime));
        if (!entry.fKnowledge) {
            text += "ignored: " + ShowBytes(entry.fProblem) + "\n";
            continue;
        }
        const Knowledge& knowledge = *entry.fKnowledge;
        text += fmt::format("{:<10}{:<10}{:<10}", knowledge.fCount,
                            GetAnswer(DeviceKind::kOpenGL, knowledge, now),
                            GetAnswer(DeviceKind::kOpenCL, knowledge, now));
        std::string adapters;
        for (const AdapterIdentity& adapter : knowledge.fIdentity.fAdapters)
            adapters += (adapters.empty() ? "" : ", ") + GetAdapterText(adapter);
        text += (adapters.empty() ? "none" : adapters) + "\n";
    }
    AddChoice(text, "opengl", choice.fOpenGL);
    AddChoice(text, "opencl", choice.fOpenCL);
    return text;
}

std::string MakeStateText(const StoredKnowledge& entry)
{
    std::string text = "entry " + entry.fName + "\n";
    if (!entry.fKnowledge)
        return text + "  ignored: " + ShowBytes(entry.fProblem) + "\n";
    const Identity& identity = entry.fKnowledge->fIdentity;
    text += "  system " + ShowBytes(identity.fSystem) + "\n";
    text += "  assay " + ShowBytes(identity.fAssayVersion) + "\n";
    for (const AdapterIdentity& adapter : identity.fAdapters)
        text += "  adapter " + GetAdapterText(adapter) + "\n";
    for (const std::string& variable : identity.fVariables)
        text += "  variable " + ShowBytes(variable) + "\n";
    for (const DriverFile& file : identity.fFiles)
        text += fmt::format("  {} file {}, {} bytes, {}{}\n", GetKindName(file.fInterface),
                            ShowBytes(file.fPath), file.fSize, MakeUtcText(file.fTime / 1000000000),
                            file.fBuildId.empty() ? "" : ", build " + ShowBytes(file.fBuildId));
    text += fmt::format("  attempts: {}, the last {}:\n", entry.fKnowledge->fCount,
                        entry.fKnowledge->fAttempts.size());
    for (const Attempt& attempt : entry.fKnowledge->fAttempts)
        AddAttempt(text, attempt);
    return text;
}

} // namespace assay_host

#include "bugreport/Mask.h"

#include <algorithm>

#include "report/LineForm.h"

namespace assay_host {

namespace {

char Fold(char character)
{
    if (character >= 'A' && character <= 'Z')
        return static_cast<char>(character - 'A' + 'a');
    return character == '\\' ? '/' : character;
}

bool IsWordCharacter(char character)
{
    const char folded = Fold(character);
    return (folded >= 'a' && folded <= 'z') || (character >= '0' && character <= '9') ||
           character == '_';
}

std::string FoldAll(std::string text)
{
    std::transform(text.begin(), text.end(), text.begin(), Fold);
    return text;
}

bool NamesNobody(const std::string& folded)
{
    return folded.empty() || folded == "root" || folded == "localhost";
}

// "/home/alice/" is found in "/home/alice". Nothing is left of the root folder.
std::string TrimSlashes(std::string text)
{
    while (!text.empty() && (text.back() == '/' || text.back() == '\\'))
        text.pop_back();
    return text;
}

} // namespace

Mask::Mask(const std::vector<Secret>& secrets)
{
    for (const Secret& secret : secrets) {
        std::string folded = FoldAll(TrimSlashes(secret.fText));
        if (!NamesNobody(folded))
            fSecrets.push_back({std::move(folded), secret.fWord});
    }
    std::stable_sort(fSecrets.begin(), fSecrets.end(), [](const Secret& left, const Secret& right) {
        return left.fText.size() > right.fText.size();
    });
}

const Secret* Mask::FindAt(std::string_view text, std::size_t at) const
{
    const auto isSame = [](char left, char right) { return left == Fold(right); };
    for (const Secret& secret : fSecrets) {
        const std::string& hidden = secret.fText;
        const std::size_t end = at + hidden.size();
        if (end > text.size() ||
            !std::equal(hidden.begin(), hidden.end(),
                        text.begin() + static_cast<std::ptrdiff_t>(at), isSame))
            continue;
        const bool goesOnBefore =
            at > 0 && IsWordCharacter(hidden.front()) && IsWordCharacter(text[at - 1]);
        const bool goesOnAfter =
            end < text.size() && IsWordCharacter(hidden.back()) && IsWordCharacter(text[end]);
        if (!goesOnBefore && !goesOnAfter)
            return &secret;
    }
    return nullptr;
}

std::string Mask::Apply(std::string_view text) const
{
    std::string masked;
    for (std::size_t at = 0; at < text.size();) {
        const Secret* const found = FindAt(text, at);
        masked += found ? found->fWord : std::string(1, text[at]);
        at += found ? found->fText.size() : 1;
    }
    return masked;
}

void Mask::ApplyTo(std::string& text) const
{
    text = Apply(text);
}

void Mask::ApplyTo(Fact& fact) const
{
    ApplyTo(fact.fValue);
    ApplyTo(fact.fReason);
}

void Mask::ApplyTo(std::vector<std::string>& texts) const
{
    for (std::string& text : texts)
        ApplyTo(text);
}

void Mask::ApplyTo(Report& report) const
{
    Report masked;
    for (const ReportLine& line : report.GetLines())
        masked.Add(
            line.fKind == LineKind::kValue
                ? ReadLine(Apply(line.fText), line.fLineEnd, line.fCut)
                : ReportLine{
                      line.fKind, Apply(line.fText), line.fLineEnd, line.fCut, {}, {}, false});
    report = std::move(masked);
}

void Mask::ApplyTo(RunOutcome& outcome) const
{
    ApplyTo(outcome.fCommand);
    ApplyTo(outcome.fTermination);
    ApplyTo(outcome.fReason);
    ApplyTo(outcome.fLastReportLine);
    ApplyTo(outcome.fLastLogLine);
    ApplyTo(outcome.fErrorLines);
    for (Cause& cause : outcome.fCauses)
        ApplyTo(cause.fText);
    ApplyTo(outcome.fDrivers.fReason);
    for (LoadedFile& file : outcome.fDrivers.fFiles) {
        ApplyTo(file.fPath);
        ApplyTo(file.fVersion);
        ApplyTo(file.fBuildId);
    }
}

void Mask::ApplyTo(RunFacts& facts) const
{
    Environment& environment = facts.fEnvironment;
    for (Fact* const fact : {&facts.fChildVersion, &environment.fSystem, &environment.fBuild,
                             &environment.fKernel, &environment.fArchitecture, &environment.fHost})
        ApplyTo(*fact);
}

void Mask::ApplyTo(Identity& identity) const
{
    for (AdapterIdentity& adapter : identity.fAdapters)
        for (std::string* const text : {&adapter.fSlot, &adapter.fDriver, &adapter.fDriverVersion})
            ApplyTo(*text);
    for (DriverFile& file : identity.fFiles)
        ApplyTo(file.fPath);
    ApplyTo(identity.fVariables);
    ApplyTo(identity.fSystem);
    ApplyTo(identity.fAssayVersion);
}

} // namespace assay_host

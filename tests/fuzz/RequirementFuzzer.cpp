// Checks that any text is a requirement or an error that names it, and that any requirement can be
// held to a report.
#include <cstdint>
#include <sstream>
#include <stdexcept>
#include <string>

#include "Require.h"
#include "report/Report.h"
#include "report/ReportReader.h"
#include "requirements/RequirementCheck.h"
#include "requirements/RequirementFile.h"

namespace {

using namespace assay_host;

Report ReadReport()
{
    ReportReader reader;
    Report report;
    report.Add(reader.Feed("Tester=\"x\"\nNumGLGPUs=2\nglgpu[0].GLVersion=\"4.1\"\n"
                           "glgpu[0].GLMemoryMB=1024\nglgpu[1].GLVersion=\"?\"\nNumCLGPUs=1\n"
                           "clgpu[0].CLBandwidth=1e11\nassayEnd=\"y\"\n"));
    report.Add(reader.Finish());
    return report;
}

void CheckText(const std::string& text)
{
    static const Report report = ReadReport();
    static const Answers answers = GetAnswers(report);
    try {
        const Requirement requirement = ParseRequirement(text);
        Require(requirement.fText == text);
        const std::string unmet = FindUnmet(requirement, answers, RunOutcome());
        Require(unmet.find('\n') == std::string::npos);
    } catch (const std::runtime_error& failure) {
        const std::string what = failure.what();
        Require(what.size() > 2 && what.front() == '"' && what.find('\n') == std::string::npos);
    }
}

void CheckFile(const std::string& text)
{
    std::istringstream stream(text);
    try {
        Require(!ReadRequirements(stream).empty());
    } catch (const std::runtime_error& failure) {
        Require(*failure.what() != '\0');
    }
}

} // namespace

extern "C" int LLVMFuzzerTestOneInput(const std::uint8_t* data, std::size_t size);

extern "C" int LLVMFuzzerTestOneInput(const std::uint8_t* data, std::size_t size)
{
    const std::string text(data, data + size);
    CheckText(text);
    CheckFile(text);
    return 0;
}

#include <memory>
#include <ostream>
#include <stdexcept>

#include "app/Commands.h"
#include "app/Forms.h"
#include "output/Output.h"
#include "output/SinkBuffer.h"
#include "output/Terminal.h"
#include "report/Bytes.h"
#include "report/JsonDocument.h"
#include "report/ReportFile.h"

namespace assay_host {

int Show(const ShowChoice& choice)
{
    const StoredRun run = LoadRun(choice.fReport);
    if (choice.fFormat == Format::kJson && choice.fSchema != kFirstSchemaVersion &&
        run.fFacts.fEnvironment.fTime.empty())
        throw std::runtime_error(
            ShowBytes(choice.fReport) +
            ": it does not say when and where the run was; use --schema 1, or another format");
    const std::unique_ptr<Output> output =
        choice.fOutput.empty() ? OpenStandardOutput() : OpenFile(choice.fOutput);
    output->Open();
    SinkBuffer buffer([&output](std::string_view block) { output->Write(block); });
    std::ostream out(&buffer);
    out.exceptions(std::ios::badbit);
    const Form form = {choice.fFormat, choice.fSchema,
                       choice.fOutput.empty() ? GetOutputWidth() : kFileWidth};
    WriteForm(out, form, run);
    out.flush();
    output->Finish();
    return 0;
}

} // namespace assay_host

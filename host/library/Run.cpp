#include <memory>
#include <new>
#include <utility>

#include "facts/DescribeFiles.h"
#include "facts/Environment.h"
#include "facts/FileVersion.h"
#include "library/Options.h"
#include "library/Result.h"
#include "library/Session.h"
#include "library/Stop.h"
#include "library/Try.h"

namespace assay_host {

namespace {

std::unique_ptr<assay_host_result> Run(const assay_host_options& options, assay_host_stop* stop)
{
    const ChildOptions child = MakeChildOptions(options);
    RunFacts facts;
    facts.fHostVersion = assay_host_version();
    facts.fChildVersion = GetFileVersion(child.fProgram);
    facts.fEnvironment = GetEnvironment(options.fIdentify);
    SessionEnd end = RunSession(options, child, stop);
    DescribeFiles(end.fOutcome.fDrivers.fFiles);
    return std::make_unique<assay_host_result>(std::move(end.fReport), std::move(end.fOutcome),
                                               std::move(facts));
}

} // namespace

} // namespace assay_host

assay_host_stop* assay_host_stop_new()
{
    return new (std::nothrow) assay_host_stop;
}

void assay_host_stop_free(assay_host_stop* stop)
{
    delete stop;
}

assay_host_error assay_host_stop_raise(assay_host_stop* stop)
{
    if (stop == nullptr)
        return ASSAY_HOST_NULL_POINTER;
    return assay_host::Try([&] {
        stop->fRequest.Raise();
        return ASSAY_HOST_OK;
    });
}

assay_host_error assay_host_run(const assay_host_options* options, assay_host_stop* stop,
                                assay_host_result** result)
{
    if (result == nullptr)
        return ASSAY_HOST_NULL_POINTER;
    *result = nullptr;
    return assay_host::Try([&] {
        *result =
            assay_host::Run(options != nullptr ? *options : assay_host_options(), stop).release();
        return ASSAY_HOST_OK;
    });
}

void assay_host_result_free(assay_host_result* result)
{
    delete result;
}

#include "library/Options.h"

#include <algorithm>
#include <cmath>
#include <new>

#include "library/Try.h"

using assay_host::Try;

namespace {

constexpr std::uint64_t kMaxLimit = std::uint64_t{1} << 30;
constexpr std::uint64_t kMaxRetries = 1000;
constexpr double kMaxSeconds = 100.0 * 365 * assay_host::Policy::kDay;

template <typename Limit>
assay_host_error SetLimit(Limit& limit, std::uint64_t value)
{
    if (value == 0 || value > kMaxLimit)
        return ASSAY_HOST_BAD_VALUE;
    limit = static_cast<Limit>(value);
    return ASSAY_HOST_OK;
}

bool IsTime(double seconds)
{
    return std::isfinite(seconds) && seconds >= 0;
}

// Sets a time of the policy, which has whole seconds.
assay_host_error SetTime(assay_host_options* options, std::int64_t assay_host::Policy::*time,
                         double seconds)
{
    if (options == nullptr)
        return ASSAY_HOST_NULL_POINTER;
    if (!IsTime(seconds))
        return ASSAY_HOST_BAD_VALUE;
    options->fRequest.fPolicy.*time = static_cast<std::int64_t>(std::min(seconds, kMaxSeconds));
    return ASSAY_HOST_OK;
}

} // namespace

assay_host_options* assay_host_options_new()
{
    return new (std::nothrow) assay_host_options;
}

void assay_host_options_free(assay_host_options* options)
{
    delete options;
}

assay_host_error assay_host_options_set_program(assay_host_options* options, const char* path)
{
    if (options == nullptr || path == nullptr)
        return ASSAY_HOST_NULL_POINTER;
    if (*path == '\0')
        return ASSAY_HOST_BAD_TEXT;
    return Try([&] {
        options->fChild.fProgram = path;
        return ASSAY_HOST_OK;
    });
}

assay_host_error assay_host_options_add_argument(assay_host_options* options, const char* argument)
{
    if (options == nullptr || argument == nullptr)
        return ASSAY_HOST_NULL_POINTER;
    return Try([&] {
        options->fChild.fArgs.emplace_back(argument);
        return ASSAY_HOST_OK;
    });
}

assay_host_error assay_host_options_set_timeout(assay_host_options* options, double seconds)
{
    if (options == nullptr)
        return ASSAY_HOST_NULL_POINTER;
    if (!IsTime(seconds))
        return ASSAY_HOST_BAD_VALUE;
    options->fChild.fTimeoutSeconds = seconds;
    return ASSAY_HOST_OK;
}

assay_host_error assay_host_options_set_max_bytes(assay_host_options* options, uint64_t bytes)
{
    return options == nullptr ? ASSAY_HOST_NULL_POINTER
                              : SetLimit(options->fChild.fLimits.fMaxBytes, bytes);
}

assay_host_error assay_host_options_set_max_line_bytes(assay_host_options* options, uint64_t bytes)
{
    return options == nullptr ? ASSAY_HOST_NULL_POINTER
                              : SetLimit(options->fChild.fLimits.fMaxLineBytes, bytes);
}

assay_host_error assay_host_options_set_max_lines(assay_host_options* options, uint64_t lines)
{
    return options == nullptr ? ASSAY_HOST_NULL_POINTER
                              : SetLimit(options->fChild.fLimits.fMaxLines, lines);
}

assay_host_error assay_host_options_set_identify(assay_host_options* options, int identify)
{
    if (options == nullptr)
        return ASSAY_HOST_NULL_POINTER;
    options->fIdentify = identify != 0;
    return ASSAY_HOST_OK;
}

assay_host_error assay_host_options_on_line(assay_host_options* options,
                                            assay_host_line_callback callback, void* context)
{
    if (options == nullptr)
        return ASSAY_HOST_NULL_POINTER;
    options->fOnLine = callback;
    options->fLineContext = context;
    return ASSAY_HOST_OK;
}

assay_host_error assay_host_options_on_error_line(assay_host_options* options,
                                                  assay_host_line_callback callback, void* context)
{
    if (options == nullptr)
        return ASSAY_HOST_NULL_POINTER;
    options->fOnErrorLine = callback;
    options->fErrorLineContext = context;
    return ASSAY_HOST_OK;
}

assay_host_error assay_host_options_on_tick(assay_host_options* options,
                                            assay_host_tick_callback callback, void* context)
{
    if (options == nullptr)
        return ASSAY_HOST_NULL_POINTER;
    options->fOnTick = callback;
    options->fTickContext = context;
    return ASSAY_HOST_OK;
}

assay_host_error assay_host_options_set_need(assay_host_options* options, int opengl, int opencl)
{
    if (options == nullptr)
        return ASSAY_HOST_NULL_POINTER;
    if (opengl == 0 && opencl == 0)
        return ASSAY_HOST_BAD_VALUE;
    options->fRequest.fNeedsOpenGL = opengl != 0;
    options->fRequest.fNeedsOpenCL = opencl != 0;
    return ASSAY_HOST_OK;
}

assay_host_error assay_host_options_set_fresh(assay_host_options* options, int fresh)
{
    if (options == nullptr)
        return ASSAY_HOST_NULL_POINTER;
    options->fRequest.fFresh = fresh != 0;
    return ASSAY_HOST_OK;
}

assay_host_error assay_host_options_set_dry_run(assay_host_options* options, int dry_run)
{
    if (options == nullptr)
        return ASSAY_HOST_NULL_POINTER;
    options->fDryRun = dry_run != 0;
    return ASSAY_HOST_OK;
}

assay_host_error assay_host_options_set_wait(assay_host_options* options, double seconds)
{
    if (options == nullptr)
        return ASSAY_HOST_NULL_POINTER;
    if (!IsTime(seconds))
        return ASSAY_HOST_BAD_VALUE;
    options->fRequest.fWaitSeconds = std::min(seconds, kMaxSeconds);
    return ASSAY_HOST_OK;
}

assay_host_error assay_host_options_set_max_age(assay_host_options* options, double seconds)
{
    return SetTime(options, &assay_host::Policy::fMaxAge, seconds);
}

assay_host_error assay_host_options_set_pause(assay_host_options* options, double seconds)
{
    return SetTime(options, &assay_host::Policy::fFirstPause, seconds);
}

assay_host_error assay_host_options_set_forgive(assay_host_options* options, double seconds)
{
    return SetTime(options, &assay_host::Policy::fForgiven, seconds);
}

assay_host_error assay_host_options_set_retries(assay_host_options* options, uint64_t retries)
{
    if (options == nullptr)
        return ASSAY_HOST_NULL_POINTER;
    if (retries > kMaxRetries)
        return ASSAY_HOST_BAD_VALUE;
    options->fRequest.fPolicy.fRetries = static_cast<std::size_t>(retries);
    return ASSAY_HOST_OK;
}

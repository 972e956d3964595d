#include "library/Options.h"

#include <algorithm>
#include <cmath>
#include <new>

#include "library/Try.h"

using assay_host::Try;

namespace {

constexpr std::uint64_t kMaxLimit = std::uint64_t{1} << 30;
constexpr double kMaxCount = 1000;
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

// The policy has whole seconds.
assay_host_error SetTime(std::int64_t& time, double seconds)
{
    if (!IsTime(seconds))
        return ASSAY_HOST_BAD_VALUE;
    time = static_cast<std::int64_t>(std::min(seconds, kMaxSeconds));
    return ASSAY_HOST_OK;
}

template <typename Count>
assay_host_error SetCount(Count& count, double value, double min)
{
    if (!(value >= min && value <= kMaxCount) || value != std::floor(value))
        return ASSAY_HOST_BAD_VALUE;
    count = static_cast<Count>(value);
    return ASSAY_HOST_OK;
}

assay_host_error SetPolicy(assay_host::Policy& policy, assay_host_policy which, double value)
{
    switch (which) {
    case ASSAY_HOST_MAX_AGE:
        return SetTime(policy.fMaxAge, value);
    case ASSAY_HOST_KEEP_ABSENT:
        return SetTime(policy.fAbsentKept, value);
    case ASSAY_HOST_KEEP_UNKNOWN:
        return SetTime(policy.fUnknownKept, value);
    case ASSAY_HOST_PAUSE:
        return SetTime(policy.fFirstPause, value);
    case ASSAY_HOST_PAUSE_GROWTH:
        return SetCount(policy.fPauseGrowth, value, 1);
    case ASSAY_HOST_RETRIES:
        return SetCount(policy.fRetries, value, 0);
    case ASSAY_HOST_FORGIVE:
        return SetTime(policy.fForgiven, value);
    case ASSAY_HOST_FORGIVE_FREEZE:
        return SetTime(policy.fFreezeForgiven, value);
    case ASSAY_HOST_UNCLEAR:
        return SetCount(policy.fMaxUnclear, value, 1);
    case ASSAY_HOST_UNCLEAR_PAUSE:
        return SetTime(policy.fUnclearPause, value);
    }
    return ASSAY_HOST_BAD_VALUE;
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

assay_host_error assay_host_options_set_policy(assay_host_options* options, assay_host_policy which,
                                               double value)
{
    return options == nullptr ? ASSAY_HOST_NULL_POINTER
                              : SetPolicy(options->fRequest.fPolicy, which, value);
}

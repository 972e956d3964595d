#include "library/Options.h"

#include <cmath>
#include <new>

#include "library/Try.h"

using assay_host::Try;

namespace {

constexpr std::uint64_t kMaxLimit = std::uint64_t{1} << 30;

template <typename Limit>
assay_host_error SetLimit(Limit& limit, std::uint64_t value)
{
    if (value == 0 || value > kMaxLimit)
        return ASSAY_HOST_BAD_VALUE;
    limit = static_cast<Limit>(value);
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
    if (!std::isfinite(seconds) || seconds < 0)
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

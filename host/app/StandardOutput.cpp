#include <cerrno>
#include <cstdio>
#include <stdexcept>
#include <system_error>

#include "app/Output.h"

namespace assay_host {

namespace {

class StandardOutput : public Output {
public:
    void Write(std::string_view text) override
    {
        if (text.empty())
            return;
        if (std::fwrite(text.data(), 1, text.size(), stdout) != text.size() ||
            std::fflush(stdout) != 0)
            throw std::runtime_error("cannot write to standard output: " +
                                     std::generic_category().message(errno));
    }

    void Finish() override {}
};

} // namespace

std::unique_ptr<Output> OpenStandardOutput()
{
    return std::make_unique<StandardOutput>();
}

} // namespace assay_host

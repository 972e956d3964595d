#include <stdexcept>

#include "output/Output.h"
#include "output/Stream.h"

namespace assay_host {

namespace {

class StandardOutput : public Output {
public:
    void Write(std::string_view text) override
    {
        if (const std::error_code error = WriteStream(StandardStream::kOutput, text))
            throw std::runtime_error("cannot write to standard output: " + error.message());
    }

    void Finish() override {}
};

} // namespace

std::unique_ptr<Output> OpenStandardOutput()
{
    return std::make_unique<StandardOutput>();
}

} // namespace assay_host

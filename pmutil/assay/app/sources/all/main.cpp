#include "Output.h"
#include "PixmereAssay.h"
#include "pmutil/System.h"

int main(int argc, char** argv)
{
    constexpr int kStatusEscaped = 4;

    pmutil::PrepareConsoleProcess();
    assay::PrepareOutput();
    try {
        assay::PixmereAssay::Arguments arguments(argv, argv + argc);
        return assay::PixmereAssay::Instance().Run(arguments);
    } catch (...) {
        return kStatusEscaped;
    }
}

#include <boost/nowide/args.hpp>

#include "Output.h"
#include "PixmereAssay.h"
#include "pmutil/System.h"
#include "pmutil/UTF8Console.h"

int main(int argc, char** argv)
{
    constexpr int kStatusEscaped = 4;

    pmutil::PrepareConsoleProcess();
    assay::PrepareOutput();
    try {
        const pmutil::UTF8Console console;
        const boost::nowide::args utf8(argc, argv);
        assay::PixmereAssay::Arguments arguments(argv, argv + argc);
        return assay::PixmereAssay::Instance().Run(arguments);
    } catch (...) {
        return kStatusEscaped;
    }
}

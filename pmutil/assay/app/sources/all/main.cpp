#include <boost/nowide/args.hpp>

#include "Output.h"
#include "PixmereAssay.h"
#include "RunToStatus.h"
#include "pmutil/System.h"
#include "pmutil/UTF8Console.h"

int main(int argc, char** argv)
{
    pmutil::PrepareConsoleProcess();
    assay::PrepareOutput();
    return assay::RunToStatus([&] {
        const pmutil::UTF8Console console;
        const boost::nowide::args utf8(argc, argv);
        assay::PixmereAssay::Arguments arguments(argv, argv + argc);
        return assay::PixmereAssay::Instance().Run(arguments);
    });
}

// The program, except that it takes the folder that replaces the root of the file system from
// ASSAY_TEST_ROOT. The real one reads no variable.
#include <cstdlib>

#include "Output.h"
#include "PixmereAssay.h"
#include "RunToStatus.h"
#include "pmutil/System.h"
#include "qgf/AdapterName.h"

int main(int argc, char** argv)
{
    pmutil::PrepareConsoleProcess();
    assay::PrepareOutput();
    if (const char* root = std::getenv("ASSAY_TEST_ROOT"))
        QGF::SetSystemRoot(root);
    return assay::RunToStatus([&] {
        assay::PixmereAssay::Arguments arguments(argv, argv + argc);
        return assay::PixmereAssay::Instance().Run(arguments);
    });
}

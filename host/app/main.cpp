// assay-host: runs assay as a child and reports the result.
#include "app/HostMain.h"

int main(int argc, char** argv)
{
    return assay_host::RunHost(argc, argv);
}

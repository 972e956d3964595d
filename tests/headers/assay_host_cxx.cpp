// The headers are valid C++ alone and twice.
#include <assay_host.h>
#include <assay_host.hpp>

assay::Result use_header();

assay::Result use_header()
{
    return assay::run();
}

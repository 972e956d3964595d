#include "PixmereAssay.h"

#include "PixmereTester.h"

namespace assay {

PixmereAssay::PixmereAssay() = default;
PixmereAssay::~PixmereAssay() = default;

PixmereAssay& PixmereAssay::Instance()
{
    static PixmereAssay instance;
    return instance;
}

GPUAssayTester* PixmereAssay::CreateTester()
{
    return new PixmereTester(this);
}

} // namespace assay

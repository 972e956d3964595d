// The application of this program.
#pragma once

#include "GPUAssayApp.h"

namespace assay {

class PixmereAssay : public GPUAssayApp {
public:
    ~PixmereAssay() override;

    // Returns the application of the process, which lives until the process ends. Run it once.
    static PixmereAssay& Instance();

    GPUAssayTester* CreateTester() override;

private:
    PixmereAssay();
};

} // namespace assay

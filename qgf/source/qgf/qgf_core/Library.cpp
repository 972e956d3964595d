#include "qgf/Core.h"
#include "qgf/qgf_core/LibraryLoader.h"

namespace QGF {
namespace Core {

namespace {

LoaderCheck gLoaderCheck = CheckNativeLoader;
bool gStarted = false;

} // namespace

void Library::Initialize()
{
    if (gStarted)
        return;
    gLoaderCheck();
    gStarted = true;
}

void ReplaceLoaderCheck(LoaderCheck check)
{
    gLoaderCheck = check != nullptr ? check : CheckNativeLoader;
    gStarted = false;
}

} // namespace Core
} // namespace QGF

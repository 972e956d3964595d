#include "pmutil_gpu/AdapterSource.h"

namespace pmutil {

namespace {
AdapterSource* gReplacement = nullptr;
} // namespace

AdapterSource& CurrentAdapterSource()
{
    return gReplacement != nullptr ? *gReplacement : NativeAdapterSource();
}

void ReplaceAdapterSource(AdapterSource* source)
{
    gReplacement = source;
}

} // namespace pmutil

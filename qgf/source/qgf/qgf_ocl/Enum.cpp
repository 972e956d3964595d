#include "qgf/OCL.h"

namespace QGF {
namespace OCL {
namespace Enum {

const char* GetPropertyTypeName(DeviceProperty property)
{
    switch (property) {
    case DeviceProperty::VendorID:
        return "cl_uint";
    case DeviceProperty::GlobalMemSize:
        return "cl_ulong";
    }
    return "";
}

template <>
const char* TypeName<cl_uint>()
{
    return "cl_uint";
}

template <>
const char* TypeName<cl_ulong>()
{
    return "cl_ulong";
}

} // namespace Enum
} // namespace OCL
} // namespace QGF

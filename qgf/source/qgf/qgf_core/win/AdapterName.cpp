#include "qgf/AdapterName.h"

namespace QGF {

// On Windows the system names the adapters, and every interface returns the same name.
std::string AdapterName(const std::string& /*place*/)
{
    return {};
}

} // namespace QGF

#include "qgf/AdapterName.h"

namespace QGF {

std::string AdapterName(const std::string&)
{
    return {};
}

} // namespace QGF

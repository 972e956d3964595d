#include "qgf/AdapterName.h"

namespace QGF {

namespace {

std::string& Root()
{
    static std::string root;
    return root;
}

} // namespace

void SetSystemRoot(const std::string& root)
{
    Root() = root;
}

const std::string& SystemRoot()
{
    return Root();
}

} // namespace QGF

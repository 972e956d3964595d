#include "qgf/SystemFiles.h"

namespace QGF {

namespace {

unsigned gCount = 0;

std::string& Root()
{
    static std::string root;
    return root;
}

} // namespace

void SetSystemRoot(const std::string& root)
{
    Root() = root;
    ++gCount;
}

const std::string& SystemRoot()
{
    return Root();
}

unsigned SystemRootCount()
{
    return gCount;
}

} // namespace QGF

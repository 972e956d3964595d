#include "qgf/Core.h"

namespace QGF {

InternalException::InternalException(const char* file, int line, const char* text)
    : ExceptionBase(std::string(file) + "(" + std::to_string(line) + "): " + text),
      fFile(file),
      fLine(line),
      fText(text)
{}

} // namespace QGF

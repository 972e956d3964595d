// The platform part of QGF::Core. Each platform's DynamicLibrary.cpp implements this and
// OpenLibrary.
#pragma once

namespace QGF {
namespace Core {

// Throws LogicalException if the platform's dynamic loader can't open the program itself.
void CheckNativeLoader();

} // namespace Core
} // namespace QGF

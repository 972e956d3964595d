// The seam of QGF::Core below its public header: one twin source per platform implements this and
// OpenLibrary.
#pragma once

namespace QGF {
namespace Core {

// Throws LogicalException if the platform's dynamic loader can't even open the program itself.
void CheckNativeLoader();

} // namespace Core
} // namespace QGF

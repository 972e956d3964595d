// What those need who keep what they found under the system root.
#pragma once

namespace QGF {

// How often the system root has been set: what was found at another count is stale.
unsigned SystemRootCount();

} // namespace QGF

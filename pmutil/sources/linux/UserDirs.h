// The desktop folder of the XDG user directories.
#pragma once

#include <iosfwd>
#include <string>

namespace pmutil {

// Returns XDG_DESKTOP_DIR of a user-dirs.dirs file: an absolute path, or one that begins with
// "$HOME/", which is replaced by `home`. Empty if there is none. If there are several entries, the
// last one counts.
std::string FindDesktopDir(std::istream& userDirs, const std::string& home);

} // namespace pmutil

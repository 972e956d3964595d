// The desktop folder by the XDG user directories.
#pragma once

#include <iosfwd>
#include <string>

namespace pmutil {

// The XDG_DESKTOP_DIR of the text of a user-dirs.dirs file: an absolute path, or one under `home`
// that begins with "$HOME/". Empty if the text names none. The last entry counts.
std::string FindDesktopDir(std::istream& userDirs, const std::string& home);

} // namespace pmutil

// Reads the files in which a Unix-like system describes itself (/sys, /proc and the PCI id
// database), under a root that a test can replace. Nothing is written, and no device is opened or
// waited for. A file that can't be read counts as absent; only std::bad_alloc is thrown.
#pragma once

#include <cstddef>
#include <string>
#include <vector>

namespace QGF {

// Sets the folder that replaces the root of the file system wherever adapters are looked up; empty
// for the real root. Cached adapter data becomes stale. For tests and recorded machines: symbolic
// links inside the folder must be relative. Main thread only.
void SetSystemRoot(const std::string& root);
const std::string& SystemRoot();

// Returns the number of calls of SetSystemRoot. Data cached at another number is stale.
unsigned SystemRootCount();

// Bytes. A file of /sys has at most one page, and the files of /proc that are read are as short.
inline constexpr std::size_t kMaxSystemFileSize = 4096;

// Reads the first `maxSize` bytes of the file at an absolute path under the root. Returns false,
// with `text` empty, if it is not a regular file or a read fails.
bool ReadSystemFile(const std::string& path, std::string& text,
                    std::size_t maxSize = kMaxSystemFileSize);

// Returns the first line of such a file without leading and trailing blanks; empty if the file
// can't be read.
std::string ReadSystemLine(const std::string& path);

// Returns the names in the folder at an absolute path under the root, sorted; empty if it can't be
// read. Names that begin with a dot are left out. At most 4096 entries are read.
std::vector<std::string> ListSystemFolder(const std::string& path);

// Returns the target of the symbolic link at an absolute path under the root; empty if there is
// none.
std::string ReadSystemLink(const std::string& path);

// Returns the part of a path after its last slash.
std::string LastOfPath(const std::string& path);

} // namespace QGF

// The files in which a Unix-like system describes itself (/sys, /proc and the PCI id database),
// under a root that a test can replace. Nothing here writes, opens a device or waits for one, and
// nothing throws but std::bad_alloc: what can't be read is absent. For the platforms that have such
// files.
#pragma once

#include <cstddef>
#include <string>
#include <vector>

namespace QGF {

// A folder that stands for the root of the file system wherever adapters are looked up; empty for
// the real one. Set it before anything else is asked; setting it forgets what was known of
// adapters. For tests and recorded machines: links inside that folder must be relative. Main thread
// only.
void SetSystemRoot(const std::string& root);
const std::string& SystemRoot();

// How often the root has been set: what was found at another count is stale.
unsigned SystemRootCount();

// No file of /sys holds more than a page, and those of /proc that are read here are as short.
inline constexpr std::size_t kSystemFileLimit = 4096;

// Reads the file at an absolute path under the root, at most its first `limit` bytes. False, with
// `text` empty, if it is not a regular file or can't be read to the end or the limit.
bool ReadSystemFile(const std::string& path, std::string& text,
                    std::size_t limit = kSystemFileLimit);

// The first line of such a file without the blanks around it; empty if there is none.
std::string ReadSystemLine(const std::string& path);

// The names in the folder at an absolute path under the root, sorted; empty if it can't be read.
// At most the first 4096 that the system lists.
std::vector<std::string> ListSystemFolder(const std::string& path);

// The text that the symbolic link at an absolute path under the root holds; empty if there is none.
std::string ReadSystemLink(const std::string& path);

// The part of a path behind its last slash.
std::string LastOfPath(const std::string& path);

} // namespace QGF

// The path and the arguments of a child as the system takes them.
#pragma once

#include <deque>
#include <string>
#include <vector>

namespace pmutil {

// Returns the path in UTF-8. Throws the failure of `call` if it can't be encoded.
std::string GetPathInUTF8(const std::wstring& path, const char* call);

// The array of a child's arguments, of which the path is the first. Points into the texts, which
// must outlive it.
class ChildWords {
public:
    // Throws CallFailure of `call` if a text contains a zero byte.
    ChildWords(const std::string& path, const std::deque<std::string>& args, const char* call);

    char* const* Get() const { return fWords.data(); }

private:
    std::vector<char*> fWords;
};

} // namespace pmutil

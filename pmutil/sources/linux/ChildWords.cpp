#include "linux/ChildWords.h"

#include <cerrno>
#include <exception>

#include <boost/filesystem/path.hpp>

#include "all/PathCodecvt.h"
#include "linux/CallFailure.h"

namespace pmutil {

std::string GetPathInUTF8(const std::wstring& path, const char* call)
{
    try {
        return boost::filesystem::path(path, GetPathCodecvt()).native();
    } catch (const std::exception&) {
        ThrowFailed({call, EILSEQ});
    }
}

ChildWords::ChildWords(const std::string& path, const std::deque<std::string>& args,
                       const char* call)
{
    const auto add = [&](const std::string& text) {
        if (text.find('\0') != std::string::npos)
            throw CallFailure{call, EINVAL};
        fWords.push_back(const_cast<char*>(text.c_str()));
    };
    add(path);
    for (const std::string& arg : args)
        add(arg);
    fWords.push_back(nullptr);
}

} // namespace pmutil

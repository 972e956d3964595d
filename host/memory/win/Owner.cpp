#include "memory/win/Owner.h"

#include <aclapi.h>

#include <cstddef>
#include <memory>
#include <system_error>
#include <vector>

namespace assay_host {

namespace {

struct LocalFreer {
    void operator()(void* memory) const { ::LocalFree(memory); }
};

// Returns a structure of the token of this process; empty if that fails.
std::vector<std::byte> ReadToken(TOKEN_INFORMATION_CLASS kind)
{
    HANDLE token = nullptr;
    if (::OpenProcessToken(::GetCurrentProcess(), TOKEN_QUERY, &token) == 0)
        return {};
    DWORD size = 0;
    ::GetTokenInformation(token, kind, nullptr, 0, &size);
    std::vector<std::byte> found(size);
    if (::GetTokenInformation(token, kind, found.data(), size, &size) == 0)
        found.clear();
    ::CloseHandle(token);
    return found;
}

} // namespace

bool IsTrustedOwner(PSID owner)
{
    // TOKEN_USER and TOKEN_OWNER both begin with the pointer to an identifier in the same memory.
    for (const TOKEN_INFORMATION_CLASS kind : {TokenUser, TokenOwner}) {
        const std::vector<std::byte> mine = ReadToken(kind);
        if (!mine.empty() &&
            ::EqualSid(reinterpret_cast<const TOKEN_OWNER*>(mine.data())->Owner, owner) != 0)
            return true;
    }
    return ::IsWellKnownSid(owner, WinBuiltinAdministratorsSid) != 0 ||
           ::IsWellKnownSid(owner, WinLocalSystemSid) != 0;
}

std::string CheckOwner(HANDLE file)
{
    PSID owner = nullptr;
    PSECURITY_DESCRIPTOR descriptor = nullptr;
    const DWORD error = ::GetSecurityInfo(file, SE_FILE_OBJECT, OWNER_SECURITY_INFORMATION, &owner,
                                          nullptr, nullptr, nullptr, &descriptor);
    const std::unique_ptr<void, LocalFreer> freer(descriptor);
    if (error != ERROR_SUCCESS)
        return std::system_category().message(static_cast<int>(error));
    return IsTrustedOwner(owner) ? std::string() : "it belongs to another user";
}

} // namespace assay_host

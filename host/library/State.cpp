// The functions that read and change the user's choice, and forget the state.
#include <memory>
#include <new>
#include <optional>
#include <string>

#include <fmt/format.h>

#include "assay_host.h"
#include "library/Try.h"
#include "memory/Folder.h"
#include "memory/Machine.h"
#include "memory/Store.h"
#include "report/Bytes.h"

struct assay_host_state {
    explicit assay_host_state(const char* folder) : fFolder(folder) {}

    const std::string fFolder;
    std::string fMessage;
};

using namespace assay_host;

namespace {

// Returns nothing for a number that is none of the enumeration's. No function may keep one in a
// variable that another function refers to: C++ doesn't define how it is read.
std::optional<DeviceKind> FindKind(assay_host_interface which)
{
    if (which == ASSAY_HOST_OPENGL)
        return DeviceKind::kOpenGL;
    if (which == ASSAY_HOST_OPENCL)
        return DeviceKind::kOpenCL;
    return std::nullopt;
}

assay_host_choice GetNumber(const std::optional<InterfaceChoice>& choice)
{
    if (!choice)
        return ASSAY_HOST_CHOICE_AUTO;
    switch (choice->fUsability) {
    case Usability::kHardware:
        return ASSAY_HOST_CHOICE_HARDWARE;
    case Usability::kSoftware:
        return ASSAY_HOST_CHOICE_SOFTWARE;
    default:
        return ASSAY_HOST_CHOICE_ABSENT;
    }
}

// Returns nothing for the automatic choice.
std::optional<Usability> GetUsability(assay_host_choice choice)
{
    switch (choice) {
    case ASSAY_HOST_CHOICE_AUTO:
        return std::nullopt;
    case ASSAY_HOST_CHOICE_HARDWARE:
        return Usability::kHardware;
    case ASSAY_HOST_CHOICE_SOFTWARE:
        return Usability::kSoftware;
    default:
        return Usability::kAbsent;
    }
}

// Returns the error of a change, and keeps its reason.
assay_host_error Finish(assay_host_state& state, const std::string& reason)
{
    if (reason.empty())
        return ASSAY_HOST_OK;
    state.fMessage = fmt::format("The state can't be changed: {}.", ShowBytes(reason));
    return ASSAY_HOST_NOT_CHANGED;
}

} // namespace

assay_host_error assay_host_state_new(const char* folder, assay_host_state** state)
{
    if (state == nullptr)
        return ASSAY_HOST_NULL_POINTER;
    *state = nullptr;
    if (folder == nullptr)
        return ASSAY_HOST_NULL_POINTER;
    if (*folder == '\0')
        return ASSAY_HOST_BAD_TEXT;
    return Try([&] {
        *state = new assay_host_state(folder);
        return ASSAY_HOST_OK;
    });
}

void assay_host_state_free(assay_host_state* state)
{
    delete state;
}

const char* assay_host_state_message(const assay_host_state* state)
{
    return state == nullptr ? "" : state->fMessage.c_str();
}

assay_host_error assay_host_state_get_choice(assay_host_state* state, assay_host_interface which,
                                             assay_host_choice* choice)
{
    if (choice == nullptr)
        return ASSAY_HOST_NULL_POINTER;
    *choice = ASSAY_HOST_CHOICE_AUTO;
    if (state == nullptr)
        return ASSAY_HOST_NULL_POINTER;
    state->fMessage.clear();
    const std::optional<DeviceKind> kind = FindKind(which);
    if (!kind)
        return ASSAY_HOST_BAD_VALUE;
    return Try([&] {
        const std::unique_ptr<Folder> folder = OpenFolder(state->fFolder, FolderUse::kRead);
        Store store(*folder);
        const Choice read = store.LoadChoice();
        if (!store.GetMessages().empty())
            state->fMessage = store.GetMessages().front();
        *choice = GetNumber(read.Get(*kind));
        return ASSAY_HOST_OK;
    });
}

assay_host_error assay_host_state_set_choice(assay_host_state* state, assay_host_interface which,
                                             assay_host_choice choice)
{
    if (state == nullptr)
        return ASSAY_HOST_NULL_POINTER;
    state->fMessage.clear();
    const std::optional<DeviceKind> kind = FindKind(which);
    if (!kind || choice < ASSAY_HOST_CHOICE_AUTO || choice > ASSAY_HOST_CHOICE_ABSENT)
        return ASSAY_HOST_BAD_VALUE;
    const std::optional<Usability> usability = GetUsability(choice);
    return Try([&] {
        const std::unique_ptr<Folder> folder = OpenFolder(state->fFolder, FolderUse::kWrite);
        Store store(*folder);
        Choice made = store.LoadChoice();
        made.Get(*kind).reset();
        if (usability)
            made.Get(*kind) = {*usability, MakeSystemMachine()->GetTime()};
        return Finish(*state, store.SaveChoice(made));
    });
}

assay_host_error assay_host_state_forget(assay_host_state* state)
{
    if (state == nullptr)
        return ASSAY_HOST_NULL_POINTER;
    state->fMessage.clear();
    return Try([&] {
        const std::unique_ptr<Folder> folder = OpenFolder(state->fFolder, FolderUse::kWrite);
        // Who makes an attempt would write the entry again.
        const LockTry lock = folder->TryLock();
        if (lock.fState == LockState::kBusy)
            return ASSAY_HOST_BUSY;
        return Finish(*state, Store(*folder).ForgetAll());
    });
}

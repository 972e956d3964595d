// The keeper of a child: a process between the host and the child, which shares the host's memory.
#pragma once

namespace pmutil {

// What the keeper needs. The texts must exist until it has replied to the start; it copies the
// rest.
struct KeeperPlan {
    const char* fProgram;
    char* const* fArgs;
    char* const* fEnvironment;
    int fStreams[3]; // the child's, all above the standard streams
    int fLink;       // the keeper's end of a packet socket: commands and replies
    int fEnd;        // the write end of a pipe, for one KeeperEnd
    int fHost;       // the host's process descriptor
};

struct KeeperCommand {
    enum Kind : int {
        kKill,   // kills the child; no reply
        kEndAll, // kills and reaps all descendants, within fMilliseconds; replies 1 if none is left
        kLeave   // the keeper kills all descendants and ends; no reply
    };
    Kind fKind;
    int fMilliseconds = 0;
};

// The milliseconds of a time of the kernel.
constexpr long ToMilliseconds(long seconds, long nanoseconds)
{
    return seconds * 1000 + nanoseconds / 1000000;
}

// The reply to the start is 0 or an errno.
using KeeperReply = int;

// How the child ended: si_code and si_status of waitid.
struct KeeperEnd {
    int fCode;
    int fStatus;
};

// The stack that the keeper needs.
constexpr unsigned long kKeeperStackBytes = 64UL * 1024;

// The whole of the keeper, for clone: starts the child and follows the commands until the host
// ends or says so. Never returns. Uses neither the C library nor thread-local memory, and no
// descriptor of the host but those of the plan. All signals must be blocked.
int RunKeeper(void* plan);

} // namespace pmutil

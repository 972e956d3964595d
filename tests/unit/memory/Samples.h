// An identity, a machine whose clock and processes a test sets, and attempts.
#pragma once

#include <set>
#include <string>

#include "memory/Attempt.h"
#include "memory/Envelope.h"
#include "memory/Machine.h"

namespace assay_host {

constexpr std::int64_t kNow = 1'800'000'000;

inline Identity MakeIdentity()
{
    Identity identity;
    identity.fAdapters = {{"0000:01:00.0", 0x10de, 0x2484, "nvidia", "535.1"},
                          {"0000:02:00.0", 0x1002, 0x73bf, "amdgpu", ""}};
    identity.fFiles = {
        {DeviceKind::kOpenGL, "/usr/lib/libEGL.so.1.1.0", 77000, 1'700'000'000'000'000'001, "ab12"},
        {DeviceKind::kOpenCL, "/usr/lib/libOpenCL.so.1.0.0", 1ULL << 60, -5, ""}};
    identity.fVariables = {"DRI_PRIME=1"};
    identity.fSystem = "Linux 6.1.0-13";
    identity.fAssayVersion = "1.0.0";
    return identity;
}

class FakeMachine : public Machine {
public:
    std::int64_t GetTime() override { return fTime; }
    HostMark GetSelf() override { return {fProcess, 1000 + fProcess, fBoot, fId}; }
    bool IsAlive(const HostMark& host) override
    {
        return host.fStart == 1000 + host.fProcess && fAlive.count(host.fProcess) > 0;
    }

    std::int64_t fTime = kNow;
    std::uint64_t fProcess = 7;
    std::string fBoot = "boot-1";
    std::string fId = "machine";
    std::set<std::uint64_t> fAlive = {7};
};

inline Finding MakeFinding(Usability usability, const std::string& reason = "a-reason")
{
    return {usability, reason, "A sentence.", "glgpu[0]", "A card", "1.2"};
}

// An attempt that ended at this time.
inline Attempt MakeAttempt(std::int64_t ended, AttemptEnd end, Usability gl, Usability cl)
{
    Attempt attempt;
    attempt.fStarted = attempt.fEnded = ended;
    attempt.fHost = {7, 1007, "boot-1", "machine"};
    attempt.fEnd = end;
    attempt.fReason = "How it ended.";
    attempt.fLastLine = "The last line.";
    attempt.fOpenGL = MakeFinding(gl);
    attempt.fOpenCL = MakeFinding(cl);
    return attempt;
}

inline Knowledge MakeKnowledge()
{
    Knowledge knowledge;
    knowledge.fIdentity = MakeIdentity();
    AddAttempt(knowledge, MakeAttempt(kNow - 100, AttemptEnd::kCrashed, Usability::kHardware,
                                      Usability::kBroken));
    knowledge.fAttempts.back().fTermination = "signal 11 (Segmentation fault)";
    knowledge.fAttempts.back().fLastLine = "# \xFF\x80 clFinish";
    AddAttempt(knowledge, MakeAttempt(kNow - 10, AttemptEnd::kEnded, Usability::kHardware,
                                      Usability::kSoftware));
    knowledge.fAttempts.back().fExitStatus = 2;
    return knowledge;
}

// Makes the text of a state file as a program of this format would.
inline std::string SealAs(int format, const nlohmann::ordered_json& content)
{
    const std::string text = Seal(content);
    const std::string mark = "\"checksum\": \"";
    const std::size_t begin = text.find(mark) + mark.size();
    const std::string body = text.substr(text.find('\n', begin) + 1);
    const std::string number = std::to_string(format);
    return "{\n  \"format\": " + number + ",\n  " + mark + MakeDigest(number + "\n" + body) +
           "\",\n" + body;
}

} // namespace assay_host

#include "memory/KnowledgeJson.h"

#include <gtest/gtest.h>

#include <cstdint>
#include <functional>
#include <set>
#include <stdexcept>

#include "Samples.h"

namespace assay_host {
namespace {

using Json = nlohmann::ordered_json;

TEST(KnowledgeJsonTest, ReadsWhatItWrote)
{
    const Knowledge knowledge = MakeKnowledge();
    const Json json = MakeKnowledgeJson(knowledge);
    const Knowledge read = ReadKnowledgeJson(Json::parse(json.dump()));
    EXPECT_EQ(read.fIdentity, knowledge.fIdentity);
    EXPECT_EQ(MakeKnowledgeJson(read), json);
    ASSERT_EQ(read.fAttempts.size(), 2u);
    EXPECT_EQ(read.fCount, 2u);
    const Attempt& first = read.fAttempts.front();
    EXPECT_EQ(first.fEnd, AttemptEnd::kCrashed);
    EXPECT_EQ(first.fStarted, kNow - 100);
    EXPECT_EQ(first.fExitStatus, std::nullopt);
    EXPECT_EQ(first.fTermination, "signal 11 (Segmentation fault)");
    EXPECT_EQ(first.fLastLine, "# \xFF\x80 clFinish");
    EXPECT_EQ(first.fHost, (HostMark{7, 1007, "boot-1", "machine"}));
    EXPECT_EQ(first.fOpenGL.fUsability, Usability::kHardware);
    EXPECT_EQ(first.fOpenCL.fUsability, Usability::kBroken);
    EXPECT_EQ(first.fOpenGL.fDevice, "A card");
    EXPECT_EQ(read.fAttempts.back().fExitStatus, 2);
}

TEST(KnowledgeJsonTest, EachMemberIsNeeded)
{
    const Json json = MakeKnowledgeJson(MakeKnowledge());
    const Json flat = json.flatten();
    for (const auto& member : flat.items()) {
        Json without = json;
        const Json::json_pointer place(member.key());
        Json& parent = without[place.parent_pointer()];
        if (parent.is_array() || member.value().is_array())
            continue;
        parent.erase(place.back());
        EXPECT_ANY_THROW(ReadKnowledgeJson(without)) << member.key();
        Json changed = json;
        changed[place] = {{"an", "object"}};
        EXPECT_ANY_THROW(ReadKnowledgeJson(changed)) << member.key();
    }
}

TEST(KnowledgeJsonTest, NamesWhatItRefuses)
{
    const struct {
        const char* fMember;
        Json fValue;
        const char* fText;
    } kRows[] = {
        {"/attempts/0/host/process", "7x", "not a number"},
        {"/attempts/0/host/process", "", "not a number"},
        {"/count", "-1", "not a number"},
        {"/attempts/0/exitStatus", 1.5, "not an integer"},
        {"/identity/adapters/0/vendor", 1.5, "not an integer"},
        {"/attempts/0/ended", -1, "not a time"},
        {"/identity/files/0", "OpenGL 5 7 -", "too few words"},
        {"/identity/files/0", "Vulkan 5 7 - /x", "an unknown interface"},
        {"/identity/files/0", "OpenGL 5x 7 - /x", "not a number"},
        {"/attempts/0/end", "later", "an unknown end"},
        {"/attempts/0/opengl/answer", "maybe", "an unknown answer"},
    };
    for (const auto& row : kRows) {
        Json json = MakeKnowledgeJson(MakeKnowledge());
        json[Json::json_pointer(row.fMember)] = row.fValue;
        try {
            ReadKnowledgeJson(json);
            ADD_FAILURE() << row.fMember;
        } catch (const std::runtime_error& error) {
            EXPECT_STREQ(error.what(), row.fText) << row.fMember;
        }
    }
}

TEST(KnowledgeJsonTest, RefusesTimesThatNoClockHas)
{
    for (const char* const member : {"started", "ended"}) {
        Json json = MakeKnowledgeJson(MakeKnowledge());
        Json& time = json["attempts"][0][member];
        for (const std::int64_t good : {std::int64_t(0), kLastTime}) {
            time = good;
            EXPECT_EQ(ReadKnowledgeJson(json).fAttempts.size(), 2u);
        }
        for (const std::int64_t bad : {std::int64_t(-1), kLastTime + 1, INT64_MIN, INT64_MAX}) {
            time = bad;
            EXPECT_ANY_THROW(ReadKnowledgeJson(json)) << bad;
        }
    }
}

TEST(KnowledgeJsonTest, EachFactOfAnIdentityChangesItsName)
{
    const std::vector<std::function<void(Identity&)>> changes = {
        [](Identity&) {},
        [](Identity& identity) { identity.fSystem += "x"; },
        [](Identity& identity) { identity.fAssayVersion += "x"; },
        [](Identity& identity) { identity.fAdapters.pop_back(); },
        [](Identity& identity) { identity.fAdapters[0].fSlot += "x"; },
        [](Identity& identity) { ++identity.fAdapters[0].fVendor; },
        [](Identity& identity) { ++identity.fAdapters[0].fDevice; },
        [](Identity& identity) { identity.fAdapters[0].fDriver += "x"; },
        [](Identity& identity) { identity.fAdapters[0].fDriverVersion += "x"; },
        [](Identity& identity) { identity.fVariables.pop_back(); },
        [](Identity& identity) { identity.fVariables[0] += "x"; },
        [](Identity& identity) { identity.fFiles.pop_back(); },
        [](Identity& identity) { identity.fFiles[0].fInterface = DeviceKind::kOpenCL; },
        [](Identity& identity) { identity.fFiles[0].fPath += "x"; },
        [](Identity& identity) { ++identity.fFiles[0].fSize; },
        [](Identity& identity) { ++identity.fFiles[0].fTime; },
        [](Identity& identity) { identity.fFiles[0].fBuildId += "x"; },
    };
    std::set<std::string> names;
    for (const auto& change : changes) {
        Identity identity = MakeIdentity();
        change(identity);
        names.insert(GetIdentityName(MakeIdentityJson(identity)));
        Knowledge knowledge;
        knowledge.fIdentity = identity;
        EXPECT_EQ(ReadKnowledgeJson(MakeKnowledgeJson(knowledge)).fIdentity, identity);
    }
    EXPECT_EQ(names.size(), changes.size());
    EXPECT_EQ(names.count(GetIdentityName(MakeIdentityJson(MakeIdentity()))), 1u);
}

// Later versions must find what is stored.
TEST(KnowledgeJsonTest, TheNameOfAnIdentityLasts)
{
    EXPECT_EQ(GetIdentityName(MakeIdentityJson(MakeIdentity())),
              "f03eb0aa-310f-52bf-8cac-c07652ffc6c5");
}

} // namespace
} // namespace assay_host

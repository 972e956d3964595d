#include "memory/Store.h"

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include "FakeFolder.h"
#include "Samples.h"
#include "memory/Envelope.h"
#include "memory/KnowledgeJson.h"

namespace assay_host {
namespace {

using testing::ElementsAre;
using testing::EndsWith;
using testing::IsEmpty;

Knowledge MakeNumbered(int number)
{
    Knowledge knowledge = MakeKnowledge();
    knowledge.fIdentity.fSystem = std::to_string(number);
    return knowledge;
}

class StoreTest : public testing::Test {
protected:
    std::vector<std::string> LoadAndGetMessages()
    {
        Store store(fFolder);
        EXPECT_THAT(store.Load(MakeIdentity()).fAttempts, IsEmpty());
        store.Load(MakeIdentity());
        return store.GetMessages();
    }

    FakeFolder fFolder;
};

TEST_F(StoreTest, LoadsWhatWasSaved)
{
    Store store(fFolder);
    EXPECT_THAT(store.Load(MakeIdentity()).fAttempts, IsEmpty());
    EXPECT_TRUE(store.Save(MakeKnowledge(), kNow));
    EXPECT_EQ(store.Load(MakeIdentity()).fAttempts.size(), 2u);
    EXPECT_THAT(store.Load(MakeNumbered(1).fIdentity).fAttempts, IsEmpty());
    EXPECT_EQ(store.Load(MakeNumbered(1).fIdentity).fIdentity, MakeNumbered(1).fIdentity);
    EXPECT_THAT(store.GetMessages(), IsEmpty());
}

TEST_F(StoreTest, IgnoresADamagedFileAndReplacesIt)
{
    Store store(fFolder);
    store.Save(MakeKnowledge(), kNow);
    fFolder.GetState()[30] ^= 1;
    EXPECT_THAT(LoadAndGetMessages(), ElementsAre(EndsWith(" is ignored: it is damaged.")));
    EXPECT_TRUE(store.Save(MakeKnowledge(), kNow));
    EXPECT_EQ(store.Load(MakeIdentity()).fAttempts.size(), 2u);
    fFolder.GetState().append(kMaxStateBytes, ' ');
    EXPECT_THAT(LoadAndGetMessages(), ElementsAre(EndsWith(" is ignored: it is too large.")));
    fFolder.GetState() = Seal({{"no", "knowledge"}});
    EXPECT_THAT(LoadAndGetMessages(), ElementsAre(EndsWith(" is ignored: it is damaged.")));
}

TEST_F(StoreTest, IgnoresTheFileOfAnotherIdentityWithTheSameName)
{
    Store store(fFolder);
    store.Save(MakeKnowledge(), kNow);
    fFolder.GetState() = Seal(MakeKnowledgeJson(MakeNumbered(1)));
    EXPECT_THAT(LoadAndGetMessages(),
                ElementsAre(EndsWith(" is ignored: it is of another identity.")));
}

TEST_F(StoreTest, LeavesTheFileOfANewerVersion)
{
    Store(fFolder).Save(MakeKnowledge(), kNow);
    const std::string text = fFolder.GetState() = SealAs(kStateFormat + 1, {{"new", "content"}});
    EXPECT_THAT(LoadAndGetMessages(),
                ElementsAre(EndsWith(" is ignored: it is of a newer version.")));
    Store store(fFolder);
    EXPECT_FALSE(store.Save(MakeKnowledge(), kNow));
    EXPECT_FALSE(store.Save(MakeKnowledge(), kNow));
    EXPECT_THAT(store.GetMessages(),
                ElementsAre("The state can't be kept: the file of a newer version is kept."));
    store.Drop(MakeIdentity());
    EXPECT_EQ(fFolder.GetState(), text);
}

TEST_F(StoreTest, SaysOnceThatNothingIsKept)
{
    fFolder.fGoodWrites = 0;
    Store store(fFolder);
    EXPECT_FALSE(store.Save(MakeKnowledge(), kNow));
    EXPECT_FALSE(store.Save(MakeKnowledge(), kNow));
    EXPECT_THAT(store.GetMessages(),
                ElementsAre("The state can't be kept: No space left on device."));
}

TEST_F(StoreTest, LeavesOutOldAttemptsThatHaveNoRoom)
{
    Knowledge knowledge = MakeKnowledge();
    for (Attempt& attempt : knowledge.fAttempts)
        attempt.fLastLine = std::string(kMaxStateBytes / 2, 'x');
    Store store(fFolder);
    EXPECT_TRUE(store.Save(knowledge, kNow));
    const Knowledge read = store.Load(MakeIdentity());
    ASSERT_EQ(read.fAttempts.size(), 1u);
    EXPECT_EQ(read.fAttempts[0].fEnd, AttemptEnd::kEnded);
    EXPECT_EQ(read.fCount, 2u);
    knowledge.fAttempts[1].fLastLine += knowledge.fAttempts[1].fLastLine;
    EXPECT_FALSE(store.Save(knowledge, kNow));
    EXPECT_THAT(store.GetMessages(), ElementsAre("The state can't be kept: it is too large."));
}

TEST_F(StoreTest, FillsAFileUpToItsLargestSize)
{
    Knowledge knowledge = MakeKnowledge();
    std::string& line = knowledge.fAttempts[0].fLastLine;
    line.clear();
    Store store(fFolder);
    ASSERT_TRUE(store.Save(knowledge, kNow));
    line.append(kMaxStateBytes - fFolder.GetState().size(), 'x');
    EXPECT_TRUE(store.Save(knowledge, kNow));
    EXPECT_EQ(fFolder.GetState().size(), kMaxStateBytes);
    EXPECT_EQ(store.Load(MakeIdentity()).fAttempts.size(), 2u);
    line += 'x';
    EXPECT_TRUE(store.Save(knowledge, kNow));
    EXPECT_EQ(store.Load(MakeIdentity()).fAttempts.size(), 1u);

    knowledge.fAttempts.erase(knowledge.fAttempts.begin());
    std::string& only = knowledge.fAttempts[0].fLastLine;
    only.append(kMaxStateBytes - fFolder.GetState().size(), 'x');
    EXPECT_TRUE(store.Save(knowledge, kNow));
    EXPECT_EQ(fFolder.GetState().size(), kMaxStateBytes);
    only += 'x';
    EXPECT_FALSE(store.Save(knowledge, kNow));
}

TEST_F(StoreTest, DropsTheFileOfOneIdentity)
{
    Store store(fFolder);
    store.Save(MakeKnowledge(), kNow);
    store.Save(MakeNumbered(1), kNow);
    store.Drop(MakeIdentity());
    EXPECT_THAT(store.Load(MakeIdentity()).fAttempts, IsEmpty());
    EXPECT_EQ(store.Load(MakeNumbered(1).fIdentity).fAttempts.size(), 2u);
}

TEST_F(StoreTest, KeepsTheNewestFiles)
{
    fFolder.fFiles["of another program"] = "text";
    fFolder.fFiles[".left.tmp"] = "text";
    fFolder.fTimes[".left.tmp"] = kNow - 3601;
    fFolder.fFiles[".new.tmp"] = "text";
    fFolder.fTimes[".new.tmp"] = kNow - 3600;
    Store store(fFolder);
    constexpr int kSaved = static_cast<int>(kMaxIdentities) + 5;
    for (int number = 0; number < kSaved; ++number)
        store.Save(MakeNumbered(number), kNow);
    store.Save(MakeNumbered(5), kNow);
    EXPECT_EQ(store.List().size(), kMaxIdentities);
    EXPECT_EQ(fFolder.fFiles.count("of another program"), 1u);
    EXPECT_EQ(fFolder.fFiles.count(".left.tmp"), 0u);
    EXPECT_EQ(fFolder.fFiles.count(".new.tmp"), 1u);
    EXPECT_THAT(store.Load(MakeNumbered(4).fIdentity).fAttempts, IsEmpty());
    EXPECT_EQ(store.Load(MakeNumbered(5).fIdentity).fAttempts.size(), 2u);
}

TEST_F(StoreTest, ListsTheNewestFirst)
{
    Store store(fFolder);
    store.Save(MakeNumbered(1), kNow);
    fFolder.GetState()[30] ^= 1;
    store.Save(MakeNumbered(2), kNow);
    fFolder.fFiles["lock"] = "";
    const auto list = store.List();
    ASSERT_EQ(list.size(), 2u);
    EXPECT_EQ(list[0].fName, GetIdentityName(MakeIdentityJson(MakeNumbered(2).fIdentity)));
    ASSERT_TRUE(list[0].fKnowledge);
    EXPECT_EQ(list[0].fKnowledge->fIdentity.fSystem, "2");
    EXPECT_FALSE(list[1].fKnowledge);
    EXPECT_EQ(list[1].fProblem, "it is damaged");
}

TEST_F(StoreTest, ForgetsOneOrAll)
{
    Store store(fFolder);
    store.Save(MakeNumbered(1), kNow);
    store.Save(MakeNumbered(2), kNow);
    Choice choice;
    choice.fOpenGL = {Usability::kSoftware, kNow};
    EXPECT_EQ(store.SaveChoice(choice), "");
    fFolder.fFiles["of another program"] = "text";
    EXPECT_EQ(store.Forget(GetIdentityName(MakeIdentityJson(MakeNumbered(1).fIdentity))), "");
    EXPECT_EQ(store.List().size(), 1u);
    EXPECT_FALSE(store.LoadChoice().IsEmpty());
    EXPECT_EQ(store.ForgetAll(), "");
    EXPECT_EQ(fFolder.fFiles.size(), 1u);
    EXPECT_TRUE(store.LoadChoice().IsEmpty());
    store.Save(MakeNumbered(1), kNow);
    fFolder.fCanRemove = false;
    EXPECT_EQ(store.ForgetAll(), "Read-only file system");
}

// Only the user's choice can be removed.
class StubbornFolder : public FakeFolder {
public:
    std::string Remove(const std::string& name) override
    {
        return name == "choice.json" ? FakeFolder::Remove(name) : "Operation not permitted";
    }
};

TEST(StoreOfAStubbornFolder, SaysWhatCannotBeForgotten)
{
    StubbornFolder folder;
    Store store(folder);
    store.Save(MakeNumbered(1), kNow);
    EXPECT_EQ(store.ForgetAll(), "Operation not permitted");
}

TEST_F(StoreTest, ListsNoFilesOfOtherNames)
{
    const std::string digest = MakeDigest("x");
    for (const std::string& name :
         {std::string("abc"), std::string("abc.json"), digest, digest + ".jso", digest + ".jsox",
          digest + ".json~", digest.substr(1) + "x.json", digest.substr(1) + "A.json"})
        fFolder.fFiles[name] = "text";
    EXPECT_EQ(Store(fFolder).List().size(), 0U);
    fFolder.fFiles[digest + ".json"] = "text";
    EXPECT_EQ(Store(fFolder).List().size(), 1U);
}

TEST_F(StoreTest, KeepsTheChoiceUntilItIsTakenBack)
{
    Store store(fFolder);
    EXPECT_TRUE(store.LoadChoice().IsEmpty());
    Choice choice;
    choice.fOpenGL = {Usability::kSoftware, kNow};
    EXPECT_EQ(store.SaveChoice(choice), "");
    EXPECT_EQ(store.LoadChoice().fOpenGL->fUsability, Usability::kSoftware);
    fFolder.fFiles["choice.json"][5] ^= 1;
    EXPECT_TRUE(store.LoadChoice().IsEmpty());
    EXPECT_THAT(store.GetMessages(), ElementsAre("The user's choice is ignored: it is damaged."));
    EXPECT_EQ(store.SaveChoice({}), "");
    EXPECT_TRUE(fFolder.fFiles.empty());
}

} // namespace
} // namespace assay_host

#include "qgf/qgf_core/linux/NvidiaProc.h"

#include <gtest/gtest.h>

#include "support/AdapterTree.h"

namespace QGF {
namespace {

TEST(NvidiaProcTest, AFieldsValueIsTrimmed)
{
    const std::string text = "Model: \t\t NVIDIA H100 80GB HBM3 \nIRQ:   \t\t 120\nEmpty:\nLast: x";
    EXPECT_EQ(NvidiaField(text, "Model"), "NVIDIA H100 80GB HBM3");
    EXPECT_EQ(NvidiaField(text, "IRQ"), "120");
    EXPECT_EQ(NvidiaField(text, "Empty"), "");
    EXPECT_EQ(NvidiaField(text, "Last"), "x");
    EXPECT_EQ(NvidiaField(text, "Mode"), "");
    EXPECT_EQ(NvidiaField(text, "None"), "");
    EXPECT_EQ(NvidiaField("", "Model"), "");
    EXPECT_EQ(NvidiaField("Model:", "Model"), "");
    EXPECT_EQ(NvidiaField("Model: \n x", "Model"), "");
    EXPECT_EQ(NvidiaField("\nModel\nModels: x\nModel:y\r\nModel: z", "Model"), "y");
}

TEST(NvidiaProcTest, TheModelIsTheDriversText)
{
    const AdapterTree tree("nvidia-drm");
    EXPECT_EQ(NvidiaModel("0000:01:00.0"), "NVIDIA GeForce RTX 3090");
    EXPECT_EQ(NvidiaModel("0000:02:00.0"), "");
}

TEST(NvidiaProcTest, UnknownIsNotAModel)
{
    const AdapterTree tree("nvidia-drm");
    tree.write("/proc/driver/nvidia/gpus/0000:01:00.0/information", "Model: \t\t Unknown\n");
    EXPECT_EQ(NvidiaModel("0000:01:00.0"), "");
}

TEST(NvidiaProcTest, ASuspendedCardIsNotRead)
{
    const AdapterTree tree("nvidia-drm");
    const std::string power =
        "/sys/devices/pci0000:00/0000:00:01.0/0000:01:00.0/power/runtime_status";
    for (const char* state : {"suspended\n", "suspending\n"}) {
        tree.write(power, state);
        EXPECT_EQ(NvidiaModel("0000:01:00.0"), "");
    }
    for (const char* state : {"active\n", "unsupported\n", "resuming\n", ""}) {
        tree.write(power, state);
        EXPECT_EQ(NvidiaModel("0000:01:00.0"), "NVIDIA GeForce RTX 3090");
    }
}

TEST(NvidiaProcTest, CardsAreTheFoldersOfTheDriver)
{
    const AdapterTree tree("nvidia-eight");
    tree.write("/proc/driver/nvidia/gpus/other", "");
    const std::vector<std::string> cards = NvidiaCards();
    ASSERT_EQ(cards.size(), 8U);
    EXPECT_EQ(cards.front(), "0000:1b:00.0");
    EXPECT_EQ(cards.back(), "0000:df:00.0");
}

} // namespace
} // namespace QGF

#include <gtest/gtest.h>

#include <string>

#include "Lines.h"
#include "Samples.h"
#include "report/Software.h"

namespace assay_host {
namespace {

// The names of software renderers of Mesa, SwiftShader, ANGLE, Windows, PoCL and Oclgrind.
TEST(Software, IsKnownByItsName)
{
    for (const char* name :
         {"llvmpipe (LLVM 15.0.6, 256 bits)", "softpipe", "Software Rasterizer", "swrast",
          "zink Vulkan 1.3 (llvmpipe (LLVM 15.0.6, 256 bits) (MESA_LLVMPIPE))",
          "virgl (LLVMPIPE (LLVM 15.0.6, 256 bits))", "lavapipe", "Google SwiftShader",
          "ANGLE (Google, Vulkan 1.3.0 (SwiftShader Device (Subzero) (0x0000C0DE)), SwiftShader "
          "driver)",
          "GDI Generic", "Microsoft Basic Render Driver", "D3D12 (Microsoft Basic Render Driver)",
          "Oclgrind Simulator", "SOFTWARE RASTERIZER"})
        EXPECT_TRUE(IsSoftwareName(name)) << name;
}

TEST(Software, IsNoGraphicsCard)
{
    for (const char* name :
         {"", "AMD Radeon RX 580 Series (polaris10, LLVM 15.0.6, DRM 3.49, 6.1.0-13-amd64)",
          "Mesa Intel(R) UHD Graphics 620 (KBL GT2)", "NVIDIA GeForce RTX 4090/PCIe/SSE2",
          "SVGA3D; build: RELEASE;  LLVM;", "virgl (Mesa Intel(R) HD Graphics)",
          "D3D12 (NVIDIA GeForce RTX 3060)", "GeForce", "Apple M1"})
        EXPECT_FALSE(IsSoftwareName(name)) << name;
    EXPECT_FALSE(IsSoftwareVersion("3.0 PoCL HSTR: CUDA-sm_75"));
    EXPECT_FALSE(IsSoftwareVersion("3.0 CUDA"));
    EXPECT_FALSE(IsSoftwareVersion(""));
}

TEST(Software, IsKnownByPoclsVersion)
{
    for (const char* version : {"3.0 PoCL HSTR: pthread-x86_64-pc-linux-gnu-skylake-avx512",
                                "3.0 PoCL HSTR: cpu-x86_64-pc-linux-gnu-haswell",
                                "1.2 pocl HSTR: basic-x86_64-pc-linux-gnu"})
        EXPECT_TRUE(IsSoftwareVersion(version)) << version;
}

std::string Find(const Sample& sample, bool* canTell = nullptr)
{
    Sample copy = sample;
    const Report report = ReadReport(copy.GetText());
    const Answers answers = GetAnswers(report);
    if (canTell)
        *canTell = CanTellSoftware(answers.fDevices.at(0));
    return FindSoftwareText(answers.fDevices.at(0));
}

TEST(Software, IsFoundInAnyTextOfADevice)
{
    EXPECT_EQ(Find(Sample(1, 0)), "");
    EXPECT_EQ(Find(Sample(1, 0).Set("glgpu[0].GLRenderer", "\"softpipe\"")), "softpipe");
    EXPECT_EQ(Find(Sample(1, 0).Set("glgpu[0].GLName", "\"Microsoft Basic Render Driver\"")),
              "Microsoft Basic Render Driver");
    EXPECT_EQ(Find(Sample(0, 1).Set("clgpu[0].CLName", "\"llvmpipe\"")), "llvmpipe");
    EXPECT_EQ(Find(Sample(0, 1).Set("clgpu[0].CLDeviceVersion", "\"3.0 PoCL HSTR: cpu-x\"")),
              "3.0 PoCL HSTR: cpu-x");
}

TEST(Software, CannotBeToldWithoutTheRenderersAnswer)
{
    bool canTell = false;
    Find(Sample(1, 0), &canTell);
    EXPECT_TRUE(canTell);
    Find(Sample(1, 0).EndAfter("glgpu[0].GLRectTextureSize"), &canTell);
    EXPECT_FALSE(canTell);
    Find(Sample(1, 0).Set("glgpu[0].GLName", "\"softpipe\"").EndAfter("glgpu[0].GLName"), &canTell);
    EXPECT_TRUE(canTell);
    Find(Sample(0, 1).EndAfter("clgpu[0].CLMemoryMB"), &canTell);
    EXPECT_FALSE(canTell);
}

} // namespace
} // namespace assay_host

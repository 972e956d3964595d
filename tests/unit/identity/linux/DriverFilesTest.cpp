#include <gtest/gtest.h>

#include <algorithm>
#include <chrono>
#include <filesystem>
#include <map>
#include <string>
#include <vector>

#include <sys/stat.h>

#include "FakeElf.h"
#include "MachineTree.h"
#include "identity/linux/EglVendor.h"
#include "identity/linux/Machine.h"

namespace assay_host {
namespace {

using Names = std::vector<std::string>;

std::string MakeLibrary(const Names& needed = {}, const std::string& buildId = "1")
{
    FakeElf fake;
    fake.fNeeded = needed;
    fake.fBuildId = buildId;
    return fake.Make();
}

std::string MakeVendor(const std::string& library)
{
    return R"({"file_format_version": "1.0.0", "ICD": {"library_path": ")" + library + "\"}}";
}

// A machine with a driver for OpenGL and two for OpenCL.
class DriverFilesTest : public testing::Test {
protected:
    DriverFilesTest()
    {
        fTree.Write("/usr/lib/libEGL.so.1.1.0", MakeLibrary({"libdispatch.so.0", "libc.so.6"}));
        fTree.Link("/usr/lib/libEGL.so.1", "libEGL.so.1.1.0");
        fTree.Write("/usr/lib/libdispatch.so.0", MakeLibrary());
        fTree.Write("/usr/lib/libc.so.6", MakeLibrary());
        fTree.Write("/usr/share/glvnd/egl_vendor.d/50_mesa.json", MakeVendor("libEGL_mesa.so.0"));
        fTree.Write("/usr/share/glvnd/egl_vendor.d/notes.txt", "");
        fTree.Write("/usr/lib/libEGL_mesa.so.0", MakeLibrary({"libgallium.so", "libm.so.6"}));
        fTree.Write("/usr/lib/libgallium.so", MakeLibrary({"libLLVM.so", "libdispatch.so.0"}));
        fTree.Write("/usr/lib/libLLVM.so", MakeLibrary());
        fTree.Write("/usr/lib/dri/iris_dri.so", MakeLibrary({"libintel.so"}));
        fTree.Write("/usr/lib/libintel.so", MakeLibrary());
        fTree.Write("/usr/lib/dri/readme", "");
        fTree.Write("/usr/lib/gbm/dri_gbm.so", MakeLibrary());

        fTree.Write("/usr/lib/libOpenCL.so.1", MakeLibrary());
        fTree.Write("/etc/OpenCL/vendors/one.icd", "libone.so\n");
        fTree.Write("/etc/OpenCL/vendors/two.icd", "/opt/two/libtwo.so");
        fTree.Write("/etc/OpenCL/vendors/three.icd.off", "libone.so");
        fTree.Write("/etc/OpenCL/vendors/gone.icd", "libgone.so");
        fTree.Write("/usr/lib/libone.so", MakeLibrary({"libLLVM.so"}));
        fTree.Write("/usr/lib/pocl/libdevice.so", MakeLibrary());
        fTree.Write("/opt/two/libtwo.so", MakeLibrary());
        fTree.Write("/etc/OpenCL/layers/trace.lay", "/opt/layer.so\n");
        fTree.Write("/opt/layer.so", MakeLibrary());
    }

    Identity Read() const { return GetMachineIdentity(fTree.GetFiles(), fProcess); }

    Names List(DeviceKind kind) const
    {
        Names paths;
        for (const DriverFile& file : Read().fFiles)
            if (file.fInterface == kind)
                paths.push_back(file.fPath);
        return paths;
    }

    bool Has(const std::string& path) const
    {
        const Identity identity = Read();
        return std::any_of(identity.fFiles.begin(), identity.fFiles.end(),
                           [&](const DriverFile& file) { return file.fPath == path; });
    }

    MachineTree fTree;
    Process fProcess;
};

TEST_F(DriverFilesTest, AreThoseOfBothInterfaces)
{
    EXPECT_EQ(List(DeviceKind::kOpenGL),
              (Names{"/usr/lib/dri/iris_dri.so", "/usr/lib/gbm/dri_gbm.so",
                     "/usr/lib/libEGL.so.1.1.0", "/usr/lib/libEGL_mesa.so.0", "/usr/lib/libLLVM.so",
                     "/usr/lib/libdispatch.so.0", "/usr/lib/libgallium.so", "/usr/lib/libintel.so",
                     "/usr/share/glvnd/egl_vendor.d/50_mesa.json"}));
    EXPECT_EQ(List(DeviceKind::kOpenCL),
              (Names{"/etc/OpenCL/layers/trace.lay", "/etc/OpenCL/vendors/gone.icd",
                     "/etc/OpenCL/vendors/one.icd", "/etc/OpenCL/vendors/two.icd", "/opt/layer.so",
                     "/opt/two/libtwo.so", "/usr/lib/libLLVM.so", "/usr/lib/libOpenCL.so.1",
                     "/usr/lib/libone.so", "/usr/lib/pocl/libdevice.so"}));
}

TEST_F(DriverFilesTest, AreNoneOnABareMachine)
{
    const MachineTree bare;
    EXPECT_EQ(GetMachineIdentity(bare.GetFiles(), {}).fFiles.size(), 0U);
}

TEST_F(DriverFilesTest, HaveSizeTimeAndBuildId)
{
    const std::string bytes = MakeLibrary({}, "\xAB\xCD");
    fTree.Write("/opt/two/libtwo.so", bytes);
    struct stat status {};
    ASSERT_EQ(::stat((fTree.GetRoot() + "/opt/two/libtwo.so").c_str(), &status), 0);
    const Identity identity = Read();
    const auto file =
        std::find_if(identity.fFiles.begin(), identity.fFiles.end(),
                     [](const DriverFile& f) { return f.fPath == "/opt/two/libtwo.so"; });
    ASSERT_NE(file, identity.fFiles.end());
    EXPECT_EQ(file->fSize, bytes.size());
    EXPECT_EQ(file->fTime, status.st_mtim.tv_sec * 1000000000LL + status.st_mtim.tv_nsec);
    EXPECT_EQ(file->fBuildId, "abcd");
}

// The text of a version, such as the name of the file, stays the same.
TEST_F(DriverFilesTest, ChangeTheIdentityWhenTheyChange)
{
    const Identity before = Read();
    EXPECT_EQ(Read(), before);

    const std::string driver = fTree.GetRoot() + "/usr/lib/libgallium.so";
    const auto time = std::filesystem::last_write_time(driver);
    fTree.Write("/usr/lib/libgallium.so", MakeLibrary({"libLLVM.so", "libdispatch.so.0"}, "2"));
    std::filesystem::last_write_time(driver, time);
    EXPECT_NE(Read(), before) << "another build id";

    fTree.Write("/usr/lib/libgallium.so", MakeLibrary({"libLLVM.so", "libdispatch.so.0"}));
    std::filesystem::last_write_time(driver, time + std::chrono::nanoseconds(1));
    EXPECT_NE(Read(), before) << "another time";

    fTree.Write("/usr/lib/libgallium.so", MakeLibrary({"libLLVM.so", "libdispatch.so.0"}) + "x");
    std::filesystem::last_write_time(driver, time);
    EXPECT_NE(Read(), before) << "another size";

    fTree.Write("/usr/lib/libgallium.so", MakeLibrary({"libLLVM.so", "libdispatch.so.0"}));
    std::filesystem::last_write_time(driver, time);
    EXPECT_EQ(Read(), before) << "the old file again";

    fTree.Remove("/usr/lib/libEGL.so.1");
    fTree.Write("/usr/lib/libEGL.so.2.0.0", MakeLibrary());
    fTree.Link("/usr/lib/libEGL.so.1", "libEGL.so.2.0.0");
    EXPECT_NE(Read(), before) << "another target of the link";
}

TEST_F(DriverFilesTest, ChangeTheIdentityWhenOneIsAddedOrRemoved)
{
    const Identity before = Read();
    fTree.Write("/etc/OpenCL/vendors/new.icd", "libnew.so");
    const Identity withIcd = Read();
    EXPECT_NE(withIcd, before);
    fTree.Write("/usr/lib/libnew.so", MakeLibrary());
    EXPECT_NE(Read(), withIcd);
    fTree.Remove("/etc/OpenCL/vendors/new.icd");
    EXPECT_EQ(Read(), before) << "a library that nothing names";
    fTree.Write("/usr/share/glvnd/egl_vendor.d/10_nvidia.json", MakeVendor("libEGL_nvidia.so.0"));
    EXPECT_NE(Read(), before);
    fTree.Remove("/usr/share/glvnd/egl_vendor.d/10_nvidia.json");
    EXPECT_EQ(Read(), before);
    fTree.Write("/usr/lib/dri/nouveau_dri.so", MakeLibrary());
    EXPECT_NE(Read(), before);
    fTree.Remove("/usr/lib/dri/nouveau_dri.so");
    fTree.Remove("/opt/two/libtwo.so");
    EXPECT_NE(Read(), before);
}

TEST_F(DriverFilesTest, AreThoseThatTheEnvironmentNamesForEGL)
{
    fTree.Write("/home/vendor.json", MakeVendor("/home/libmine.so"));
    fTree.Write("/home/libmine.so", MakeLibrary());
    fProcess.fVariables["__EGL_VENDOR_LIBRARY_FILENAMES"] = "/home/vendor.json:/home/gone.json";
    EXPECT_TRUE(Has("/home/libmine.so"));
    EXPECT_TRUE(Has("/home/vendor.json"));
    EXPECT_FALSE(Has("/usr/lib/libEGL_mesa.so.0"));

    fProcess.fVariables["__EGL_VENDOR_LIBRARY_FILENAMES"] = "";
    EXPECT_FALSE(Has("/home/libmine.so"));
    EXPECT_FALSE(Has("/usr/lib/libEGL_mesa.so.0"));

    fProcess.fVariables = {{"__EGL_VENDOR_LIBRARY_DIRS", "/nowhere:/home"}};
    EXPECT_TRUE(Has("/home/libmine.so"));
    EXPECT_FALSE(Has("/usr/lib/libEGL_mesa.so.0"));

    fTree.Write("/home/dri/iris_dri.so", MakeLibrary());
    fProcess.fVariables = {{"LIBGL_DRIVERS_PATH", "/home/dri"}};
    EXPECT_TRUE(Has("/home/dri/iris_dri.so"));
    EXPECT_FALSE(Has("/usr/lib/dri/iris_dri.so"));

    fTree.Write("/home/libEGL.so.1", MakeLibrary());
    fProcess.fVariables = {{"LD_LIBRARY_PATH", "/home"}};
    EXPECT_TRUE(Has("/home/libEGL.so.1"));
    EXPECT_FALSE(Has("/usr/lib/libEGL.so.1.1.0"));
}

TEST_F(DriverFilesTest, AreThoseOfEachFolderOfLists)
{
    fTree.Write("/opt/libx.so", MakeLibrary());
    for (const std::string folder :
         {"/etc/glvnd/egl_vendor.d", "/usr/share/glvnd/egl_vendor.d",
          "/etc/egl/egl_external_platform.d", "/usr/share/egl/egl_external_platform.d"}) {
        EXPECT_FALSE(Has("/opt/libx.so"));
        fTree.Write(folder + "/20_x.json", MakeVendor("/opt/libx.so"));
        EXPECT_TRUE(Has("/opt/libx.so")) << folder;
        fTree.Remove(folder + "/20_x.json");
    }
    fTree.Write("/home/x.json", MakeVendor("/opt/libx.so"));
    for (const auto& [name, value] : std::map<std::string, std::string>{
             {"__EGL_EXTERNAL_PLATFORM_CONFIG_FILENAMES", "/home/x.json"},
             {"__EGL_EXTERNAL_PLATFORM_CONFIG_DIRS", "/home"}}) {
        fProcess.fVariables = {{name, value}};
        EXPECT_TRUE(Has("/opt/libx.so")) << name;
        EXPECT_TRUE(Has("/usr/lib/libEGL_mesa.so.0")) << "that list is another one";
    }
}

TEST_F(DriverFilesTest, AreThoseThatTheEnvironmentNamesForOpenCL)
{
    fTree.Write("/home/vendors/mine.icd", "/home/libmine.so");
    fTree.Write("/home/libmine.so", MakeLibrary());
    const auto hasMine = [&](const std::string& name, const std::string& value) {
        fProcess.fVariables = {{name, value}};
        return Has("/home/libmine.so");
    };
    EXPECT_TRUE(hasMine("OCL_ICD_VENDORS", "/home/vendors"));
    EXPECT_FALSE(Has("/usr/lib/libone.so"));
    EXPECT_TRUE(hasMine("OCL_ICD_VENDORS", "/home/vendors/mine.icd"));
    EXPECT_FALSE(Has("/usr/lib/libone.so"));
    EXPECT_TRUE(hasMine("OCL_ICD_VENDORS", "/home/libmine.so"));
    EXPECT_FALSE(Has("/usr/lib/libone.so"));
    EXPECT_TRUE(hasMine("OPENCL_VENDOR_PATH", "/home/vendors"));
    EXPECT_FALSE(Has("/usr/lib/libone.so"));
    EXPECT_TRUE(hasMine("OCL_ICD_FILENAMES", "libgone.so:/home/libmine.so"));
    EXPECT_TRUE(Has("/usr/lib/libone.so"));
    EXPECT_TRUE(hasMine("OPENCL_LAYERS", "/home/libmine.so"));
    EXPECT_FALSE(hasMine("OPENCL_LAYER_PATH", "/home/vendors"));
    EXPECT_FALSE(Has("/opt/layer.so"));

    // Of a name without a folder the system's file comes first.
    fProcess.fVariables = {{"OCL_ICD_VENDORS", "one.icd"}};
    EXPECT_TRUE(Has("/usr/lib/libone.so"));
    EXPECT_FALSE(Has("/opt/two/libtwo.so"));
    EXPECT_FALSE(Has("")) << "there is no such file in the folder of the process";
}

TEST_F(DriverFilesTest, AreFoundByTheFoldersOfTheirLoader)
{
    FakeElf loader;
    loader.fRunPath = "/opt/drivers";
    for (const char* name : {"/usr/lib/libEGL.so.1.1.0", "/usr/lib/libOpenCL.so.1"})
        fTree.Write(name, loader.Make());
    fTree.Write("/opt/drivers/libEGL_x.so.0", MakeLibrary());
    fTree.Write("/opt/drivers/libcl_x.so", MakeLibrary());
    fTree.Write("/usr/share/glvnd/egl_vendor.d/60.json", MakeVendor("libEGL_x.so.0"));
    fTree.Write("/etc/OpenCL/vendors/x.icd", "libcl_x.so");
    EXPECT_TRUE(Has("/opt/drivers/libEGL_x.so.0"));
    EXPECT_TRUE(Has("/opt/drivers/libcl_x.so"));
}

TEST_F(DriverFilesTest, HaveTheVariablesThatSelectAmongThem)
{
    const Identity before = Read();
    EXPECT_EQ(before.fVariables, Names());
    fProcess.fVariables = {{"PATH", "/bin"}, {"LIBGL_ALWAYS_SOFTWARE", "1"}};
    const Identity after = Read();
    EXPECT_EQ(after.fVariables, Names{"LIBGL_ALWAYS_SOFTWARE=1"});
    EXPECT_NE(after, before);
    fProcess.fVariables.erase("LIBGL_ALWAYS_SOFTWARE");
    EXPECT_EQ(Read(), before);
}

TEST_F(DriverFilesTest, AreFoundByTheFoldersOfTheProgram)
{
    FakeElf program;
    program.fRunPath = "$ORIGIN/../lib";
    fTree.Write("/app/bin/assay", program.Make());
    fTree.Write("/app/lib/libEGL.so.1", MakeLibrary());
    EXPECT_FALSE(Has("/app/lib/libEGL.so.1"));
    fProcess.fProgram = "/app/bin/assay";
    EXPECT_TRUE(Has("/app/lib/libEGL.so.1"));
}

TEST_F(DriverFilesTest, AreListedOnceUnderOneName)
{
    std::filesystem::create_hard_link(fTree.GetRoot() + "/usr/lib/dri/iris_dri.so",
                                      fTree.GetRoot() + "/usr/lib/dri/crocus_dri.so");
    fTree.Link("/usr/lib/dri/i915_dri.so", "crocus_dri.so");
    EXPECT_TRUE(Has("/usr/lib/dri/crocus_dri.so"));
    EXPECT_FALSE(Has("/usr/lib/dri/iris_dri.so"));
    EXPECT_FALSE(Has("/usr/lib/dri/i915_dri.so"));
}

TEST_F(DriverFilesTest, AreNotThoseThatEachProgramHas)
{
    const Names runtime = {"libc.so.6",  "libm.so.6",     "libdl.so.2",     "libpthread.so.0",
                           "librt.so.1", "libgcc_s.so.1", "libstdc++.so.6", "ld-linux-x86-64.so.2"};
    const Names others = {"libcx.so", "libc.sox", "libdrm.so.2", "libdlx.so", "ld-x.so"};
    Names needed = runtime;
    needed.insert(needed.end(), others.begin(), others.end());
    for (const std::string& name : needed)
        fTree.Write("/usr/lib/" + name, MakeLibrary());
    fTree.Write("/usr/lib/libLLVM.so", MakeLibrary(needed));
    for (const std::string& name : runtime)
        EXPECT_FALSE(Has("/usr/lib/" + name)) << name;
    for (const std::string& name : others)
        EXPECT_TRUE(Has("/usr/lib/" + name)) << name;
}

TEST_F(DriverFilesTest, MayNeedEachOther)
{
    fTree.Write("/usr/lib/libLLVM.so", MakeLibrary({"libgallium.so", "libLLVM.so"}));
    EXPECT_TRUE(Has("/usr/lib/libLLVM.so"));
}

TEST(EglVendor, NamesALibrary)
{
    EXPECT_EQ(FindEglLibrary(MakeVendor("libx.so.0")), "libx.so.0");
    for (const char* text :
         {"", "{", "[]", "null", "{\"ICD\": 1}", "{\"ICD\": {}}", "{\"library_path\": \"x\"}",
          "{\"ICD\": {\"library_path\": 1}}", "{\"ICD\": {\"library_path\": \"\xFF\"}}"})
        EXPECT_EQ(FindEglLibrary(text), "") << text;
}

} // namespace
} // namespace assay_host

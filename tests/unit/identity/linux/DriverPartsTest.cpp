// The libraries that a driver opens from the folders of its parts.
#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <string>
#include <vector>

#include "FakeElf.h"
#include "MachineTree.h"
#include "identity/linux/Machine.h"

namespace assay_host {
namespace {

using testing::Contains;
using testing::Not;
using Names = std::vector<std::string>;

class DriverPartsTest : public testing::Test {
protected:
    DriverPartsTest()
    {
        const std::string library = FakeElf().Make();
        fTree.Write("/usr/lib/libEGL.so.1", library);
        fTree.Write("/usr/share/glvnd/egl_vendor.d/50.json",
                    R"({"ICD": {"library_path": "/opt/mesa/libEGL_mesa.so.0"}})");
        fTree.Write("/opt/mesa/libEGL_mesa.so.0", library);
        fTree.Write("/usr/lib/libOpenCL.so.1", library);
        fTree.Write("/etc/OpenCL/vendors/one.icd", "/opt/mesa/libone.so");
        fTree.Write("/opt/mesa/libone.so", library);
        for (const std::string& folder : kFolders)
            for (const char* name : {"dri/x_dri.so", "gbm/x_gbm.so", "gallium-pipe/x.so",
                                     "pocl/x.so", "dri/x.so", "gbm/x.so"})
                fTree.Write(folder + name, library);
    }

    Names List(DeviceKind kind) const
    {
        Names paths;
        for (const DriverFile& file : GetMachineIdentity(fTree.GetFiles(), fProcess).fFiles)
            if (file.fInterface == kind)
                paths.push_back(file.fPath);
        return paths;
    }

    const Names kFolders = {"/opt/mesa/", "/usr/lib/", "/variable/"};
    MachineTree fTree;
    Process fProcess;
};

TEST_F(DriverPartsTest, AreBesideTheDriverAndInTheSystemsFolder)
{
    const Names gl = List(DeviceKind::kOpenGL);
    const Names cl = List(DeviceKind::kOpenCL);
    for (const std::string folder : {"/opt/mesa/", "/usr/lib/"}) {
        EXPECT_THAT(gl, Contains(folder + "dri/x_dri.so"));
        EXPECT_THAT(gl, Contains(folder + "gbm/x_gbm.so"));
        EXPECT_THAT(cl, Contains(folder + "gallium-pipe/x.so"));
        EXPECT_THAT(cl, Contains(folder + "pocl/x.so"));
        EXPECT_THAT(gl, Not(Contains(folder + "dri/x.so"))) << "another name";
        EXPECT_THAT(gl, Not(Contains(folder + "gbm/x.so")));
        EXPECT_THAT(gl, Not(Contains(folder + "pocl/x.so"))) << "of the other interface";
        EXPECT_THAT(cl, Not(Contains(folder + "dri/x_dri.so")));
    }
    EXPECT_THAT(gl, Not(Contains("/variable/dri/x_dri.so")));
}

TEST_F(DriverPartsTest, AreOnlyInTheFoldersOfTheirVariable)
{
    const struct {
        const char* fVariable;
        DeviceKind fKind;
        std::string fPart;
    } kRows[] = {
        {"LIBGL_DRIVERS_PATH", DeviceKind::kOpenGL, "dri/x_dri.so"},
        {"GBM_BACKENDS_PATH", DeviceKind::kOpenGL, "gbm/x_gbm.so"},
        {"GALLIUM_PIPE_SEARCH_DIR", DeviceKind::kOpenCL, "gallium-pipe/x.so"},
    };
    for (const auto& row : kRows) {
        const std::string folder = row.fPart.substr(0, row.fPart.find('/'));
        fProcess.fVariables = {{row.fVariable, "/variable/" + folder}};
        const Names files = List(row.fKind);
        EXPECT_THAT(files, Contains("/variable/" + row.fPart));
        EXPECT_THAT(files, Not(Contains("/opt/mesa/" + row.fPart)));
        EXPECT_THAT(files, Not(Contains("/usr/lib/" + row.fPart)));
    }
}

} // namespace
} // namespace assay_host

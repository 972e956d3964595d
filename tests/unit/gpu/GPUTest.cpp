#include "pmutil_gpu/GPU.h"

#include <stdexcept>

#include <boost/make_shared.hpp>
#include <boost/weak_ptr.hpp>
#include <gmock/gmock.h>
#include <gtest/gtest.h>

namespace {

using testing::Return;
using testing::StrictMock;

// Mocks the private operations of the probe interface.
class MockImpl : public pmutil::GPUImpl {
public:
    MOCK_METHOD(GLGPUs, DoGetGPUs, (), (override));
    MOCK_METHOD(std::string, DoGetGLVersion, (), (override));
    MOCK_METHOD(std::uint32_t, DoGetGLMemoryMB, (), (override));
    MOCK_METHOD(std::string, DoGetGLName, (), (override));
    MOCK_METHOD(std::string, DoGetGLVendor, (), (override));
    MOCK_METHOD(std::uint32_t, DoGetGLVendorID, (), (override));
    MOCK_METHOD(std::string, DoGetGLDriverVersion, (), (override));
    MOCK_METHOD(std::uint32_t, DoGetGLRectTextureSize, (), (override));
    MOCK_METHOD(std::string, DoGetGLRenderer, (), (override));
    MOCK_METHOD(std::uint32_t, DoGetGLRendererID, (), (override));
    MOCK_METHOD(bool, DoHasGLNPOTSupport, (), (override));
    MOCK_METHOD(std::string, DoGetGLDriver, (), (override));
    MOCK_METHOD(std::string, DoGetGLDriverDate, (), (override));
    MOCK_METHOD(std::string, DoGetGLDriverExtra, (), (override));
    MOCK_METHOD(bool, DoCompileProgramGLSL, (), (override));
    MOCK_METHOD(bool, DoGLFramebufferOK, (), (override));
    MOCK_METHOD(const char*, DoGLGetString, (std::uint32_t), (override));
    MOCK_METHOD(void, DoGLGetIntegerv, (std::uint32_t, std::int32_t*), (override));
    MOCK_METHOD(void, DoGLGetProgramivARB, (std::uint32_t, std::uint32_t, std::int32_t*),
                (override));
    MOCK_METHOD(bool, DoGLIsExtensionSupported, (QGF::OGL::OpenGLExtension), (override));
    MOCK_METHOD(bool, DoIsIntegratedGLGPU, (), (override));
    MOCK_METHOD(CLGPUs, DoGetCLGPUs, (), (override));
    MOCK_METHOD(std::string, DoGetCLPlatformVersion, (), (override));
    MOCK_METHOD(std::uint32_t, DoGetCLMemoryMB, (), (override));
    MOCK_METHOD(std::string, DoGetCLName, (), (override));
    MOCK_METHOD(std::string, DoGetCLVendor, (), (override));
    MOCK_METHOD(std::uint32_t, DoGetCLVendorID, (), (override));
    MOCK_METHOD(std::string, DoGetCLDriverVersion, (), (override));
    MOCK_METHOD(bool, DoGetCUDASupported, (), (override));
    MOCK_METHOD(std::string, DoGetCUDAVersion, (), (override));
    MOCK_METHOD(double, DoGetCLBandwidth, (), (override));
    MOCK_METHOD(double, DoGetCLCompute, (), (override));
    MOCK_METHOD(std::uint64_t, DoGetCLReserved, (), (override));
    MOCK_METHOD(std::string, DoGetCLDeviceVersion, (), (override));
    MOCK_METHOD(bool, DoIsIntegratedCLGPU, (), (override));
};

// A strict mock: each query of a record calls one operation and no other.
class GPUTest : public testing::Test {
protected:
    boost::shared_ptr<StrictMock<MockImpl>> fImpl = boost::make_shared<StrictMock<MockImpl>>();
    pmutil::GLGPU fGL{fImpl};
    pmutil::CLGPU fCL{fImpl};
};

TEST_F(GPUTest, AnOpenGLRecordForwardsEachQuery)
{
    EXPECT_CALL(*fImpl, DoGetGLVersion()).WillOnce(Return("version"));
    EXPECT_EQ(fGL.GetVersion(), "version");
    EXPECT_CALL(*fImpl, DoGetGLMemoryMB()).WillOnce(Return(4294967295U));
    EXPECT_EQ(fGL.GetMemoryMB(), 4294967295U);
    EXPECT_CALL(*fImpl, DoGetGLName()).WillOnce(Return("name"));
    EXPECT_EQ(fGL.GetName(), "name");
    EXPECT_CALL(*fImpl, DoGetGLVendor()).WillOnce(Return("vendor"));
    EXPECT_EQ(fGL.GetVendor(), "vendor");
    EXPECT_CALL(*fImpl, DoGetGLVendorID()).WillOnce(Return(7));
    EXPECT_EQ(fGL.GetVendorID(), 7U);
    EXPECT_CALL(*fImpl, DoGetGLDriverVersion()).WillOnce(Return("driver"));
    EXPECT_EQ(fGL.GetDriverVersion(), "driver");
    EXPECT_CALL(*fImpl, DoIsIntegratedGLGPU()).WillOnce(Return(true));
    EXPECT_TRUE(fGL.IsIntegrated());
}

TEST_F(GPUTest, AnOpenCLRecordForwardsEachQuery)
{
    EXPECT_CALL(*fImpl, DoGetCLPlatformVersion()).WillOnce(Return("version"));
    EXPECT_EQ(fCL.GetVersion(), "version");
    EXPECT_CALL(*fImpl, DoGetCLMemoryMB()).WillOnce(Return(4294967295U));
    EXPECT_EQ(fCL.GetMemoryMB(), 4294967295U);
    EXPECT_CALL(*fImpl, DoGetCLName()).WillOnce(Return("name"));
    EXPECT_EQ(fCL.GetName(), "name");
    EXPECT_CALL(*fImpl, DoGetCLVendor()).WillOnce(Return("vendor"));
    EXPECT_EQ(fCL.GetVendor(), "vendor");
    EXPECT_CALL(*fImpl, DoGetCLVendorID()).WillOnce(Return(7));
    EXPECT_EQ(fCL.GetVendorID(), 7U);
    EXPECT_CALL(*fImpl, DoGetCLDriverVersion()).WillOnce(Return("driver"));
    EXPECT_EQ(fCL.GetDriverVersion(), "driver");
    EXPECT_CALL(*fImpl, DoIsIntegratedCLGPU()).WillOnce(Return(true));
    EXPECT_TRUE(fCL.IsIntegrated());
    EXPECT_CALL(*fImpl, DoGetCUDASupported()).WillOnce(Return(true));
    EXPECT_TRUE(fCL.GetCUDASupported());
    EXPECT_CALL(*fImpl, DoGetCUDAVersion()).WillOnce(Return("12.2"));
    EXPECT_EQ(fCL.GetCUDAVersion(), "12.2");
    EXPECT_CALL(*fImpl, DoGetCLBandwidth()).WillOnce(Return(1.5e11));
    EXPECT_EQ(fCL.GetCLBandwidth(), 1.5e11);
    EXPECT_CALL(*fImpl, DoGetCLReserved()).WillOnce(Return(0));
    EXPECT_EQ(fCL.GetCLReserved(), 0U);
    EXPECT_CALL(*fImpl, DoGetCLDeviceVersion()).WillOnce(Return("1.2"));
    EXPECT_EQ(fCL.GetCLDeviceVersion(), "1.2");
}

TEST_F(GPUTest, ThePublicFormsOnlyForward)
{
    pmutil::GPUImpl& impl = *fImpl;
    std::int32_t result = 0;
    EXPECT_CALL(*fImpl, DoGetGPUs()).WillOnce(Return(pmutil::GPUImpl::GLGPUs(2)));
    EXPECT_EQ(impl.GetGPUs().size(), 2U);
    EXPECT_CALL(*fImpl, DoGetCLGPUs()).WillOnce(Return(pmutil::GPUImpl::CLGPUs(3)));
    EXPECT_EQ(impl.GetCLGPUs().size(), 3U);
    EXPECT_CALL(*fImpl, DoGetGLRectTextureSize()).WillOnce(Return(1));
    EXPECT_EQ(impl.GetGLRectTextureSize(), 1U);
    EXPECT_CALL(*fImpl, DoGetGLRenderer()).WillOnce(Return("renderer"));
    EXPECT_EQ(impl.GetGLRenderer(), "renderer");
    EXPECT_CALL(*fImpl, DoGetGLRendererID()).WillOnce(Return(2));
    EXPECT_EQ(impl.GetGLRendererID(), 2U);
    EXPECT_CALL(*fImpl, DoHasGLNPOTSupport()).WillOnce(Return(true));
    EXPECT_TRUE(impl.HasGLNPOTSupport());
    EXPECT_CALL(*fImpl, DoGetGLDriver()).WillOnce(Return("driver"));
    EXPECT_EQ(impl.GetGLDriver(), "driver");
    EXPECT_CALL(*fImpl, DoGetGLDriverDate()).WillOnce(Return("date"));
    EXPECT_EQ(impl.GetGLDriverDate(), "date");
    EXPECT_CALL(*fImpl, DoGetGLDriverExtra()).WillOnce(Return("extra"));
    EXPECT_EQ(impl.GetGLDriverExtra(), "extra");
    EXPECT_CALL(*fImpl, DoCompileProgramGLSL()).WillOnce(Return(true));
    EXPECT_TRUE(impl.CompileProgramGLSL());
    EXPECT_CALL(*fImpl, DoGLFramebufferOK()).WillOnce(Return(true));
    EXPECT_TRUE(impl.GLFramebufferOK());
    const char text[] = "text";
    EXPECT_CALL(*fImpl, DoGLGetString(5)).WillOnce(Return(text));
    EXPECT_EQ(impl.GLGetString(5), text);
    EXPECT_CALL(*fImpl, DoGLGetIntegerv(6, &result));
    impl.GLGetIntegerv(6, &result);
    EXPECT_CALL(*fImpl, DoGLGetProgramivARB(7, 8, &result));
    impl.GLGetProgramivARB(7, 8, &result);
    EXPECT_CALL(*fImpl, DoGLIsExtensionSupported(QGF::OGL::GL_VERSION_3_0)).WillOnce(Return(true));
    EXPECT_TRUE(impl.GLIsExtensionSupported(QGF::OGL::GL_VERSION_3_0));
    EXPECT_CALL(*fImpl, DoGetCLCompute()).WillOnce(Return(2.5));
    EXPECT_EQ(impl.GetCLCompute(), 2.5);
}

TEST_F(GPUTest, TheReservedFieldOfAnOpenCLRecordIsMinusOne)
{
    EXPECT_EQ(fCL.fReserved, -1);
}

TEST_F(GPUTest, AnExceptionOfAProbePassesThroughTheRecord)
{
    EXPECT_CALL(*fImpl, DoGetGLName()).WillOnce(testing::Throw(std::runtime_error("gone")));
    EXPECT_THROW(fGL.GetName(), std::runtime_error);
}

TEST_F(GPUTest, ARecordKeepsItsImplementationAlive)
{
    const boost::weak_ptr<MockImpl> impl = fImpl;
    {
        const pmutil::GLGPU gpu(fImpl);
        EXPECT_EQ(impl.use_count(), 4);
    }
    EXPECT_EQ(impl.use_count(), 3); // several records share one
}

TEST(GPUDeathTest, ARecordWithoutAnImplementationFailsTheAssertion)
{
    const pmutil::GLGPU gl(nullptr);
    const pmutil::CLGPU cl(nullptr);
    EXPECT_DEATH(gl.GetName(), "px != 0");
    EXPECT_DEATH(cl.GetCLBandwidth(), "px != 0");
}

} // namespace

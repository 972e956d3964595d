#include <gtest/gtest.h>

#include <sstream>
#include <string>

#include "Lines.h"
#include "Samples.h"
#include "report/TextView.h"

namespace assay_host {
namespace {

std::string Print(const std::string& text, const RunOutcome& outcome, int width = 80)
{
    std::ostringstream out;
    PrintText(out, ReadReport(text), outcome, width);
    return out.str();
}

TEST(TextView, OfAGoodMachine)
{
    RunOutcome outcome;
    outcome.fVerdict = Verdict::kComplete;
    outcome.fCommand = {"bin/assay", "-verbose=0"};
    outcome.fExitStatus = 0;
    outcome.fReason = "All tests ran, and the report is whole.";
    outcome.fSeconds = 0.256;
    outcome.fTimeoutSeconds = 60;
    outcome.fLastReportLine =
        "assayEnd=\"2026-11-21_10:49:36\""; // only of a report that isn't whole
    EXPECT_EQ(Print(Sample(1, 1).GetText(), outcome),
              "OpenGL device glgpu[0]: Accelerator 4000\n"
              "----------------------------------------\n"
              "  Adapter                     Accelerator 4000\n"
              "  Renderer                    Accelerator 4000/PCIe/SSE2\n"
              "  Vendor                      Example Corporation\n"
              "  Vendor id                   0x10DE (4318)\n"
              "  Device id                   0x2684 (9860)\n"
              "  Integrated                  no\n"
              "  Memory                      23.99 GiB\n"
              "  OpenGL version              4.1 or later\n"
              "  Shading language            4.60\n"
              "  Driver                      C:\\drivers\\example64.dll\n"
              "  Driver version              31.0.15.2802\n"
              "  Driver date                 2023-01-05\n"
              "  Shaders compile             yes\n"
              "  Framebuffers work           yes\n"
              "  Textures of any size        yes\n"
              "  Max. rectangle texture      32768 x 32768 texels\n"
              "  Limits\n"
              "    Assembly instructions     65536\n"
              "    Textures without shaders  4\n"
              "    Textures in all shaders   192\n"
              "    Vertex shader textures    32\n"
              "    Fragment shader textures  32\n"
              "    Draw buffers              8\n"
              "    Vertex uniforms           4096\n"
              "    Fragment uniforms         4096\n"
              "    Varying floats            124\n"
              "    Vertex attributes         16\n"
              "  Extensions                  GL_ARB_vertex_program, GL_ARB_fragment_program,\n"
              "                              GL_ARB_vertex_shader, GL_ARB_fragment_shader,\n"
              "                              GL_EXT_framebuffer_object,\n"
              "                              GL_ARB_texture_rectangle, GL_ARB_texture_float,\n"
              "                              GL_ARB_occlusion_query,\n"
              "                              GL_ARB_vertex_buffer_object\n"
              "  Extensions missing          GL_ARB_shader_texture_lod\n"
              "\n"
              "OpenCL device clgpu[0]: Accelerator 4000\n"
              "----------------------------------------\n"
              "  Name              Accelerator 4000\n"
              "  Vendor            Example Corporation\n"
              "  Vendor id         0x10DE (4318)\n"
              "  Integrated        no\n"
              "  Memory            23.99 GiB\n"
              "  OpenCL version    3.0 CUDA\n"
              "  Platform version  3.0\n"
              "  Driver version    528.02\n"
              "  Copy bandwidth    834.5 GB/s\n"
              "  Compute score     1234.56 (no unit; more is better)\n"
              "  CUDA              yes\n"
              "  CUDA version      12.0.89\n"
              "\n"
              "Run: all tests ran\n"
              "------------------\n"
              "  What happened         All tests ran, and the report is whole.\n"
              "  OpenGL                hardware (glgpu[0]): OpenGL works on graphics hardware.\n"
              "  OpenCL                hardware (clgpu[0]): OpenCL works on graphics hardware.\n"
              "  Exit status of assay  0\n"
              "  Command               bin/assay -verbose=0\n"
              "  Time                  0.26 s (limit 60 s)\n"
              "  Devices               1 OpenGL, 1 OpenCL\n");
}

TEST(TextView, OfACrashAndABadDevice)
{
    RunOutcome outcome;
    outcome.fVerdict = Verdict::kCrashed;
    outcome.fCommand = {"assay"};
    outcome.fTermination = "signal 11 (Segmentation fault)";
    outcome.fReason = "A driver crashed.";
    outcome.fSeconds = 1.5;
    outcome.fLastReportLine = "glgpu[1].GLDriverDate=\"\"";
    outcome.fLastLogLine = "# 00004 compiling";
    for (int line = 0; line < 12; ++line)
        outcome.fErrorLines.push_back("error " + std::to_string(line));
    outcome.fErrorLines.emplace_back();
    const std::string report = Sample(2, 0)
                                   .Set("glgpu[0].GLRenderer", "\"softpipe\"")
                                   .Set("glgpu[0].GLName", "\"\"")
                                   .Fail("glgpu[0]", "GLDriver")
                                   .Set("glgpu[1].GLName", "\"Evil \x1B[2J\xFF\"")
                                   .EndAfter("glgpu[1].GLDriverDate")
                                   .GetText();
    EXPECT_EQ(Print(report + "# 00004 compiling\n", outcome, 70),
              "Warnings\n"
              "--------\n"
              "  !  glgpu[0]: software renderer, no graphics hardware: softpipe\n"
              "  !  glgpu[0]: matches no adapter of the system (no name)\n"
              "  !  glgpu[0]: a test failed: no answer from GLDriver on\n"
              "\n"
              "OpenGL device glgpu[0]: softpipe\n"
              "--------------------------------\n"
              "  Adapter                 none (no adapter of the system matches)\n"
              "  Renderer                softpipe\n"
              "  Vendor                  Example Corporation\n"
              "  Vendor id               0x10DE (4318)\n"
              "  Device id               0x2684 (9860)\n"
              "  Integrated              no\n"
              "  Memory                  23.99 GiB\n"
              "  OpenGL version          4.1 or later\n"
              "  Driver version          31.0.15.2802\n"
              "  Textures of any size    yes\n"
              "  Max. rectangle texture  32768 x 32768 texels\n"
              "  No answer               Driver, Driver date, Shaders compile,\n"
              "                          Framebuffers work, Shading language, all\n"
              "                          limits, all extensions (device failed\n"
              "                          before)\n"
              "\n"
              "OpenGL device glgpu[1]: Evil \\x1B[2J\\xFF\n"
              "----------------------------------------\n"
              "  Adapter                 Evil \\x1B[2J\\xFF\n"
              "  Renderer                Accelerator 4000/PCIe/SSE2\n"
              "  Vendor                  Example Corporation\n"
              "  Vendor id               0x10DE (4318)\n"
              "  Device id               0x2684 (9860)\n"
              "  Integrated              no\n"
              "  Memory                  23.99 GiB\n"
              "  OpenGL version          4.1 or later\n"
              "  Driver                  C:\\drivers\\example64.dll\n"
              "  Driver version          31.0.15.2802\n"
              "  Driver date             2023-01-05\n"
              "  Textures of any size    yes\n"
              "  Max. rectangle texture  32768 x 32768 texels\n"
              "  No answer               Shaders compile, Framebuffers work, Shading\n"
              "                          language, all limits, all extensions (run\n"
              "                          ended before)\n"
              "\n"
              "Run: crashed\n"
              "------------\n"
              "  What happened     A driver crashed.\n"
              "  OpenGL            broken (glgpu[1]): assay crashed in OpenGL, while\n"
              "                    compiling shaders\n"
              "                    (glgpu[1].CanCompileProgramGLSL).\n"
              "  OpenCL            unknown: The run ended before OpenCL was tried.\n"
              "  What to do        Update the graphics driver, or reinstall it.\n"
              "                    If the newest driver fails too, report it to the\n"
              "                    driver's developers, with the archive of\n"
              "                    assay-host bugreport.\n"
              "  Ended by          signal 11 (Segmentation fault)\n"
              "  Command           assay\n"
              "  Time              1.50 s\n"
              "  Devices           2 OpenGL, OpenCL not reached\n"
              "  Last report line  glgpu[1].GLDriverDate=\"\"\n"
              "  Last log line     # 00004 compiling\n"
              "  Next line         glgpu[1].CanCompileProgramGLSL\n"
              "  Standard error    (3 earlier lines)\n"
              "                    error 3\n"
              "                    error 4\n"
              "                    error 5\n"
              "                    error 6\n"
              "                    error 7\n"
              "                    error 8\n"
              "                    error 9\n"
              "                    error 10\n"
              "                    error 11\n"
              "                    (empty)\n");
}

TEST(TextView, OfAChildThatNeverStarted)
{
    RunOutcome outcome;
    outcome.fCommand = {"nothing"};
    outcome.fReason = "There is no such file.";
    outcome.fLastLogLine = "# of another run";
    EXPECT_EQ(Print("", outcome),
              "Run: did not start\n"
              "------------------\n"
              "  What happened  There is no such file.\n"
              "  OpenGL         unknown: assay could not be started.\n"
              "  OpenCL         unknown: assay could not be started.\n"
              "  What to do     Check that assay is installed beside assay-host or on the PATH,\n"
              "                 or name it with --assay.\n"
              "  Command        nothing\n"
              "  Time           0.00 s\n");
    // The smallest width.
    outcome.fReason = std::string(30, 'x');
    const std::string narrow = Print("", outcome, 0);
    EXPECT_NE(narrow.find("  What happened  " + std::string(23, 'x') + "\n"), std::string::npos)
        << narrow;
}

TEST(TextView, OfAChildWithoutAReport)
{
    RunOutcome outcome;
    outcome.fVerdict = Verdict::kUsageError;
    outcome.fExitStatus = 3;
    outcome.fCommand = {"assay", "-help"};
    outcome.fErrorLines = {"Usage exception: usage"};
    EXPECT_EQ(Print("x\n", outcome, 40), "Run: options rejected\n"
                                         "---------------------\n"
                                         "  OpenGL                unknown: assay\n"
                                         "                        rejected its command\n"
                                         "                        line.\n"
                                         "  OpenCL                unknown: assay\n"
                                         "                        rejected its command\n"
                                         "                        line.\n"
                                         "  What to do            Correct assay's\n"
                                         "                        options, those after\n"
                                         "                        \"--\"; assay -help\n"
                                         "                        lists them.\n"
                                         "  Exit status of assay  3\n"
                                         "  Command               assay -help\n"
                                         "  Time                  0.00 s\n"
                                         "  Standard error        Usage exception:\n"
                                         "                        usage\n"
                                         "  Other lines           x\n");
}

TEST(TextView, HasUnknownKeys)
{
    const std::string text = Print(Sample(1, -1).GetText() + "glgpu[0].Extra=\"1\t2\"\n", {});
    EXPECT_NE(text.find("  Others\n    Extra                     1\\t2\n"), std::string::npos)
        << text;
    EXPECT_NE(text.find("  Devices     1 OpenGL, no OpenCL\n"), std::string::npos) << text;
}

TEST(TextView, ListsExtensionsWithUnclearOrMissingAnswers)
{
    const std::string text =
        Print(Sample(1, 0)
                  .Set("glgpu[0].extension[QGF::OGL::GL_ARB_VERTEX_PROGRAM]", "2")
                  .Set("glgpu[0].extension[QGF::OGL::GL_ARB_TEXTURE_FLOAT]", "")
                  .GetText(),
              {});
    EXPECT_NE(text.find("  Extensions, unclear         GL_ARB_vertex_program=2\n"),
              std::string::npos)
        << text;
    EXPECT_NE(text.find("  No answer                   GL_ARB_texture_float (no readable line)\n"),
              std::string::npos)
        << text;
}

TEST(TextView, EscapesWhatControlsATerminal)
{
    std::string bytes;
    for (int byte = 0; byte < 256; ++byte)
        bytes += static_cast<char>(byte);
    RunOutcome outcome;
    outcome.fVerdict = Verdict::kHung;
    outcome.fCommand = {bytes};
    outcome.fTermination = bytes;
    outcome.fReason = bytes;
    outcome.fLastReportLine = bytes;
    outcome.fLastLogLine = bytes;
    outcome.fErrorLines = {bytes};
    const std::string value = "\"" + bytes + "\"";
    const std::string report = Sample(1, 1)
                                   .Set("glgpu[0].GLName", value)
                                   .Set("glgpu[0].GLRenderer", "\"llvmpipe" + bytes + "\"")
                                   .Set("glgpu[0].GLMemoryMB", bytes.substr(11))
                                   .Set("clgpu[0].CLBandwidth", bytes.substr(11))
                                   .EndAfter("clgpu[0].CLBandwidth")
                                   .GetText();
    for (const char character : Print(report + bytes, outcome, 0))
        EXPECT_TRUE(character == '\n' || (character >= ' ' && character <= '~'));
}

} // namespace
} // namespace assay_host

#include "report/Explanations.h"

#include <algorithm>
#include <iterator>
#include <stdexcept>

namespace assay_host {

namespace {

constexpr char kAdapterLists[] =
    "the system's adapter lists: WMI and DXGI on Windows, sysfs and DRM on Linux";
constexpr char kExtensions[] = "glGetString(GL_VERSION) and the list of extensions";
constexpr char kTextures[] = "textures";
constexpr char kComponents[] = "components of four bytes";

constexpr Explanation kExplanations[] = {
    {"Tester", "Which sequence of tests the report is of. There is one.", "", "assay"},
    {"assayStart", "The local time at which the tests began.", "", "the system's clock"},
    {"QGFCoreInitialized",
     "Whether the graphics library of assay could be initialized. Without it there are no devices.",
     "", "assay"},
    {"QGFOGLInitialized",
     "Whether there is an OpenGL library with at least one display device. If not, no OpenGL "
     "driver "
     "is installed, or this user may not open the card.",
     "", "EGL on Linux, WGL on Windows"},
    {"OGLContextCreated",
     "Whether an OpenGL context could be created on the first display device. Other devices may "
     "work "
     "all the same.",
     "", "eglCreateContext, or wglCreateContext"},
    {"NumGLGPUs",
     "How many display devices an OpenGL context could be created on. Each is a glgpu of the "
     "report. A "
     "software renderer counts too.",
     "devices", "EGL's list of devices, or the display devices of Windows"},
    {"NumCLGPUs",
     "How many OpenCL devices of the type GPU there are. Each is a clgpu of the report. An OpenCL "
     "driver "
     "for the processor is none, so a machine may have OpenCL and still 0 here.",
     "devices", "clGetDeviceIDs(CL_DEVICE_TYPE_GPU)"},
    {"assayEnd",
     "The local time at which the tests ended. If it is missing, the report broke off: a driver "
     "crashed "
     "or hung, or the run was ended.",
     "", "the system's clock"},

    {"GLVersion",
     "The newest version of OpenGL that the context offers, from 1.2 to 4.1. A driver with a newer "
     "one is "
     "reported as 4.1, so 4.1 means 4.1 or later.",
     "", "glGetString(GL_VERSION)"},
    {"IsIntegratedGLGPU",
     "Whether the device shares the processor's memory: an AMD or Intel device with less than 128 "
     "MiB of "
     "its own. An integrated device with more than that reserved for it is reported as not "
     "integrated.",
     "", kAdapterLists},
    {"GLMemoryMB",
     "The device's memory, the largest figure of all sources. For an integrated device a part of "
     "the "
     "machine's memory is counted. 0 means that no source has it, as with a software renderer.",
     "MiB", "the system's adapter lists, and a query of AMD's and NVIDIA's drivers"},
    {"GLName",
     "The adapter's name in the system's list. It is empty if no adapter of the list matches the "
     "OpenGL "
     "device, as with a software renderer.",
     "", kAdapterLists},
    {"GLVendor", "Who made the driver, as the driver says. It need not be who made the device.", "",
     "glGetString(GL_VENDOR)"},
    {"GLVendorID",
     "The PCI number of who made the device: 4098 is AMD, 4318 NVIDIA, 32902 Intel. 0 means that "
     "no "
     "adapter of the system's list matches the device.",
     "", kAdapterLists},
    {"GLDriverVersion",
     "The version of the system's driver. \"?\" means that the lists do not have it.", "",
     kAdapterLists},
    {"GLRectTextureSize",
     "The largest width and height of a rectangle texture, and so of an image that can be worked "
     "on in "
     "one piece. Devices of the last ten years have 16384 or more.",
     "texels", "glGetIntegerv(GL_MAX_RECTANGLE_TEXTURE_SIZE)"},
    {"GLRenderer",
     "What draws, as the driver says. Names such as llvmpipe, softpipe, SwiftShader and GDI "
     "Generic are "
     "software on the processor.",
     "", "glGetString(GL_RENDERER)"},
    {"GLRendererID",
     "The PCI number of the device's model. 0 means that no adapter of the system's list matches "
     "it.",
     "", kAdapterLists},
    {"HasGLNPOTSupport",
     "Whether textures may have any size, not only powers of two. OpenGL 2.0 has it.", "",
     kExtensions},
    {"GLDriver",
     "The name or the files of the system's driver. \"?\" means that the lists do not have it.", "",
     kAdapterLists},
    {"GLDriverDate",
     "The date of the system's driver. An old one is a reason to update. \"?\" means that the "
     "lists do "
     "not have it.",
     "", kAdapterLists},
    {"CanCompileProgramGLSL",
     "A trial: whether a realistic pair of shaders compiles and links. A driver that fails here "
     "can't be "
     "used for drawing with shaders, whatever version it reports.",
     "", "glCompileShader and glLinkProgram"},
    {"GLFrameBufferOK",
     "A trial: whether a framebuffer object can be created, is complete and can be drawn to. A "
     "driver that "
     "fails here can't draw into a texture.",
     "", "glCheckFramebufferStatus and glClear"},
    {"glGetString[GL_SHADING_LANGUAGE_VERSION]",
     "The newest version of the shading language, 4.50 for OpenGL 4.5. The text is the driver's "
     "and may "
     "have more words.",
     "", "glGetString(GL_SHADING_LANGUAGE_VERSION)"},
    {"glGetProgramivARB[GL_FRAGMENT_PROGRAM_ARB][GL_MAX_PROGRAM_INSTRUCTIONS_ARB]",
     "The longest fragment program in assembly language, of old software. It limits no GLSL "
     "shader.",
     "instructions", "glGetProgramivARB"},
    {"glGetIntegerv[GL_MAX_TEXTURE_UNITS]",
     "How many textures can be used at once without shaders. 4 or 8 is usual; shaders can use "
     "more.",
     kTextures, "glGetIntegerv"},
    {"glGetIntegerv[GL_MAX_COMBINED_TEXTURE_IMAGE_UNITS]",
     "How many textures all stages of a program can use together.", kTextures, "glGetIntegerv"},
    {"glGetIntegerv[GL_MAX_VERTEX_TEXTURE_IMAGE_UNITS]",
     "How many textures a vertex shader can use. 0 means that it can use none.", kTextures,
     "glGetIntegerv"},
    {"glGetIntegerv[GL_MAX_TEXTURE_IMAGE_UNITS]",
     "How many textures a fragment shader can use. OpenGL 3 and later have at least 16.", kTextures,
     "glGetIntegerv"},
    {"glGetIntegerv[GL_MAX_DRAW_BUFFERS]",
     "How many images a fragment shader can write at once. OpenGL 3 and later have at least 8.",
     "buffers", "glGetIntegerv"},
    {"glGetIntegerv[GL_MAX_VERTEX_UNIFORM_COMPONENTS]",
     "How much constant data a vertex shader can have outside of buffers.", kComponents,
     "glGetIntegerv"},
    {"glGetIntegerv[GL_MAX_FRAGMENT_UNIFORM_COMPONENTS]",
     "How much constant data a fragment shader can have outside of buffers.", kComponents,
     "glGetIntegerv"},
    {"glGetIntegerv[GL_MAX_VARYING_FLOATS]",
     "How many numbers a vertex shader can pass to a fragment shader. OpenGL 3 and later have at "
     "least 60.",
     "numbers", "glGetIntegerv"},
    {"glGetIntegerv[GL_MAX_VERTEX_ATTRIBS]",
     "How many attributes of four numbers each a vertex can have. OpenGL 2 and later have at least "
     "16.",
     "attributes", "glGetIntegerv"},
    {"extension[QGF::OGL::GL_ARB_VERTEX_PROGRAM]",
     "Whether the driver offers vertex programs in assembly language. Only old software needs "
     "them.",
     "", kExtensions},
    {"extension[QGF::OGL::GL_ARB_FRAGMENT_PROGRAM]",
     "Whether the driver offers fragment programs in assembly language. Only old software needs "
     "them.",
     "", kExtensions},
    {"extension[QGF::OGL::GL_ARB_VERTEX_SHADER]",
     "Whether the driver offers vertex shaders: OpenGL 2.0, or the extension.", "", kExtensions},
    {"extension[QGF::OGL::GL_ARB_FRAGMENT_SHADER]",
     "Whether the driver offers fragment shaders: OpenGL 2.0, or the extension.", "", kExtensions},
    {"extension[QGF::OGL::GL_EXT_FRAMEBUFFER_OBJECT]",
     "Whether the driver offers framebuffer objects: OpenGL 3.0, or an extension. The trial says "
     "whether "
     "they work.",
     "", kExtensions},
    {"extension[QGF::OGL::GL_ARB_TEXTURE_RECTANGLE]",
     "Whether the driver offers rectangle textures: OpenGL 3.1, or an extension.", "", kExtensions},
    {"extension[QGF::OGL::GL_ARB_TEXTURE_FLOAT]",
     "Whether the driver offers textures of floating-point numbers in all formats, those of "
     "luminance and "
     "alpha too, which only an extension has.",
     "", kExtensions},
    {"extension[QGF::OGL::GL_ARB_OCCLUSION_QUERY]",
     "Whether the driver can count visible samples: OpenGL 1.5, or the extension.", "",
     kExtensions},
    {"extension[QGF::OGL::GL_ARB_VERTEX_BUFFER_OBJECT]",
     "Whether the driver offers vertex buffers: OpenGL 1.5, or the extension.", "", kExtensions},
    {"extension[QGF::OGL::GL_ARB_SHADER_TEXTURE_LOD]",
     "Whether a fragment shader can choose the level of detail of a texture by the extension.", "",
     kExtensions},

    {"CLPlatformVersion", "The OpenCL version of the platform, which is the driver as a whole.", "",
     "clGetPlatformInfo(CL_PLATFORM_VERSION)"},
    {"CLDeviceVersion", "The OpenCL version that the device supports.", "",
     "clGetDeviceInfo(CL_DEVICE_VERSION)"},
    {"IsIntegratedCLGPU",
     "Whether the device and the processor share one memory. 0 also if the driver does not report "
     "it.",
     "", "clGetDeviceInfo(CL_DEVICE_HOST_UNIFIED_MEMORY)"},
    {"CLMemoryMB",
     "The device's global memory. Of an integrated device it is a part of the machine's memory.",
     "MiB", "clGetDeviceInfo(CL_DEVICE_GLOBAL_MEM_SIZE)"},
    {"CLName", "The device's name, as the driver says.", "", "clGetDeviceInfo(CL_DEVICE_NAME)"},
    {"CLVendor", "Who made the device, as the driver says.", "",
     "clGetDeviceInfo(CL_DEVICE_VENDOR)"},
    {"CLVendorID", "The number of who made the device, often the PCI number.", "",
     "clGetDeviceInfo(CL_DEVICE_VENDOR_ID)"},
    {"CLDriverVersion", "The version of the OpenCL driver, in its own form.", "",
     "clGetDeviceInfo(CL_DRIVER_VERSION)"},
    {"CUDASupported", "Whether the platform's version names a CUDA version, as NVIDIA's does.", "",
     "clGetPlatformInfo(CL_PLATFORM_VERSION)"},
    {"CUDAVersion", "The CUDA version of the platform. Other platforms than NVIDIA's have none.",
     "", "clGetPlatformInfo(CL_PLATFORM_VERSION)"},
    {"CLBandwidth",
     "How fast the device copies inside its own memory, reads and writes counted: the best of up "
     "to ten "
     "batches of ten copies of 16 MiB. More is better. A low value on a fast card points to a "
     "saving "
     "mode, a wrong slot or another program. 0 means that the device's clock showed no time.",
     "bytes per second", "clEnqueueCopyBuffer, timed by the device's clock"},
    {"CLCompute",
     "How fast the device computes: 8 divided by the seconds of a fixed computation. More is "
     "better, and "
     "twice the score is twice as fast. It compares devices of one kind, no more. 0 means that the "
     "device's clock showed no time.",
     "a score without a unit", "clEnqueueNDRangeKernel, timed by the device's clock"},
};

} // namespace

const Explanation& GetExplanation(const KnownKey& key)
{
    const auto found = std::find_if(
        std::begin(kExplanations), std::end(kExplanations),
        [&key](const Explanation& explanation) { return key.fKey == explanation.fKey; });
    if (found == std::end(kExplanations))
        throw std::logic_error("no explanation of " + key.fKey);
    return *found;
}

} // namespace assay_host

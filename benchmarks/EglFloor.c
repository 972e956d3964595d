// Makes only the EGL and OpenGL calls of the program: the same calls with the same arguments in the
// same order, on the first device. compare_eglinfo.py checks that and times both. Requires a driver
// with devices, surfaceless contexts and contexts without a configuration, such as Mesa's software
// renderer.
#include <dlfcn.h>
#include <stdio.h>
#include <stdlib.h>

#define EGL_EGLEXT_PROTOTYPES
#include <EGL/egl.h>
#include <EGL/eglext.h>
#define GL_GLEXT_PROTOTYPES
#include <GL/gl.h>
#include <GL/glext.h>

#include "EglFloorShaders.h"

// Entry points of the dynamic loader, then of EGL, in the order in which the program looks them up.
#define LIBRARY_FUNCTIONS(X)                                                                       \
    X(eglGetProcAddress)                                                                           \
    X(eglQueryString)                                                                              \
    X(eglInitialize)                                                                               \
    X(eglBindAPI)                                                                                  \
    X(eglCreateContext)                                                                            \
    X(eglDestroyContext)                                                                           \
    X(eglMakeCurrent)
#define EGL_FUNCTIONS(X)                                                                           \
    X(eglGetPlatformDisplayEXT)                                                                    \
    X(eglQueryDevicesEXT)                                                                          \
    X(eglQueryDeviceStringEXT)
#define GL_FUNCTIONS(X)                                                                            \
    X(glGetString)                                                                                 \
    X(glGetStringi)                                                                                \
    X(glGetError)                                                                                  \
    X(glGetIntegerv)                                                                               \
    X(glGetProgramivARB)                                                                           \
    X(glClearColor)                                                                                \
    X(glClear)                                                                                     \
    X(glCreateShader)                                                                              \
    X(glShaderSource)                                                                              \
    X(glCompileShader)                                                                             \
    X(glGetShaderiv)                                                                               \
    X(glGetShaderInfoLog)                                                                          \
    X(glDeleteShader)                                                                              \
    X(glCreateProgram)                                                                             \
    X(glAttachShader)                                                                              \
    X(glLinkProgram)                                                                               \
    X(glGetProgramiv)                                                                              \
    X(glGetProgramInfoLog)                                                                         \
    X(glDeleteProgram)                                                                             \
    X(glGenTextures)                                                                               \
    X(glBindTexture)                                                                               \
    X(glTexParameteri)                                                                             \
    X(glTexImage2D)                                                                                \
    X(glGenerateMipmap)                                                                            \
    X(glDeleteTextures)                                                                            \
    X(glGenFramebuffers)                                                                           \
    X(glBindFramebuffer)                                                                           \
    X(glFramebufferTexture2D)                                                                      \
    X(glCheckFramebufferStatus)                                                                    \
    X(glDeleteFramebuffers)

#define DECLARE(name) static __typeof__(&name) p_##name;
LIBRARY_FUNCTIONS(DECLARE)
EGL_FUNCTIONS(DECLARE)
GL_FUNCTIONS(DECLARE)

static EGLDisplay display;
static EGLContext context;

static void require(int holds, const char* what)
{
    if (!holds) {
        fprintf(stderr, "egl_floor: %s failed\n", what);
        exit(1);
    }
}

static void begin(void)
{
    require(p_eglBindAPI(EGL_OPENGL_API) == EGL_TRUE, "eglBindAPI");
    require(p_eglMakeCurrent(display, EGL_NO_SURFACE, EGL_NO_SURFACE, context) == EGL_TRUE,
            "eglMakeCurrent");
}

static void end(void)
{
    p_eglMakeCurrent(display, EGL_NO_SURFACE, EGL_NO_SURFACE, EGL_NO_CONTEXT);
}

static EGLContext create(void)
{
    const EGLint attributes[] = {EGL_NONE};
    require(p_eglBindAPI(EGL_OPENGL_API) == EGL_TRUE, "eglBindAPI");
    const EGLContext made =
        p_eglCreateContext(display, EGL_NO_CONFIG_KHR, EGL_NO_CONTEXT, attributes);
    require(made != EGL_NO_CONTEXT, "eglCreateContext");
    return made;
}

static void open_display(void)
{
    void* const library = dlopen("libEGL.so.1", RTLD_NOW | RTLD_LOCAL);
    require(library != NULL, "dlopen");
#define LOAD(name) require((p_##name = (__typeof__(&name))dlsym(library, #name)) != NULL, #name);
    LIBRARY_FUNCTIONS(LOAD)
#define GET(name)                                                                                  \
    require((p_##name = (__typeof__(&name))p_eglGetProcAddress(#name)) != NULL, #name);
    EGL_FUNCTIONS(GET)
    p_eglQueryString(EGL_NO_DISPLAY, EGL_EXTENSIONS);
    EGLDeviceEXT devices[16];
    EGLint count = 0;
    require(p_eglQueryDevicesEXT(0, NULL, &count) == EGL_TRUE && count > 0, "eglQueryDevicesEXT");
    count = count < 16 ? count : 16;
    require(p_eglQueryDevicesEXT(count, devices, &count) == EGL_TRUE, "eglQueryDevicesEXT");
    for (EGLint i = 0; i < count; ++i)
        p_eglQueryDeviceStringEXT(devices[i], EGL_EXTENSIONS);
    display = p_eglGetPlatformDisplayEXT(EGL_PLATFORM_DEVICE_EXT, devices[0], NULL);
    require(p_eglInitialize(display, &(EGLint){0}, &(EGLint){0}) == EGL_TRUE, "eglInitialize");
    p_eglQueryString(display, EGL_EXTENSIONS);
}

static void find_extensions(void)
{
    begin();
    GL_FUNCTIONS(GET)
    p_glGetString(GL_VERSION);
    GLint count = 0;
    p_glGetIntegerv(GL_NUM_EXTENSIONS, &count);
    for (GLint i = 0; i < count; ++i)
        p_glGetStringi(GL_EXTENSIONS, (GLuint)i);
    end();
}

static void ask_text(GLenum name)
{
    begin();
    p_glGetString(name);
    p_glGetError();
    end();
}

static void ask_number(GLenum name)
{
    GLint result[2] = {0};
    begin();
    p_glGetIntegerv(name, result);
    p_glGetError();
    end();
}

static void ask_program_number(void)
{
    GLint result = 0;
    begin();
    p_glGetProgramivARB(GL_FRAGMENT_PROGRAM_ARB, GL_MAX_PROGRAM_INSTRUCTIONS_ARB, &result);
    p_glGetError();
    end();
}

static void ask_nothing(void)
{
    begin();
    end();
}

static void compile(GLuint program, GLenum kind, GLsizei count, const char* const* lines)
{
    GLint result = 0;
    const GLuint shader = p_glCreateShader(kind);
    p_glShaderSource(shader, count, lines, NULL);
    p_glCompileShader(shader);
    p_glGetShaderiv(shader, GL_COMPILE_STATUS, &result);
    require(result == GL_TRUE, "glCompileShader");
    p_glAttachShader(program, shader);
    p_glDeleteShader(shader);
}

static void try_shaders(void)
{
    GLint result = 0;
    begin();
    const GLuint program = p_glCreateProgram();
    compile(program, GL_VERTEX_SHADER, floor_vertex_shader_count, floor_vertex_shader);
    compile(program, GL_FRAGMENT_SHADER, floor_fragment_shader_count, floor_fragment_shader);
    p_glLinkProgram(program);
    p_glGetProgramiv(program, GL_LINK_STATUS, &result);
    require(result == GL_TRUE, "glLinkProgram");
    p_glDeleteProgram(program);
    end();
}

static void try_framebuffer(void)
{
    GLuint texture = 0;
    GLuint framebuffer = 0;
    begin();
    p_glGenTextures(1, &texture);
    p_glBindTexture(GL_TEXTURE_2D, texture);
    p_glTexParameteri(GL_TEXTURE_2D, GL_TEXTURE_MIN_FILTER, GL_LINEAR);
    p_glTexImage2D(GL_TEXTURE_2D, 0, GL_RGBA8, 32, 32, 0, GL_RGBA, GL_UNSIGNED_BYTE, NULL);
    p_glBindTexture(GL_TEXTURE_2D, 0);
    p_glGenFramebuffers(1, &framebuffer);
    p_glBindFramebuffer(GL_FRAMEBUFFER, framebuffer);
    p_glFramebufferTexture2D(GL_FRAMEBUFFER, GL_COLOR_ATTACHMENT0, GL_TEXTURE_2D, texture, 0);
    p_glCheckFramebufferStatus(GL_FRAMEBUFFER);
    p_glClearColor(255, 255, 255, 255);
    p_glClear(GL_COLOR_BUFFER_BIT);
    p_glBindFramebuffer(GL_FRAMEBUFFER, 0);
    p_glGetError();
    p_glDeleteFramebuffers(1, &framebuffer);
    p_glDeleteTextures(1, &texture);
    end();
}

int main(void)
{
    static const GLenum limits[] = {
        GL_MAX_TEXTURE_UNITS_ARB,
        GL_MAX_COMBINED_TEXTURE_IMAGE_UNITS,
        GL_MAX_VERTEX_TEXTURE_IMAGE_UNITS,
        GL_MAX_TEXTURE_IMAGE_UNITS,
        GL_MAX_DRAW_BUFFERS,
        GL_MAX_VERTEX_UNIFORM_COMPONENTS,
        GL_MAX_FRAGMENT_UNIFORM_COMPONENTS,
        GL_MAX_VARYING_FLOATS,
        GL_MAX_VERTEX_ATTRIBS,
    };
    open_display();
    p_eglDestroyContext(display, create());
    context = create();
    find_extensions();
    ask_text(GL_VENDOR);
    ask_number(GL_MAX_RECTANGLE_TEXTURE_SIZE_ARB);
    ask_text(GL_RENDERER);
    ask_nothing();
    try_shaders();
    try_framebuffer();
    ask_text(GL_SHADING_LANGUAGE_VERSION);
    ask_program_number();
    for (size_t i = 0; i < sizeof limits / sizeof *limits; ++i)
        ask_number(limits[i]);
    for (int i = 0; i < 10; ++i)
        ask_nothing();
    p_eglDestroyContext(display, context);
    return 0;
}

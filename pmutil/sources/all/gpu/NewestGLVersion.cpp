#include "all/gpu/NewestGLVersion.h"

namespace pmutil {

namespace {

struct VersionText {
    QGF::OGL::OpenGLExtension version;
    const char* text;
};

// Newest first. GL_IMAGING_1_2 isn't listed: the imaging subset is optional and implies no version.
constexpr VersionText kVersions[] = {
    {QGF::OGL::GL_VERSION_4_1, "4.1"}, {QGF::OGL::GL_VERSION_4_0, "4.0"},
    {QGF::OGL::GL_VERSION_3_3, "3.3"}, {QGF::OGL::GL_VERSION_3_2, "3.2"},
    {QGF::OGL::GL_VERSION_3_1, "3.1"}, {QGF::OGL::GL_VERSION_3_0, "3.0"},
    {QGF::OGL::GL_VERSION_2_1, "2.1"}, {QGF::OGL::GL_VERSION_2_0, "2.0"},
    {QGF::OGL::GL_VERSION_1_5, "1.5"}, {QGF::OGL::GL_VERSION_1_4, "1.4"},
    {QGF::OGL::GL_VERSION_1_3, "1.3"}, {QGF::OGL::GL_VERSION_1_2, "1.2"},
};

} // namespace

const char*
NewestGLVersion(const std::function<bool(QGF::OGL::OpenGLExtension version)>& isSupported)
{
    for (const VersionText& version : kVersions)
        if (isSupported(version.version))
            return version.text;
    return nullptr;
}

} // namespace pmutil

// Advices by the C interface, with the test child in place of assay.
#pragma once

#include <filesystem>
#include <random>
#include <string>

#include <boost/filesystem/operations.hpp>

#include <assay_host.h>

#include "Runs.h"

// The report of a machine with one card, whose OpenGL works, without OpenCL.
const Words kWorks = {"out", "assayStart=\"x\"",
                      "out", "QGFCoreInitialized=1",
                      "out", "QGFOGLInitialized=1",
                      "out", "OGLContextCreated=1",
                      "out", "NumGLGPUs=1",
                      "out", "gputag.glgpu[0]=1",
                      "out", "glgpu[0].GLVersion=\"4.6\"",
                      "out", "glgpu[0].GLRenderer=\"Renderer\"",
                      "out", "glgpu[0].GLName=\"A card\"",
                      "out", "glgpu[0].GLDriverVersion=\"1.2\"",
                      "out", "glgpu[0].CanCompileProgramGLSL=1",
                      "out", "glgpu[0].GLFrameBufferOK=1",
                      "out", "OpenCLAvailable=0",
                      "out", "assayEnd=\"y\""};

const Words kCrashes = {"out", "assayStart=\"x\"", "out",  "QGFCoreInitialized=1",
                        "out", "# a call",         "abort"};

// A path in a temporary folder, which is removed at the end.
class StateFolder {
public:
    StateFolder()
    {
        std::random_device random;
        fParent = std::filesystem::temp_directory_path() /
                  ("assay-library-" + std::to_string(random()) + "-" + std::to_string(random()));
        std::filesystem::create_directory(fParent);
        fPath = (fParent / "state").u8string();
    }
    ~StateFolder()
    {
        // That of MinGW's std::filesystem doesn't return if a file disappears at the same time.
        boost::system::error_code failure;
        boost::filesystem::remove_all(fParent.native(), failure);
    }
    StateFolder(const StateFolder&) = delete;
    StateFolder& operator=(const StateFolder&) = delete;

    const char* Get() const { return fPath.c_str(); }
    const std::filesystem::path& GetParent() const { return fParent; }
    bool Exists() const { return std::filesystem::exists(std::filesystem::u8path(fPath)); }

private:
    std::filesystem::path fParent;
    std::string fPath;
};

// An advice with a child of these words.
struct ChildAdvice {
    explicit ChildAdvice(const char* folder, const Words& words = kWorks,
                         const Options& options = {}, assay_host_stop* stop = nullptr)
    {
        for (const std::string& word : words)
            assay_host_options_add_argument(options, word.c_str());
        fError = assay_host_advise(options, folder, stop, &fAdvice);
    }
    explicit ChildAdvice(const StateFolder& folder, const Words& words = kWorks,
                         const Options& options = {}, assay_host_stop* stop = nullptr)
        : ChildAdvice(folder.Get(), words, options, stop)
    {}
    ~ChildAdvice() { assay_host_advice_free(fAdvice); }
    ChildAdvice(const ChildAdvice&) = delete;
    ChildAdvice& operator=(const ChildAdvice&) = delete;

    // Returns "hardware attempt tried", or without the last word.
    std::string Show(assay_host_interface which = ASSAY_HOST_OPENGL) const
    {
        return std::string(assay_host_usability_name(assay_host_advice_usable(fAdvice, which))) +
               " " + assay_host_advice_source(fAdvice, which) +
               (assay_host_advice_tried(fAdvice) == 1 ? " tried" : "");
    }

    assay_host_error fError = ASSAY_HOST_INTERNAL;
    assay_host_advice* fAdvice = nullptr;
};

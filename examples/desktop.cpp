// SPDX-FileCopyrightText: 2026 the assay authors
// SPDX-License-Identifier: MIT

// A desktop program that draws with the graphics card as long as that works. The window is SDL's.
//
// usage: desktop [--frames NUMBER] FOLDER [PROGRAM]
//
// FOLDER has what the program keeps between its starts. NUMBER ends it after that many frames.
// PROGRAM replaces the assay beside the library.
#include <algorithm>
#include <exception>
#include <filesystem>
#include <fstream>
#include <iostream>
#include <stdexcept>
#include <string>
#include <utility>
#include <vector>

#include <SDL.h>
#include <SDL_opengl.h>

#include <assay_host.hpp>

namespace {

constexpr int kWidth = 320;
constexpr int kHeight = 200;

// After so many crashes of this program in a row, it doesn't draw with hardware until a driver, an
// adapter or the system changes, even if the trials of assay pass.
constexpr unsigned kMaxCrashes = 3;

// Remembers in a file that this program draws with hardware. A file that is there at the start is
// of a start that crashed, or was killed. For one instance of the program at a time.
class Mark {
public:
    explicit Mark(std::filesystem::path file) : fFile(std::move(file))
    {
        std::ifstream(fFile) >> fIdentity >> fCrashes;
    }

    // Whether the last start crashed, and hardware isn't given up yet.
    bool IsNews() const { return fCrashes > 0 && fCrashes < kMaxCrashes; }

    // Returns the number of crashes in a row with this identity.
    unsigned GetCrashes(const std::string& identity) const
    {
        return identity == fIdentity ? fCrashes : 0;
    }

    // Until Clear(), the start counts as a crash.
    void Set(const std::string& identity)
    {
        fCrashes = GetCrashes(identity) + 1;
        fIdentity = identity;
        std::ofstream(fFile) << fIdentity << ' ' << fCrashes << '\n';
    }

    void Clear() { std::filesystem::remove(fFile); }

private:
    const std::filesystem::path fFile;
    std::string fIdentity;
    unsigned fCrashes = 0;
};

struct Arguments {
    long fFrames = 0; // 0: until the window is closed
    std::filesystem::path fFolder;
    std::string fProgram;
};

Arguments Read(std::vector<std::string> words)
{
    Arguments arguments;
    if (words.size() >= 2 && words[0] == "--frames") {
        arguments.fFrames = std::stol(words[1]);
        words.erase(words.begin(), words.begin() + 2);
    }
    if (words.empty() || words.size() > 2)
        throw std::runtime_error("usage: desktop [--frames NUMBER] FOLDER [PROGRAM]");
    arguments.fFolder = std::filesystem::u8path(words[0]);
    arguments.fProgram = words.size() == 2 ? words[1] : "";
    return arguments;
}

// SDL, and a window. One at a time.
class Window {
public:
    explicit Window(Uint32 flags)
    {
        if (SDL_Init(SDL_INIT_VIDEO) == 0)
            fWindow = SDL_CreateWindow("desktop", SDL_WINDOWPOS_CENTERED, SDL_WINDOWPOS_CENTERED,
                                       kWidth, kHeight, flags);
    }
    ~Window()
    {
        SDL_DestroyWindow(fWindow);
        SDL_Quit();
    }
    Window(const Window&) = delete;
    Window& operator=(const Window&) = delete;

    SDL_Window* Get() const { return fWindow; }

private:
    SDL_Window* fWindow = nullptr;
};

// Calls `draw` for each frame until the window is closed. SDL turns SIGINT and SIGTERM into the
// event of a closed window, so that an orderly end isn't taken for a crash.
template <typename Draw>
void Show(long frames, const Draw& draw)
{
    constexpr int kFrameMilliseconds = 16;
    for (long frame = 0; frames == 0 || frame < frames; ++frame) {
        draw(static_cast<unsigned char>(frame));
        SDL_Event event;
        for (bool any = SDL_WaitEventTimeout(&event, kFrameMilliseconds) != 0; any;
             any = SDL_PollEvent(&event) != 0)
            if (event.type == SDL_QUIT)
                return;
    }
}

// Returns false if there is no window or context.
bool DrawWithHardware(long frames)
{
    const Window window(SDL_WINDOW_OPENGL);
    const SDL_GLContext context =
        window.Get() != nullptr ? SDL_GL_CreateContext(window.Get()) : nullptr;
    if (context == nullptr) {
        std::cout << "no context: " << SDL_GetError() << std::endl;
        return false;
    }
    const auto getString =
        reinterpret_cast<decltype(&glGetString)>(SDL_GL_GetProcAddress("glGetString"));
    const auto clearColor =
        reinterpret_cast<decltype(&glClearColor)>(SDL_GL_GetProcAddress("glClearColor"));
    const auto clear = reinterpret_cast<decltype(&glClear)>(SDL_GL_GetProcAddress("glClear"));
    std::cout << "hardware: " << reinterpret_cast<const char*>(getString(GL_RENDERER)) << std::endl;
    Show(frames, [&](unsigned char frame) {
        clearColor(static_cast<float>(frame) / 255, 0.5F, 1, 1);
        clear(GL_COLOR_BUFFER_BIT);
        SDL_GL_SwapWindow(window.Get());
    });
    SDL_GL_DeleteContext(context);
    return true;
}

// Draws on the processor, and calls nothing of OpenGL.
void DrawWithSoftware(long frames)
{
    SDL_SetHint(SDL_HINT_FRAMEBUFFER_ACCELERATION, "0");
    const Window window(0);
    SDL_Renderer* const renderer = window.Get() != nullptr
                                       ? SDL_CreateRenderer(window.Get(), -1, SDL_RENDERER_SOFTWARE)
                                       : nullptr;
    if (renderer == nullptr)
        throw std::runtime_error(SDL_GetError());
    SDL_RendererInfo info = {};
    SDL_GetRendererInfo(renderer, &info);
    std::cout << "software: " << info.name << std::endl;
    Show(frames, [&](unsigned char frame) {
        SDL_SetRenderDrawColor(renderer, frame, 128, 255, 255);
        SDL_RenderClear(renderer);
        SDL_RenderPresent(renderer);
    });
    SDL_DestroyRenderer(renderer);
}

// Whether to draw with hardware. Prints why.
bool Decide(const Arguments& arguments, Mark& mark)
{
    assay::Options options;
    options.program = arguments.fProgram;
    options.timeout_seconds = 20;
    // This program crashed where the trials had passed. Run them again.
    options.fresh = mark.IsNews();
    const assay::Advice advice =
        assay::advise((arguments.fFolder / "graphics").u8string(), options);
    for (const std::string& message : advice.messages())
        std::cout << message << '\n';
    const assay::Advised opengl = advice.of(assay::Interface::opengl);
    std::cout << "advice: " << to_string(opengl.usability) << " by " << opengl.source << ": "
              << opengl.text << std::endl;
    if (opengl.usability != assay::Usability::hardware) {
        mark.Clear(); // the state knows it now
        return false;
    }
    const unsigned crashes = mark.GetCrashes(advice.identity());
    if (crashes >= kMaxCrashes) {
        std::cout << "this program crashed " << crashes << " times with this driver" << std::endl;
        return false;
    }
    mark.Set(advice.identity());
    return true;
}

} // namespace

int main(int argc, char** argv)
try {
    const Arguments arguments = Read({argv + std::min(argc, 1), argv + argc});
    std::filesystem::create_directories(arguments.fFolder);
    Mark mark(arguments.fFolder / "drawing");
    bool isDrawn = false;
    if (Decide(arguments, mark)) {
        isDrawn = DrawWithHardware(arguments.fFrames);
        mark.Clear();
    }
    if (!isDrawn)
        DrawWithSoftware(arguments.fFrames);
} catch (const std::exception& failure) {
    std::cerr << "desktop: " << failure.what() << '\n';
    return 1;
}

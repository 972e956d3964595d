// SPDX-FileCopyrightText: 2026 the assay authors
// SPDX-License-Identifier: MIT

// Decides whether an application uses OpenGL and OpenCL, by the C++ wrapper of libassay-host, and
// shows what the child is doing.
//
// usage: decide [PROGRAM [argument...]]    PROGRAM replaces the assay beside the library
#include <exception>
#include <iostream>
#include <utility>
#include <variant>

#include <assay_host.hpp>

int main(int argc, char** argv)
try {
    assay::Options options;
    options.timeout_seconds = 20;
    if (argc > 1) {
        options.program = argv[1];
        options.arguments.assign(argv + 2, argv + argc);
    }
    options.on_tick = [](double seconds, auto steps, auto next) {
        std::cerr << seconds << " s, " << steps << " steps, at " << next << '\n';
        return true;
    };
    const assay::Result result = assay::run(options);
    std::cout << to_string(result.verdict()) << ": " << result.reason() << '\n';
    for (const auto& [name, which] : {std::pair("OpenGL", assay::Interface::opengl),
                                      std::pair("OpenCL", assay::Interface::opencl)}) {
        const assay::Usable usable = result.usable(which);
        std::cout << name << ' ' << to_string(usable.usability) << ": " << usable.text << '\n';
    }
    for (const assay::Warning& warning : result.warnings())
        std::cout << "warning " << warning.code << ": " << warning.text << '\n';
    const assay::Answer memory = result.find("glgpu[0].GLMemoryMB");
    if (const auto* const number = std::get_if<double>(&memory.value))
        std::cout << *number << " MiB\n";
} catch (const std::exception& failure) {
    std::cerr << "decide: " << failure.what() << '\n';
    return 1;
}

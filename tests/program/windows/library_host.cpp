// A host that runs assay by the DLL, and prints the document. library_host.py is its counterpart on
// Linux.
//
// usage: library_host TIMEOUT [PROGRAM [argument...]]    PROGRAM replaces the assay beside the DLL
#include <cstdio>
#include <cstdlib>
#include <exception>
#include <string>

#include <assay_host.hpp>

int main(int argc, char** argv)
try {
    assay::Options options;
    options.timeout_seconds = argc > 1 ? std::atof(argv[1]) : 0;
    if (argc > 2) {
        options.program = argv[2];
        options.arguments.assign(argv + 3, argv + argc);
    }
    const assay::Result result = assay::run(options);
    const std::string document(result.document());
    std::fwrite(document.data(), 1, document.size(), stdout);
    return 0;
} catch (const std::exception& failure) {
    std::fprintf(stderr, "library_host: %s\n", failure.what());
    return 1;
}

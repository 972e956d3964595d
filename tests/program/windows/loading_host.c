/* A host that loads the DLL at run time, and unloads it.
 *
 * usage: loading_host DLL [PROGRAM]    runs PROGRAM before the end */
#include <windows.h>

#include <stdio.h>

#include <assay_host.h>

#define GET(dll, name) ((__typeof__(&(name)))(void*)GetProcAddress(dll, #name))

static const char* run(HMODULE dll, const char* program)
{
    assay_host_result* result = NULL;
    assay_host_options* options = GET(dll, assay_host_options_new)();
    GET(dll, assay_host_options_set_program)(options, program);
    GET(dll, assay_host_run)(options, NULL, &result);
    const char* verdict =
        GET(dll, assay_host_verdict_name)(GET(dll, assay_host_result_verdict)(result));
    GET(dll, assay_host_result_free)(result);
    GET(dll, assay_host_options_free)(options);
    return verdict;
}

int main(int argc, char** argv)
{
    HMODULE dll = argc > 1 ? LoadLibraryA(argv[1]) : NULL;
    puts(dll != NULL ? "loaded" : "not loaded");
    if (dll == NULL)
        return 1;
    if (argc > 2)
        puts(run(dll, argv[2]));
    FreeLibrary(dll);
    puts(GetModuleHandleA("assay-host.dll") != NULL ? "stays" : "unloaded");
    return 0;
}

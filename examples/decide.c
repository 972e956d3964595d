/* SPDX-FileCopyrightText: 2026 the assay authors
 * SPDX-License-Identifier: MIT */

/* Decides whether an application uses OpenGL, by libassay-host.
 *
 * usage: decide [PROGRAM [argument...]]    PROGRAM replaces the assay beside the library */
#include <stdio.h>

#include <assay_host.h>

int main(int argc, char** argv)
{
    assay_host_options* options = assay_host_options_new();
    assay_host_result* result = NULL;
    assay_host_error error = assay_host_options_set_timeout(options, 20);
    for (int index = 1; index < argc && error == ASSAY_HOST_OK; ++index)
        error = index == 1 ? assay_host_options_set_program(options, argv[index])
                           : assay_host_options_add_argument(options, argv[index]);
    if (error == ASSAY_HOST_OK)
        error = assay_host_run(options, NULL, &result);
    assay_host_options_free(options);
    if (error != ASSAY_HOST_OK) {
        fprintf(stderr, "decide: %s\n", assay_host_error_text(error));
        return 1;
    }
    printf("%s: %s\n", assay_host_verdict_name(assay_host_result_verdict(result)),
           assay_host_result_reason(result));
    printf("OpenGL %s: %s\n",
           assay_host_usability_name(assay_host_result_usable(result, ASSAY_HOST_OPENGL)),
           assay_host_result_usable_text(result, ASSAY_HOST_OPENGL));
    const assay_host_answer* memory = assay_host_result_find(result, "glgpu[0].GLMemoryMB");
    if (assay_host_answer_kind(memory) == ASSAY_HOST_NUMBER)
        printf("%.0f MiB\n", assay_host_answer_number(memory));
    assay_host_result_free(result);
    return 0;
}

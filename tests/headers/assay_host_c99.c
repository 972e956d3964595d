/* The header is valid C99, also when it is included twice and first. */
#include <assay_host.h>

int use_header(void);

int use_header(void)
{
    return (int)assay_host_result_verdict(NULL);
}

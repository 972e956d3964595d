/* The child of the launch benchmarks: writes the number of bytes in its argument and exits. */
#include <stdlib.h>
#include <unistd.h>

int main(int argc, char** argv)
{
    static char block[65536];
    unsigned long long left = argc > 1 ? strtoull(argv[1], NULL, 10) : 0;
    while (left > 0) {
        ssize_t count = write(STDOUT_FILENO, block, left < sizeof block ? left : sizeof block);
        if (count <= 0)
            return 1;
        left -= (unsigned long long)count;
    }
    return 0;
}

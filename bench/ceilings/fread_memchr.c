/*
 * Read ceiling: the file in 1 MiB blocks with fread, every line end found
 * with memchr. No scanner can read its input faster than this.
 *
 * Usage: ceiling_fread [-c] FILE
 */
#include "bench_common.h"

#define BLOCK (1 << 20)

int main(int argc, char **argv) {
    static char buf[BLOCK];
    bench_sink s;
    int first = bench_begin(&s, argc, argv);
    FILE *f;
    size_t n;
    if (first >= argc) {
        fprintf(stderr, "usage: ceiling_fread [-c] FILE\n");
        return 2;
    }
    f = fopen(argv[first], "rb");
    if (!f) {
        perror(argv[first]);
        return 1;
    }
    while ((n = fread(buf, 1, sizeof buf, f)) > 0) {
        const char *p = buf;
        const char *end = buf + n;
        while ((p = memchr(p, '\n', (size_t)(end - p))) != NULL) {
            s.lines++;
            p++;
        }
    }
    fclose(f);
    bench_report(&s, "fread+memchr");
    return 0;
}

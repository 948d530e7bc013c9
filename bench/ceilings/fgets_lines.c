/*
 * Read ceiling: the file line by line with fgets into a 5000-byte line
 * buffer, the way a line-oriented character source reads it.
 *
 * Usage: ceiling_fgets [-c] FILE
 */
#include "bench_common.h"

#define LINE_SIZE 5000

int main(int argc, char **argv) {
    static char line[LINE_SIZE];
    bench_sink s;
    int first = bench_begin(&s, argc, argv);
    FILE *f;
    if (first >= argc) {
        fprintf(stderr, "usage: ceiling_fgets [-c] FILE\n");
        return 2;
    }
    f = fopen(argv[first], "r");
    if (!f) {
        perror(argv[first]);
        return 1;
    }
    while (fgets(line, sizeof line, f) != NULL) s.lines++;
    fclose(f);
    bench_report(&s, "fgets");
    return 0;
}

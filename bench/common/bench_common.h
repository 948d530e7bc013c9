/*
 * What every benchmark program shares: the token checksum, the three output
 * modes, the clock and the peak-memory report.
 *
 * Checksum: FNV-1a 64-bit over every delivered token before the end of
 * input: the kind as one byte; for numbers (1), operators (3) and reserved
 * words (9) the value as 4 little-endian bytes; for numbers, strings (2),
 * reserved words, identifiers (10), PDF strings (33) and characters (34) the
 * text bytes and one 0 byte.
 *
 * Modes, chosen by the first argument:
 *   (none)  count and checksum, the check that runs before any timing;
 *   -c      count only, the timed mode: the consumer reads kind and value,
 *           as a parser does, and leaves the text where the scanner put it;
 *   -d      dump one line per token, for finding where two scanners part.
 *
 * Header-only, plain C99.
 */
#ifndef BENCH_COMMON_H
#define BENCH_COMMON_H

#include <stdint.h>
#include <stdio.h>
#include <stdlib.h>
#include <string.h>
#include <sys/resource.h>
#include <time.h>

#define BENCH_FNV_OFFSET 14695981039346656037ull
#define BENCH_FNV_PRIME 1099511628211ull

enum bench_mode { bench_checksum, bench_count, bench_dump };

typedef struct bench_sink {
    enum bench_mode mode;
    uint64_t hash;             /* FNV-1a state (checksum mode) */
    uint64_t tokens;           /* tokens delivered before the end of input */
    uint64_t mix;              /* kinds and values folded together (count mode) */
    uint64_t lines;            /* lines read (the read ceilings) */
    struct timespec start;     /* wall clock */
    struct timespec cpu_start; /* this process's CPU time */
} bench_sink;

static inline uint64_t bench_fnv(uint64_t h, const unsigned char *p, size_t n) {
    size_t i;
    for (i = 0; i < n; i++) {
        h ^= p[i];
        h *= BENCH_FNV_PRIME;
    }
    return h;
}

static inline int bench_has_value(unsigned kind) {
    return kind == 1 || kind == 3 || kind == 9;
}

static inline int bench_has_text(unsigned kind) {
    return kind == 1 || kind == 2 || kind == 9 || kind == 10 || kind == 33 || kind == 34;
}

/* Reads the mode from argv[1] and shifts it away; starts the clock.
 * Returns the index of the first operand. */
static inline int bench_begin(bench_sink *s, int argc, char **argv) {
    int first = 1;
    memset(s, 0, sizeof *s);
    s->mode = bench_checksum;
    s->hash = BENCH_FNV_OFFSET;
    if (argc > 1 && strcmp(argv[1], "-c") == 0) {
        s->mode = bench_count;
        first = 2;
    } else if (argc > 1 && strcmp(argv[1], "-d") == 0) {
        s->mode = bench_dump;
        first = 2;
    }
    clock_gettime(CLOCK_MONOTONIC, &s->start);
    clock_gettime(CLOCK_PROCESS_CPUTIME_ID, &s->cpu_start);
    return first;
}

static inline void bench_dump_token(unsigned kind, int32_t value, const char *text, size_t len) {
    size_t i;
    if (bench_has_value(kind))
        printf("%u %ld ", kind, (long)value);
    else
        printf("%u - ", kind);
    if (bench_has_text(kind)) {
        for (i = 0; i < len; i++) {
            unsigned char c = (unsigned char)text[i];
            if (c == '\\')
                fputs("\\\\", stdout);
            else if (c == '\n')
                fputs("\\n", stdout);
            else if (c < 32 || c > 126)
                printf("\\x%02X", c);
            else
                putchar(c);
        }
    }
    putchar('\n');
}

/* The timed mode's consumer: what a parser looks at first. */
static inline void bench_count_token(bench_sink *s, unsigned kind, int32_t value) {
    s->tokens++;
    s->mix += kind ^ (uint32_t)value;
}

/* One delivered token (never the end of input). */
static inline void bench_token(bench_sink *s, unsigned kind, int32_t value, const char *text,
                               size_t len) {
    s->tokens++;
    if (s->mode == bench_count) {
        s->mix += kind ^ (uint32_t)value;
        return;
    }
    if (s->mode == bench_dump) {
        bench_dump_token(kind, value, text, len);
        return;
    }
    {
        unsigned char k = (unsigned char)kind;
        s->hash = bench_fnv(s->hash, &k, 1);
    }
    if (bench_has_value(kind)) {
        uint32_t v = (uint32_t)value;
        unsigned char b[4];
        b[0] = (unsigned char)v;
        b[1] = (unsigned char)(v >> 8);
        b[2] = (unsigned char)(v >> 16);
        b[3] = (unsigned char)(v >> 24);
        s->hash = bench_fnv(s->hash, b, 4);
    }
    if (bench_has_text(kind)) {
        static const unsigned char zero = 0;
        s->hash = bench_fnv(s->hash, (const unsigned char *)text, len);
        s->hash = bench_fnv(s->hash, &zero, 1);
    }
}

static inline double bench_since(clockid_t clock, const struct timespec *start) {
    struct timespec now;
    clock_gettime(clock, &now);
    return (double)(now.tv_sec - start->tv_sec) + (double)(now.tv_nsec - start->tv_nsec) / 1e9;
}

static inline long bench_maxrss_kb(void) {
    struct rusage ru;
    if (getrusage(RUSAGE_SELF, &ru) != 0) return -1;
    return ru.ru_maxrss; /* kilobytes on Linux */
}

/* The closing report, one line of key=value pairs on standard error (the
 * dump owns standard output). */
static inline void bench_report(const bench_sink *s, const char *name) {
    double secs = bench_since(CLOCK_MONOTONIC, &s->start);
    double cpu = bench_since(CLOCK_PROCESS_CPUTIME_ID, &s->cpu_start);
    if (s->mode == bench_dump) fflush(stdout);
    fprintf(stderr,
            "name=%s tokens=%llu checksum=%016llx lines=%llu mix=%llu seconds=%.6f "
            "cpu_seconds=%.6f maxrss_kb=%ld\n",
            name, (unsigned long long)s->tokens,
            (unsigned long long)(s->mode == bench_checksum ? s->hash : 0),
            (unsigned long long)s->lines, (unsigned long long)s->mix, secs, cpu, bench_maxrss_kb());
}

#endif /* BENCH_COMMON_H */

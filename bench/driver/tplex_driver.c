/*
 * Drives the lexer through its exported interface exactly as the parser
 * does: sc_lex_init, sc_lex_setup, sc_lex_init_file, then sc_next_token until
 * the end of input (5) or a failure, reading the shared token record after
 * each call; then sg_closesources and lex_free.
 *
 * Usage: tplex_driver [-c|-d] FILE   (see bench_common.h for the modes)
 * Run it from the folder of FILE when FILE includes others by relative name.
 */
#include <tplex/lexer.h>

#include "bench_common.h"

static void report_failure(status_code code, const source_frame *frames, const int16_t *depth,
                           const bench_sink *s) {
    const source_frame *f = frames + (*depth > 0 ? *depth : 0);
    fprintf(stderr, "tplex_driver: failure 0x%08lX after %llu tokens, depth %d, %s line %lu\n",
            (unsigned long)(uint32_t)code, (unsigned long long)s->tokens, (int)*depth, f->path,
            (unsigned long)f->line_no);
}

int main(int argc, char **argv) {
    bench_sink s;
    int first = bench_begin(&s, argc, argv);
    int count_only = s.mode == bench_count;
    token_record *tok = NULL;
    source_frame *frames = NULL;
    int16_t *depth = NULL;
    unsigned long kind_mismatch = 0;
    int status = 0;
    status_code r;
    if (first >= argc) {
        fprintf(stderr, "usage: tplex_driver [-c|-d] FILE\n");
        return 2;
    }
    r = sc_lex_init();
    if (r != 0) {
        fprintf(stderr, "tplex_driver: sc_lex_init gave 0x%08lX\n", (unsigned long)(uint32_t)r);
        return 1;
    }
    sc_lex_setup(&tok, &frames, &depth, NULL, NULL);
    r = sc_lex_init_file(argv[first]);
    if (r < 0) {
        fprintf(stderr, "tplex_driver: cannot open %s: 0x%08lX\n", argv[first],
                (unsigned long)(uint32_t)r);
        return 1;
    }
    if (count_only) {
        /* The timed loop: counters in registers, the record read as a parser
         * reads it. */
        uint64_t n = 0, mix = 0;
        while ((r = sc_next_token()) >= 0 && r != tk_end_of_input) {
            n++;
            mix += tok->kind ^ (uint32_t)tok->value;
        }
        s.tokens = n;
        s.mix = mix;
    } else if (s.mode == bench_dump) {
        /* A dump goes on after a failure, as the interface allows, and shows
         * it in line: "! CODE". */
        unsigned long failures = 0;
        while ((r = sc_next_token()) != tk_end_of_input && failures < 1000) {
            if (r < 0) {
                printf("! 0x%08lX\n", (unsigned long)(uint32_t)r);
                failures++;
                continue;
            }
            if ((unsigned)r != tok->kind) kind_mismatch++;
            bench_token(&s, tok->kind, tok->value, tok->text, strlen(tok->text));
        }
    } else {
        while ((r = sc_next_token()) >= 0 && r != tk_end_of_input) {
            if ((unsigned)r != tok->kind) kind_mismatch++;
            bench_token(&s, tok->kind, tok->value, tok->text, strlen(tok->text));
        }
    }
    if (r < 0) {
        report_failure(r, frames, depth, &s);
        status = 1;
    }
    sg_closesources();
    lex_free();
    if (kind_mismatch) {
        fprintf(stderr, "tplex_driver: %lu results differ from the record's kind\n", kind_mismatch);
        status = 1;
    }
    bench_report(&s, "tplex");
    return status;
}

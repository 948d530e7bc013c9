/*
 * tplex tool queries: what the tplex tool reports beyond the token stream,
 * read from the lexer's state after (or during) a pass: the #ifdef/#ifndef
 * regions still open, the block comments that ran past the end of a file,
 * and the dictionary listing with its key-press pause made optional.
 *
 * These functions live in the static archive (libtplex.a) with C linkage;
 * the shared library does not export them. Each is valid between
 * sc_lex_init() and lex_free() and changes nothing in the lexer's state.
 */
#ifndef TPLEX_TOOL_QUERIES_H
#define TPLEX_TOOL_QUERIES_H

#include "tplex/lexer.h"

#ifdef __cplusplus
extern "C" {
#endif

/* A place in a source file: the path as the source stack held it, and a
 * line counted from 1. */
typedef struct tplex_place {
    char path[TPLEX_PATH_SIZE];
    uint32_t line;
} tplex_place;

/* The #ifdef/#ifndef regions open now, outermost first: fills up to
 * capacity places with where each was opened and returns how many are open
 * (0 to 20). */
int32_t tplex_open_regions(tplex_place *places, int32_t capacity);

/* A running count of the block comments that have run past the end of the
 * file they were in (compare it before and after a call); a comment is
 * counted once, at the first file end it passes. The last one counted goes to *ended (the file that
 * ended and its last line) and *opened_line (the line of that file where it began, or 0 when it
 * began in a defined name's body). Either pointer may be null. */
uint32_t tplex_comments_past_file_end(tplex_place *ended, uint32_t *opened_line);

/* The dictionary listing (slot, kind name, name per line; reserved words
 * and hash words only when all is non-zero), pausing for a key every ten
 * lines only when pause is non-zero. */
void tplex_dict_list(uint8_t all, int pause);

#ifdef __cplusplus
}
#endif

#endif /* TPLEX_TOOL_QUERIES_H */

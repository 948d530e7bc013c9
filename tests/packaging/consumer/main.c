/* Lexes one file with the installed library and prints its token count.
 * Linked with the static archive (TPLEX_STATIC), it also calls into the
 * table output module, which only the archive carries. */
#include <stdio.h>
#include <tplex/lexer.h>
#include <tplex/table_output.h>

int main(int argc, char **argv) {
    token_record *token = NULL;
    status_code r;
    int tokens = 0;

    if (argc != 2) {
        fprintf(stderr, "usage: consumer FILE\n");
        return 2;
    }
    if (sc_lex_init() != 0) return 1;
    sc_lex_setup(&token, NULL, NULL, NULL, NULL);
    if (sc_lex_init_file(argv[1]) < 0) return 1;
    while ((r = sc_next_token()) >= 0 && r != tk_end_of_input) ++tokens;
    if (r < 0) sg_DisplayError(r);
    sg_closesources();
    lex_free();
#ifdef TPLEX_STATIC
    /* The static archive carries the table output module as well. */
    if (FreeOutputTables() != 0) return 1;
#endif
    printf("tplex %s: %d tokens\n", TPLEX_VERSION_STRING, tokens);
    return r < 0 ? 1 : 0;
}

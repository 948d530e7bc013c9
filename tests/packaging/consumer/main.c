/* Lexes one file with the installed library and prints its token count.
 * Linked with the static archive (TPLEX_STATIC), it also uses what only the
 * archive carries: the parser services and the table output module. */
#include <stdio.h>
#include <tplex/lexer.h>
#ifdef TPLEX_STATIC
#include <tplex/services.h>
#include <tplex/table_output.h>
#endif

int main(int argc, char **argv) {
    int tokens = 0;
    status_code r = argc == 2 ? sc_lex_init() : -1;
#ifdef TPLEX_STATIC
    if (r == 0) r = add_include_dir(".") | FreeOutputTables();
#endif
    if (r != 0 || sc_lex_init_file(argv[1]) != 1) return 1;
    while ((r = sc_next_token()) >= 0 && r != tk_end_of_input) ++tokens;
    sg_closesources();
    lex_free();
    printf("tplex %s: %d tokens\n", TPLEX_VERSION_STRING, tokens);
    return r < 0;
}

/* Lexes one file with the installed library and prints its token count.
 * Linked with the static archive (TPLEX_STATIC), it also uses what only the
 * archive carries: the parser services, with which it lexes the file again,
 * found through an include directory, and the table output module. */
#include <stdio.h>
#include <string.h>
#include <tplex/lexer.h>
#ifdef TPLEX_STATIC
#include <tplex/services.h>
#include <tplex/table_output.h>
#endif

/* Opens name as the main file after dir (if any) is on the include list,
 * and counts its tokens; -1 on a failure. */
static int count_tokens(const char *dir, const char *name) {
    int tokens = 0;
    status_code r;
    if (sc_lex_init() != 0) return -1;
#ifdef TPLEX_STATIC
    if (dir != NULL && add_include_dir(dir) != 0) return -1;
#endif
    if (sc_lex_init_file(name) < 0) return -1;
    while ((r = sc_next_token()) >= 0 && r != tk_end_of_input) ++tokens;
    sg_closesources();
    lex_free();
    return r < 0 ? -1 : tokens;
}

int main(int argc, char **argv) {
    int tokens = argc == 2 ? count_tokens(NULL, argv[1]) : -1;
#ifdef TPLEX_STATIC
    char dir[TPLEX_PATH_SIZE] = "";
    const char *slash = argc == 2 ? strrchr(argv[1], '/') : NULL;
    if (slash == NULL || (size_t)(slash - argv[1]) >= sizeof dir) return 1;
    memcpy(dir, argv[1], (size_t)(slash - argv[1]));
    if (count_tokens(dir, slash + 1) != tokens || FreeOutputTables() != 0) return 1;
#endif
    printf("tplex %s: %d tokens\n", TPLEX_VERSION_STRING, tokens);
    return tokens < 0 ? 1 : 0;
}

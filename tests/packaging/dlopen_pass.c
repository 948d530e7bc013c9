/*
 * Loads the shared library with dlopen and drives two whole passes through
 * the sixteen exports, each found with dlsym, the way the compiler's parser
 * uses the library. The program is not linked with the library: the public
 * header gives it the types and codes only.
 *
 *   dlopen_pass LIBRARY SOURCE      (SOURCE: tests/packaging/pass.tpl)
 */
#define _POSIX_C_SOURCE 200809L
#include <dlfcn.h>
#include <stdio.h>
#include <string.h>

#include "tplex/lexer.h"

static int checks, failures;

static void check(int ok, const char *what) {
    ++checks;
    if (!ok) {
        ++failures;
        printf("FAILED: %s\n", what);
    }
}

/* The exports, as the parser declares them. */
static status_code (*p_sc_lex_init)(void);
static status_code (*p_sc_lex_init_file)(const char *);
static status_code (*p_sc_lex_setup)(token_record **, source_frame **, int16_t **,
                                     reserved_word_record **, uint8_t **);
static status_code (*p_sc_next_token)(void);
static status_code (*p_sc_lex_init_defines)(char **, int32_t);
static status_code (*p_lex_initialise)(void);
static status_code (*p_lex_free)(void);
static void (*p_back_token)(void);
static status_code (*p_open_source_file)(const char *);
static status_code (*p_rewind_input)(void);
static status_code (*p_parse_ident)(uint8_t, uint8_t);
static status_code (*p_dict_extend)(const char *, const char *, const char *, uint8_t, uint8_t,
                                    uint8_t);
static status_code (*p_dict_check)(void);
static void (*p_sg_DisplayError)(status_code);
static const char *(*p_sg_GetError)(status_code);
static status_code (*p_sg_closesources)(void);

/* dlsym gives an object pointer; copy it into the function pointer. */
#define LOAD(lib, name)                                        \
    do {                                                       \
        void *sym = dlsym(lib, #name);                         \
        check(sym != NULL, "dlsym " #name);                    \
        memcpy(&p_##name, &sym, sizeof p_##name);              \
    } while (0)

static token_record *token;

/* One pass as a parser makes it: declarations after PROTOCOL, STATE and
 * TIMER, uses after NEXTSTATE and OUTPUT. Returns the number of tokens
 * read, by sc_next_token and parse_ident alike. */
static int parse_pass(void) {
    int tokens = 0;
    for (;;) {
        status_code r = p_sc_next_token();
        check(r >= 0, "sc_next_token delivers a token");
        if (r < 0 || r == tk_end_of_input) break;
        ++tokens;
        if (r != tk_reserved_word) continue;
        if (token->value != 75) ++tokens; /* the identifier parse_ident reads */
        switch (token->value) {
            case 0: /* PROTOCOL: class 20, numbered from the general counter */
                check(p_parse_ident(1, 20) == 0 && token->kind == 20 && token->value == 2,
                      "PROTOCOL Demo declared as class 20, number 2");
                check(p_dict_extend("demo protocol", "", "", 1, 0, 0) == 0, "dict_extend");
                break;
            case 2: /* STATE: class 13, numbered from the shared counter */
                check(p_parse_ident(1, 13) == 0 && token->kind == 13 && token->value == 1,
                      "STATE Idle declared as class 13, number 1");
                break;
            case 3: /* NEXTSTATE: a use */
                check(p_parse_ident(0, 13) == 0, "NEXTSTATE uses a state");
                break;
            case 70: /* TIMER */
                check(p_parse_ident(1, 21) == 0 && token->value == 3,
                      "TIMER T1 declared as class 21, number 3");
                break;
            case 6: /* OUTPUT: a use that finds the definition attached */
                check(p_parse_ident(0, 20) == 0 && token->has_definition == 1 &&
                          strcmp(token->def_text1, "demo protocol") == 0 &&
                          token->def_flag1 == 1,
                      "OUTPUT Demo sees the texts of dict_extend");
                break;
            case 75: /* DURATION LIMIT: the macro's body, a number */
                check(p_sc_next_token() == tk_number && token->value == 3,
                      "LIMIT expands to the number 3");
                ++tokens;
                break;
            default: --tokens; break;
        }
    }
    return tokens;
}

int main(int argc, char **argv) {
    void *lib;
    source_frame *frames = NULL;
    int16_t *depth = NULL;
    reserved_word_record *words = NULL;
    uint8_t *declare = NULL;
    char extra[] = "extra";
    char *defines[] = {extra};
    status_code r;
    int first, second;

    if (argc != 3) {
        fprintf(stderr, "usage: dlopen_pass LIBRARY SOURCE\n");
        return 2;
    }
    lib = dlopen(argv[1], RTLD_NOW | RTLD_LOCAL);
    if (lib == NULL) {
        printf("FAILED: dlopen: %s\n", dlerror());
        return 1;
    }
    LOAD(lib, sc_lex_init);
    LOAD(lib, sc_lex_init_file);
    LOAD(lib, sc_lex_setup);
    LOAD(lib, sc_next_token);
    LOAD(lib, sc_lex_init_defines);
    LOAD(lib, lex_initialise);
    LOAD(lib, lex_free);
    LOAD(lib, back_token);
    LOAD(lib, open_source_file);
    LOAD(lib, rewind_input);
    LOAD(lib, parse_ident);
    LOAD(lib, dict_extend);
    LOAD(lib, dict_check);
    LOAD(lib, sg_DisplayError);
    LOAD(lib, sg_GetError);
    LOAD(lib, sg_closesources);
    if (failures != 0) return 1;

    /* Start: the parser's calling order. */
    check(p_sc_lex_init() == 0, "sc_lex_init");
    check(p_sc_lex_setup(&token, &frames, &depth, &words, &declare) == 0, "sc_lex_setup");
    check(token != NULL && frames != NULL && depth != NULL && words != NULL && declare != NULL,
          "sc_lex_setup hands out five addresses");
    check(*declare == 1 && *depth == 0, "declare_enabled 1, source depth 0");
    check(words[45].code == 45 && strcmp(words[45].word, "DECISION") == 0,
          "reserved word table: 45 is DECISION");
    check(p_sc_lex_init_defines(defines, 1) == 0 && strcmp(extra, "EXTRA") == 0,
          "sc_lex_init_defines upper-cases in place");
    check(p_sc_lex_init_file(argv[2]) == 1 && *depth == 1, "sc_lex_init_file opens frame 1");
    check(strcmp(frames[1].path, argv[2]) == 0, "frame 1 holds the main file's path");

    /* Look-ahead of one token. */
    r = p_sc_next_token();
    check(r == tk_reserved_word && token->value == 0, "first token PROTOCOL");
    p_back_token();
    check(p_sc_next_token() == r && strcmp(token->text, "PROTOCOL") == 0,
          "back_token gives PROTOCOL again");
    check(p_parse_ident(1, 20) == 0 && token->kind == 20 && token->value == 2,
          "Demo declared after the look-ahead");
    check(p_dict_extend("demo protocol", "", "", 1, 0, 0) == 0, "dict_extend");
    first = parse_pass() + 2;

    /* The end of the pass: BUSY was used and never declared. */
    r = p_dict_check();
    check(r == TPLEX_UNDECLARED_IDENTIFIER, "dict_check finds BUSY");
    check(strcmp(p_sg_GetError(r), "Undeclared Identifier Used") == 0, "sg_GetError's text");
    p_sg_DisplayError(TPLEX_BAD_CHARACTER);

    /* A further pass from the same main file, with a fresh dictionary. */
    check(p_rewind_input() == 1, "rewind_input reopens the main file");
    second = parse_pass();
    check(first == second, "both passes see the same tokens");
    check(first == 20, "twenty tokens in a pass");
    check(*depth == 0, "every file is closed at the end of input");

    /* Open a file directly, then close everything and release the state. */
    check(p_open_source_file(argv[2]) == 1, "open_source_file");
    check(p_sg_closesources() == 0, "sg_closesources");
    check(p_lex_free() == 0, "lex_free");
    check(p_lex_initialise() == 0, "lex_initialise after lex_free");
    check(p_lex_free() == 0, "lex_free again");

    dlclose(lib);
    printf("\ndlopen pass: %d checks, %d failed\n", checks, failures);
    return failures == 0 ? 0 : 1;
}

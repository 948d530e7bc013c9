/*
 * Loads the library at run time (dlopen; LoadLibrary on Windows), finds the
 * sixteen exports by name and drives two passes through them as the parser
 * does, reading the shared records sc_lex_setup hands out. Not linked with
 * the library: the header gives the types, record layouts and TPLEX_CALL.
 * The source has CR LF line ends and ends in 0x1A, then bytes never read.
 *   pass_driver [LIBRARY]      (default: tplex.dll, found beside the program)
 */
#ifdef _WIN32
#include <direct.h>
#include <windows.h>
#define chdir _chdir
#define rmdir _rmdir
#define make_dir(name) _mkdir(name)
#define LOAD_LIBRARY LoadLibraryA
#define SYMBOL FARPROC
#define find(lib, name) GetProcAddress((HMODULE)(lib), name)
#else
#define _POSIX_C_SOURCE 200809L
#include <dlfcn.h>
#include <sys/stat.h>
#include <unistd.h>
#define make_dir(name) mkdir(name, 0700)
#define LOAD_LIBRARY(path) dlopen(path, RTLD_NOW | RTLD_LOCAL)
#define SYMBOL void *
#define find dlsym
#endif
#include <stdio.h>
#include <string.h>
#include <time.h>

#include "tplex/lexer.h"

static int checks, failures;
#define CHECK(cond) \
    (++checks, (cond) ? (void)0 : (void)(++failures, printf("line %d: %s\n", __LINE__, #cond)))

/* The exports, as the parser declares them. */
static status_code(TPLEX_CALL *p_sc_lex_init)(void), (TPLEX_CALL * p_sc_next_token)(void),
    (TPLEX_CALL * p_lex_initialise)(void), (TPLEX_CALL * p_lex_free)(void),
    (TPLEX_CALL * p_rewind_input)(void), (TPLEX_CALL * p_dict_check)(void),
    (TPLEX_CALL * p_sg_closesources)(void), (TPLEX_CALL * p_sc_lex_init_file)(const char *),
    (TPLEX_CALL * p_open_source_file)(const char *), (TPLEX_CALL * p_parse_ident)(uint8_t, uint8_t),
    (TPLEX_CALL * p_sc_lex_init_defines)(char **, int32_t),
    (TPLEX_CALL * p_sc_lex_setup)(token_record **, source_frame **, int16_t **,
                                  reserved_word_record **, uint8_t **),
    (TPLEX_CALL * p_dict_extend)(const char *, const char *, const char *, uint8_t, uint8_t,
                                 uint8_t);
static void(TPLEX_CALL *p_back_token)(void), (TPLEX_CALL * p_sg_DisplayError)(status_code);
static const char *(TPLEX_CALL *p_sg_GetError)(status_code);

/* The symbol's address copied into the function pointer. */
#define LOAD(name) \
    (sym = find(lib, #name), CHECK(sym != NULL), memcpy(&p_##name, &sym, sizeof p_##name))

static token_record *tok;
static source_frame *frames;
static int16_t *depth;

static int is(status_code r, int kind, int32_t value, const char *text) {
    return r == kind && tok->kind == kind && tok->value == value && strcmp(tok->text, text) == 0;
}

/* One pass over main.src; DEBUG is defined in the first pass only. */
static void pass(int first) {
    CHECK(*depth == 1 && frames[1].line_no == 0xFFFFFFFFu && !strcmp(frames[1].path, "main.src"));
    CHECK(is(p_sc_next_token(), tk_reserved_word, 0, "PROTOCOL"));
    CHECK(frames[1].line_no == 1 && frames[1].read_pos == 8);
    CHECK(strcmp(frames[1].line_text, "PROTOCOL foo 42 <= 'c'\n") == 0);
    /* First a use before any declaration, then definition texts on it. */
    CHECK(first ? p_parse_ident(0, 20) == 0 && is(tk_undeclared, tk_undeclared, 20, "FOO") &&
                      p_dict_extend("one", "two", "three", 1, 2, 250) == 0
                : p_parse_ident(1, 13) == 0 && tok->kind == 13 && tok->value == 1);
    CHECK(is(p_sc_next_token(), tk_number, 42, "42"));
    CHECK(p_sc_next_token() == tk_operator && tok->value == 5);
    CHECK(p_sc_next_token() == tk_char && strcmp(tok->text, "c") == 0);
    p_back_token();
    CHECK(p_sc_next_token() == tk_char && strcmp(tok->text, "c") == 0);
    /* The include, by a relative backslash path; the rest of its line unread. */
    CHECK(is(p_sc_next_token(), tk_reserved_word, 2, "STATE") && *depth == 2);
    CHECK(strcmp(frames[2].path, "sub\\part.inc") == 0 &&
          strcmp(frames[2].line_text, "STATE\n") == 0);
    CHECK(is(p_sc_next_token(), tk_reserved_word, 117, "WINDOW"));
    CHECK(*depth == 1 && frames[2].file == NULL && frames[1].line_no == 3);
    CHECK(first ? is(p_sc_next_token(), tk_undeclared, 20, "FOO") && tok->has_definition == 1 &&
                      !strcmp(tok->def_text1, "one") && !strcmp(tok->def_text3, "three") &&
                      tok->def_flag1 == 1 && tok->def_flag2 == 2 && tok->def_flag3 == 250
                : is(p_sc_next_token(), 13, 1, "FOO") && tok->has_definition == 0);
    CHECK(p_sc_next_token() == tk_number && tok->value == 3); /* LIMIT's body */
    CHECK(p_open_source_file("missing.src") == TPLEX_NO_INCLUDE_DIRS && *depth == 1);
    if (first) CHECK(is(p_sc_next_token(), tk_reserved_word, 70, "TIMER"));
    CHECK(p_sc_next_token() == tk_end_of_input); /* the bytes after the 0x1A are never read */
    CHECK(*depth == 0 && frames[1].file == NULL);
}

static const char source[] =
    "#define LIMIT 3\r\nPROTOCOL foo 42 <= 'c'\r\n#include \"sub\\part.inc\" EXTRA\r\n"
    "window Foo LIMIT\r\n#ifdef DEBUG\r\nTIMER\r\n#endif\r\n\x1A$?\\ \r\n";

static int write_file(const char *name, const char *bytes) {
    FILE *f = fopen(name, "wb");
    int ok = f != NULL && fwrite(bytes, 1, strlen(bytes), f) == strlen(bytes);
    return f != NULL && fclose(f) == 0 && ok;
}

int main(int argc, char **argv) {
    char dir[64], debug[] = "debug", trace[] = "Trace", *names[] = {debug, trace};
    reserved_word_record *words = NULL;
    uint8_t *declare = NULL;
    void *lib = LOAD_LIBRARY(argc > 1 ? argv[1] : "tplex.dll");
    SYMBOL sym;
    setvbuf(stdout, NULL, _IONBF, 0);
    if (lib == NULL) return printf("cannot load the library\n"), 1;
    LOAD(sc_lex_init), LOAD(sc_lex_init_file), LOAD(sc_lex_setup), LOAD(sc_next_token);
    LOAD(sc_lex_init_defines), LOAD(lex_initialise), LOAD(lex_free), LOAD(back_token);
    LOAD(open_source_file), LOAD(rewind_input), LOAD(parse_ident), LOAD(dict_extend);
    LOAD(dict_check), LOAD(sg_DisplayError), LOAD(sg_GetError), LOAD(sg_closesources);
    if (failures) return 1;
    /* A fresh working folder, as the compiler runs in the user's. */
    snprintf(dir, sizeof dir, "tplex-pass-%ld", (long)time(NULL) ^ (long)clock());
    if (make_dir(dir) != 0 || chdir(dir) != 0 || make_dir("sub") != 0 ||
        !write_file("main.src", source) || !write_file("sub/part.inc", "STATE\r\n"))
        return printf("cannot prepare the working folder %s\n", dir), 1;
    CHECK(p_sc_lex_init() == 0 && p_sc_lex_setup(&tok, &frames, &depth, &words, &declare) == 0);
    if (failures) return 1;
    /* The last keyword loaded is the hash word INCLUDE, code 205, slot 210. */
    CHECK(tok->kind == tk_hash_word && tok->value == 205 && tok->slot == 210);
    for (int i = 0; i < TPLEX_RESERVED_WORDS; ++i) CHECK(words[i].code == i);
    CHECK(strcmp(words[39].word, "<=") == 0 && strcmp(words[117].word, "WINDOW") == 0);
    CHECK(*depth == 0 && *declare == 1 && frames[TPLEX_SOURCE_FRAMES - 1].file == NULL);
#if defined(_WIN32) && !defined(_WIN64)
    /* A 32-bit parser steps through the frames 5212 bytes apart. */
    CHECK(sizeof(source_frame) == 5212 && (char *)&frames[1] - (char *)&frames[0] == 5212);
#elif defined(_WIN64)
    printf("skipped: the 32-bit frame stride of 5212 bytes (a 64-bit build: %u)\n",
           (unsigned)sizeof(source_frame));
#endif
    CHECK(p_sc_lex_init_defines(names, 2) == 0 && strcmp(debug, "DEBUG") == 0);
    CHECK(p_sc_lex_init_file("main.src") == 1);
    pass(1);
    CHECK(p_dict_check() == TPLEX_UNDECLARED_IDENTIFIER && p_rewind_input() == 1); /* afresh */
    pass(0);
    CHECK(p_dict_check() == 0);
    CHECK(strcmp(p_sg_GetError(TPLEX_CANNOT_OPEN_SOURCE), "Cannot Open Source File") == 0);
    p_sg_DisplayError(TPLEX_BAD_CHARACTER);
    CHECK(p_rewind_input() == 1 && frames[1].file != NULL);
    CHECK(p_sg_closesources() == 0 && frames[1].file == NULL && p_sg_closesources() == 0);
    CHECK(p_lex_free() == 0 && p_lex_initialise() == 0 && p_lex_free() == 0);
    CHECK(remove("sub/part.inc") == 0 && remove("main.src") == 0 && rmdir("sub") == 0);
    CHECK(chdir("..") == 0 && rmdir(dir) == 0);
    printf("\n%d passed, %d failed\n", checks - failures, failures);
    return failures == 0 ? 0 : 1;
}

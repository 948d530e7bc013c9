/*
 * Loads the library at run time (dlopen; LoadLibrary on Windows), finds the
 * sixteen exports by name and drives two whole passes through them the way
 * the compiler's parser does, reading the shared records through the
 * addresses sc_lex_setup hands out. The program is not linked with the
 * library: the public header gives it the types, codes and record layouts
 * (which it pins), and TPLEX_CALL the calling convention.
 *
 * The sources are written with CR LF line ends and the main file ends in a
 * byte 0x1A followed by bytes that would be bad characters: the CRs must be
 * dropped and reading must stop at the 0x1A, on every host.
 *
 *   pass_driver [LIBRARY]      (default: tplex.dll, found beside the program)
 */
#ifdef _WIN32
#include <direct.h>
#include <fcntl.h>
#include <io.h>
#include <sys/stat.h>
#include <windows.h>
#define dup _dup
#define dup2 _dup2
#define close _close
#define chdir _chdir
#define rmdir _rmdir
#define make_dir(name) _mkdir(name)
#define open_capture(name) \
    _open(name, _O_CREAT | _O_TRUNC | _O_RDWR | _O_BINARY, _S_IREAD | _S_IWRITE)
#define PART_INC "sub\\part.inc"
#else
#define _POSIX_C_SOURCE 200809L
#include <dlfcn.h>
#include <fcntl.h>
#include <sys/stat.h>
#include <unistd.h>
#define make_dir(name) mkdir(name, 0700)
#define open_capture(name) open(name, O_CREAT | O_TRUNC | O_RDWR, 0600)
#define PART_INC "sub/part.inc"
#endif
#include <stdio.h>
#include <stdlib.h>
#include <string.h>
#include <time.h>

#include "tplex/lexer.h"

static int checks, failures;

#define CHECK(cond) check((cond) != 0, #cond, __LINE__)
static void check(int ok, const char *what, int line) {
    ++checks;
    if (!ok) {
        ++failures;
        printf("pass_driver.c:%d: check failed: %s\n", line, what);
        fflush(stdout);
    }
}

/* The exports, as the parser declares them. */
static status_code(TPLEX_CALL *p_sc_lex_init)(void);
static status_code(TPLEX_CALL *p_sc_lex_init_file)(const char *);
static status_code(TPLEX_CALL *p_sc_lex_setup)(token_record **, source_frame **, int16_t **,
                                               reserved_word_record **, uint8_t **);
static status_code(TPLEX_CALL *p_sc_next_token)(void);
static status_code(TPLEX_CALL *p_sc_lex_init_defines)(char **, int32_t);
static status_code(TPLEX_CALL *p_lex_initialise)(void);
static status_code(TPLEX_CALL *p_lex_free)(void);
static void(TPLEX_CALL *p_back_token)(void);
static status_code(TPLEX_CALL *p_open_source_file)(const char *);
static status_code(TPLEX_CALL *p_rewind_input)(void);
static status_code(TPLEX_CALL *p_parse_ident)(uint8_t, uint8_t);
static status_code(TPLEX_CALL *p_dict_extend)(const char *, const char *, const char *, uint8_t,
                                              uint8_t, uint8_t);
static status_code(TPLEX_CALL *p_dict_check)(void);
static void(TPLEX_CALL *p_sg_DisplayError)(status_code);
static const char *(TPLEX_CALL *p_sg_GetError)(status_code);
static status_code(TPLEX_CALL *p_sg_closesources)(void);

static void *find(void *lib, const char *name) {
#ifdef _WIN32
    FARPROC proc = GetProcAddress((HMODULE)lib, name);
    void *sym;
    memcpy(&sym, &proc, sizeof sym);
#else
    void *sym = dlsym(lib, name);
#endif
    if (sym == NULL) check(0, name, __LINE__);
    return sym;
}

/* The symbol's address copied into the function pointer. */
#define LOAD(lib, name)                           \
    do {                                          \
        void *sym = find(lib, #name);             \
        memcpy(&p_##name, &sym, sizeof p_##name); \
    } while (0)

static int load(const char *path) {
#ifdef _WIN32
    void *lib = (void *)LoadLibraryA(path);
#else
    void *lib = dlopen(path, RTLD_NOW | RTLD_LOCAL);
#endif
    if (lib == NULL) {
        printf("cannot load %s\n", path);
        return 0;
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
    return failures == 0;
}

/* Standard output captured in a file, binary, and read back. */
static int saved_stdout = -1;
static void capture_begin(void) {
    int fd;
    fflush(stdout);
    fd = open_capture("stdout.txt");
    saved_stdout = dup(1);
    dup2(fd, 1);
    close(fd);
}
static const char *capture_end(void) {
    static char text[512];
    size_t n = 0;
    FILE *f;
    fflush(stdout);
    dup2(saved_stdout, 1);
    close(saved_stdout);
    if ((f = fopen("stdout.txt", "rb")) != NULL) {
        n = fread(text, 1, sizeof text - 1, f);
        fclose(f);
    }
    text[n] = '\0';
    remove("stdout.txt");
    return text;
}

static token_record *tok;
static source_frame *frames;
static int16_t *depth;

static int is(status_code r, int kind, int32_t value, const char *text) {
    return r == kind && tok->kind == kind && tok->value == value && strcmp(tok->text, text) == 0;
}

/* One pass over main.src; DEBUG is defined in the first pass only. */
static void pass(int first) {
    CHECK(*depth == 1 && strcmp(frames[1].path, "main.src") == 0 && frames[1].file != NULL);
    CHECK(frames[1].line_no == 0xFFFFFFFFu);
    CHECK(is(p_sc_next_token(), tk_reserved_word, 0, "PROTOCOL"));
    CHECK(frames[1].line_no == 1 && frames[1].read_pos == 8);
    CHECK(strcmp(frames[1].line_text, "PROTOCOL foo 42 \"str\" <= 'c'\n") == 0);
    if (first) { /* a use before any declaration, then definition texts on it */
        CHECK(p_parse_ident(0, 20) == 0 && is(tk_undeclared, tk_undeclared, 20, "FOO"));
        CHECK(p_dict_extend("one", "two", "three", 1, 2, 250) == 0);
    } else {
        CHECK(p_parse_ident(1, 13) == 0 && tok->kind == 13 && tok->value == 1);
    }
    CHECK(is(p_sc_next_token(), tk_number, 42, "42"));
    CHECK(p_sc_next_token() == tk_string && strcmp(tok->text, "str") == 0);
    CHECK(p_sc_next_token() == tk_operator && tok->value == 5);
    CHECK(p_sc_next_token() == tk_char && strcmp(tok->text, "c") == 0);
    p_back_token();
    CHECK(p_sc_next_token() == tk_char && strcmp(tok->text, "c") == 0);

    /* The include, by a relative backslash path; the rest of its line unread. */
    CHECK(is(p_sc_next_token(), tk_reserved_word, 2, "STATE") && *depth == 2);
    CHECK(strcmp(frames[2].path, "sub\\part.inc") == 0 &&
          strcmp(frames[2].line_text, "STATE 7\n") == 0);
    CHECK(is(p_sc_next_token(), tk_number, 7, "7"));
    CHECK(is(p_sc_next_token(), tk_reserved_word, 117, "WINDOW"));
    CHECK(*depth == 1 && frames[2].file == NULL && frames[1].line_no == 3);
    if (first) {
        CHECK(is(p_sc_next_token(), tk_undeclared, 20, "FOO") && tok->has_definition == 1);
        CHECK(strcmp(tok->def_text1, "one") == 0 && strcmp(tok->def_text2, "two") == 0);
        CHECK(strcmp(tok->def_text3, "three") == 0);
        CHECK(tok->def_flag1 == 1 && tok->def_flag2 == 2 && tok->def_flag3 == 250);
    } else {
        CHECK(is(p_sc_next_token(), 13, 1, "FOO") && tok->has_definition == 0);
    }
    CHECK(p_sc_next_token() == tk_number && tok->value == 3); /* LIMIT's body */

    /* A diagnostic names the frame's path and line, as read. */
    capture_begin();
    p_sg_DisplayError(TPLEX_BAD_CHARACTER);
    CHECK(strcmp(capture_end(),
                 "\nTemplate compiler error :\nBad Character\n"
                 "File: main.src    Line: 4\nwindow Foo LIMIT\n") == 0);
    /* A relative name with no include folders: refused, nothing pushed. */
    CHECK(p_open_source_file("missing.src") == TPLEX_NO_INCLUDE_DIRS && *depth == 1);

    if (first) CHECK(is(p_sc_next_token(), tk_reserved_word, 70, "TIMER"));
    /* The 0x1A ended the file: the bytes after it are never read. */
    CHECK(p_sc_next_token() == tk_end_of_input);
    CHECK(*depth == 0 && frames[1].file == NULL);
}

static int write_file(const char *name, const char *bytes) {
    FILE *f = fopen(name, "wb");
    int ok = f != NULL && fwrite(bytes, 1, strlen(bytes), f) == strlen(bytes);
    return f != NULL && fclose(f) == 0 && ok;
}

int main(int argc, char **argv) {
    char dir[512], debug[] = "debug", trace[] = "Trace";
    char *names[2];
    reserved_word_record *words = NULL;
    uint8_t *declare = NULL;
    const char *text;
    int i, codes_ok = 1;

    setvbuf(stdout, NULL, _IONBF, 0);
    if (!load(argc > 1 ? argv[1] : "tplex.dll")) return 1;
    /* A fresh working folder, as the compiler runs in the user's. */
    snprintf(dir, sizeof dir, "tplex-pass-%ld", (long)time(NULL) ^ (long)clock());
    if (make_dir(dir) != 0 || chdir(dir) != 0 || make_dir("sub") != 0 ||
        !write_file("main.src",
                    "#define LIMIT 3\r\nPROTOCOL foo 42 \"str\" <= 'c'\r\n"
                    "#include \"sub\\part.inc\" EXTRA\r\nwindow Foo LIMIT\r\n"
                    "#ifdef DEBUG\r\nTIMER\r\n#endif\r\n\x1A$?\\ \r\n") ||
        !write_file(PART_INC, "STATE 7\r\n")) {
        printf("cannot prepare the working folder %s\n", dir);
        return 1;
    }

    CHECK(p_sc_lex_init() == 0);
    CHECK(p_sc_lex_setup(NULL, NULL, NULL, NULL, NULL) == 0);
    CHECK(p_sc_lex_setup(&tok, &frames, &depth, &words, &declare) == 0);
    if (failures) return 1;
    /* The last keyword loaded is the hash word INCLUDE, code 205, slot 210. */
    CHECK(tok->kind == tk_hash_word && tok->value == 205 && tok->slot == 210);
    CHECK(strcmp(tok->text, "INCLUDE") == 0);
    for (i = 0; i < TPLEX_RESERVED_WORDS; ++i) codes_ok &= words[i].code == i;
    CHECK(codes_ok);
    CHECK(strcmp(words[39].word, "<=") == 0 && strcmp(words[117].word, "WINDOW") == 0);
    CHECK(words[117].word[2499] == 0);
    CHECK(*depth == 0 && *declare == 1);
#if defined(_WIN32) && !defined(_WIN64)
    /* A 32-bit parser steps through the frames 5212 bytes apart. */
    CHECK(sizeof(source_frame) == 5212 && (char *)&frames[1] - (char *)&frames[0] == 5212);
#elif defined(_WIN64)
    printf("skipped: the 32-bit frame stride of 5212 bytes (a 64-bit build: %u)\n",
           (unsigned)sizeof(source_frame));
#endif
    for (i = 0; i < TPLEX_SOURCE_FRAMES; ++i)
        CHECK(frames[i].file == NULL && frames[i].path[0] == 0);

    names[0] = debug;
    names[1] = trace;
    CHECK(p_sc_lex_init_defines(names, 2) == 0);
    CHECK(strcmp(debug, "DEBUG") == 0 && strcmp(trace, "TRACE") == 0);
    CHECK(p_sc_lex_init_file("main.src") == 1);
    pass(1);
    capture_begin();
    CHECK(p_dict_check() == TPLEX_UNDECLARED_IDENTIFIER);
    CHECK(strcmp(capture_end(),
                 "\nUndeclared Identifier: FOO\nNumber of Undeclared Identifiers = 1") == 0);

    /* A further pass from the same main file, with a fresh dictionary. */
    CHECK(p_rewind_input() == 1);
    CHECK(p_dict_check() == 0);
    pass(0);
    CHECK(p_dict_check() == 0);

    capture_begin();
    text = p_sg_GetError(TPLEX_CANNOT_OPEN_SOURCE);
    CHECK(strcmp(capture_end(), "\n\nError:   ") == 0);
    CHECK(strcmp(text, "Cannot Open Source File") == 0);

    /* Closing again finds nothing open; the tables go last. */
    CHECK(p_rewind_input() == 1 && frames[1].file != NULL);
    CHECK(p_sg_closesources() == 0 && frames[1].file == NULL);
    CHECK(p_sg_closesources() == 0);
    CHECK(p_lex_free() == 0);
    CHECK(p_lex_initialise() == 0); /* sc_lex_init's work under its own name */
    CHECK(p_lex_free() == 0);

    remove(PART_INC);
    remove("main.src");
    rmdir("sub");
    CHECK(chdir("..") == 0 && rmdir(dir) == 0);
    printf("%d passed, %d failed\n", checks - failures, failures);
    return failures == 0 ? 0 : 1;
}

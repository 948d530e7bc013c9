/*
 * Drives tplex.dll the way the compiler's parser does: loaded at run time
 * with LoadLibrary, the sixteen functions found by name with GetProcAddress
 * and called with the caller-cleans convention, the shared records read
 * through the addresses that sc_lex_setup hands out.
 *
 * Nothing of tplex/lexer.h is used: the record layouts below are those a
 * separately built parser declares for 32-bit Windows (natural alignment,
 * 4-byte pointers), so this checks the DLL's binary interface itself.
 *
 * The source files are written with CR LF line ends and the main file ends
 * in a byte 0x1A followed by bytes that would be bad characters: the C
 * runtime's text mode has to drop the CRs and stop at the 0x1A.
 */
#include <fcntl.h>
#include <io.h>
#include <stdint.h>
#include <stdio.h>
#include <stdlib.h>
#include <string.h>
#include <sys/stat.h>
#include <windows.h>

/* Token record: 10016 bytes. */
#define TOKEN_KIND 0
#define TOKEN_VALUE 4
#define TOKEN_TEXT 8
#define TOKEN_SLOT 2508
#define TOKEN_DEF_TEXT1 2510
#define TOKEN_DEF_TEXT2 5010
#define TOKEN_DEF_TEXT3 7510
#define TOKEN_HAS_DEFINITION 10010
#define TOKEN_DEF_FLAG1 10011

/* Source frame: 5208 bytes and a 4-byte stream handle, back to back. */
#define FRAME_SIZE 5212
#define FRAME_READ_POS 0
#define FRAME_LINE_NO 4
#define FRAME_PATH 8
#define FRAME_LINE_TEXT 208
#define FRAME_FILE 5208

/* Reserved word record: a 16-bit code and 2500 characters, back to back. */
#define RESERVED_SIZE 2502
#define RESERVED_COUNT 118

#define KIND_NUMBER 1
#define KIND_STRING 2
#define KIND_OPERATOR 3
#define KIND_END 5
#define KIND_RESERVED 9
#define KIND_UNDECLARED 12
#define KIND_CHAR 34

#define UNDECLARED_IDENTIFIER ((int32_t)0xD3470203u)
#define NO_INCLUDE_DIRS ((int32_t)0xD3470209u)
#define CANNOT_OPEN_SOURCE ((int32_t)0xD3470226u)
#define BAD_CHARACTER ((int32_t)0xD3470207u)

typedef int32_t(__cdecl *fn_void)(void);
typedef int32_t(__cdecl *fn_name)(const char *);
typedef int32_t(__cdecl *fn_setup)(unsigned char **, unsigned char **, int16_t **,
                                   unsigned char **, uint8_t **);
typedef int32_t(__cdecl *fn_defines)(char **, int32_t);
typedef void(__cdecl *fn_back)(void);
typedef int32_t(__cdecl *fn_parse_ident)(uint8_t, uint8_t);
typedef int32_t(__cdecl *fn_extend)(const char *, const char *, const char *, uint8_t,
                                    uint8_t, uint8_t);
typedef void(__cdecl *fn_display)(int32_t);
typedef const char *(__cdecl *fn_get_error)(int32_t);

static struct {
    fn_void sc_lex_init;
    fn_name sc_lex_init_file;
    fn_setup sc_lex_setup;
    fn_void sc_next_token;
    fn_defines sc_lex_init_defines;
    fn_void lex_initialise;
    fn_void lex_free;
    fn_back back_token;
    fn_name open_source_file;
    fn_void rewind_input;
    fn_parse_ident parse_ident;
    fn_extend dict_extend;
    fn_void dict_check;
    fn_display sg_DisplayError;
    fn_get_error sg_GetError;
    fn_void sg_closesources;
} lib;

static int failures;
static int checks;

#define CHECK(cond) check((cond) != 0, #cond, __LINE__)
#define CHECK_TEXT(actual, expected) check_text(actual, expected, __LINE__)

static void check(int ok, const char *what, int line) {
    ++checks;
    if (!ok) {
        ++failures;
        printf("dll_loader.c:%d: check failed: %s\n", line, what);
        fflush(stdout);
    }
}

static void check_text(const char *actual, const char *expected, int line) {
    ++checks;
    if (actual == NULL || strcmp(actual, expected) != 0) {
        ++failures;
        printf("dll_loader.c:%d: text differs\n  expected: \"%s\"\n  actual:   \"%s\"\n", line,
               expected, actual == NULL ? "(null)" : actual);
        fflush(stdout);
    }
}

static int32_t i32_at(const unsigned char *p) {
    int32_t v;
    memcpy(&v, p, sizeof v);
    return v;
}

static uint32_t u32_at(const unsigned char *p) {
    uint32_t v;
    memcpy(&v, p, sizeof v);
    return v;
}

static uint16_t u16_at(const unsigned char *p) {
    uint16_t v;
    memcpy(&v, p, sizeof v);
    return v;
}

static void *ptr_at(const unsigned char *p) {
    void *v;
    memcpy(&v, p, sizeof v);
    return v;
}

static const char *str_at(const unsigned char *p) { return (const char *)p; }

/* GetProcAddress's result as a plain function address; the caller casts it
 * to the function's real type. */
static void (*resolve(HMODULE dll, const char *name))(void) {
    FARPROC proc = GetProcAddress(dll, name);
    void (*fn)(void) = NULL;
    if (proc == NULL) {
        printf("GetProcAddress(\"%s\") failed\n", name);
        ++failures;
    }
    memcpy(&fn, &proc, sizeof fn);
    return fn;
}

static int load(void) {
    HMODULE dll = LoadLibraryA("tplex.dll");
    if (dll == NULL) {
        printf("LoadLibrary(\"tplex.dll\") failed: error %lu\n", (unsigned long)GetLastError());
        return 0;
    }
#define RESOLVE(name, type) lib.name = (type)resolve(dll, #name)
    RESOLVE(sc_lex_init, fn_void);
    RESOLVE(sc_lex_init_file, fn_name);
    RESOLVE(sc_lex_setup, fn_setup);
    RESOLVE(sc_next_token, fn_void);
    RESOLVE(sc_lex_init_defines, fn_defines);
    RESOLVE(lex_initialise, fn_void);
    RESOLVE(lex_free, fn_void);
    RESOLVE(back_token, fn_back);
    RESOLVE(open_source_file, fn_name);
    RESOLVE(rewind_input, fn_void);
    RESOLVE(parse_ident, fn_parse_ident);
    RESOLVE(dict_extend, fn_extend);
    RESOLVE(dict_check, fn_void);
    RESOLVE(sg_DisplayError, fn_display);
    RESOLVE(sg_GetError, fn_get_error);
    RESOLVE(sg_closesources, fn_void);
#undef RESOLVE
    return failures == 0;
}

static int write_file(const char *name, const char *bytes, size_t size) {
    FILE *f = fopen(name, "wb");
    if (f == NULL) return 0;
    if (fwrite(bytes, 1, size, f) != size) {
        fclose(f);
        return 0;
    }
    return fclose(f) == 0;
}

/* Standard output captured in a file, in binary mode so that what the DLL
 * wrote is read back byte for byte. */
static char capture_name[MAX_PATH];
static int capture_saved = -1;

static int capture_begin(const char *dir) {
    int fd;
    snprintf(capture_name, sizeof capture_name, "%s\\stdout.txt", dir);
    fflush(stdout);
    fd = _open(capture_name, _O_CREAT | _O_TRUNC | _O_RDWR | _O_BINARY, _S_IREAD | _S_IWRITE);
    if (fd < 0) return 0;
    capture_saved = _dup(1);
    _dup2(fd, 1);
    _close(fd);
    return 1;
}

static void capture_end(char *out, size_t size) {
    FILE *f;
    size_t n = 0;
    fflush(stdout);
    _dup2(capture_saved, 1);
    _close(capture_saved);
    f = fopen(capture_name, "rb");
    if (f != NULL) {
        n = fread(out, 1, size - 1, f);
        fclose(f);
    }
    out[n] = '\0';
    remove(capture_name);
}

static unsigned char *token;
static unsigned char *frames;
static int16_t *depth;
static unsigned char *reserved;
static uint8_t *declare_enabled;

static unsigned char *frame(int index) { return frames + (size_t)index * FRAME_SIZE; }

/* The next token: its result, with kind and value as the record shows them. */
static int32_t next(void) {
    int32_t r = lib.sc_next_token();
    if (r >= 0) CHECK(u16_at(token + TOKEN_KIND) == (uint16_t)r);
    return r;
}

static int token_is(int32_t result, int kind, const char *text) {
    return result == kind && u16_at(token + TOKEN_KIND) == kind &&
           strcmp(str_at(token + TOKEN_TEXT), text) == 0;
}

static void check_layouts(void) {
    int i;
    int codes_ok = 1;
    CHECK(lib.sc_lex_setup(NULL, NULL, NULL, NULL, NULL) == 0);
    CHECK(lib.sc_lex_setup(&token, &frames, &depth, &reserved, &declare_enabled) == 0);
    CHECK(token != NULL && frames != NULL && depth != NULL && reserved != NULL &&
          declare_enabled != NULL);
    if (failures) return;

    /* The last keyword loaded is the hash word INCLUDE, code 205, slot 210. */
    CHECK(u16_at(token + TOKEN_KIND) == 24);
    CHECK(i32_at(token + TOKEN_VALUE) == 205);
    CHECK(strcmp(str_at(token + TOKEN_TEXT), "INCLUDE") == 0);
    CHECK(u16_at(token + TOKEN_SLOT) == 210);

    for (i = 0; i < RESERVED_COUNT; ++i)
        if (u16_at(reserved + (size_t)i * RESERVED_SIZE) != i) codes_ok = 0;
    CHECK(codes_ok);
    CHECK(strcmp(str_at(reserved + 2), "PROTOCOL") == 0);
    CHECK(strcmp(str_at(reserved + 39 * RESERVED_SIZE + 2), "<=") == 0);
    CHECK(strcmp(str_at(reserved + 117 * RESERVED_SIZE + 2), "WINDOW") == 0);
    CHECK(reserved[117 * RESERVED_SIZE + 2 + 2499] == 0);

    CHECK(*depth == 0);
    CHECK(*declare_enabled == 1);
    for (i = 0; i < 20; ++i) {
        CHECK(ptr_at(frame(i) + FRAME_FILE) == NULL);
        CHECK(frame(i)[FRAME_PATH] == '\0');
    }
}

/* One pass over main.src; DEBUG is defined in the first pass only. */
static void pass(int first) {
    int32_t r;
    char line[256];

    CHECK(*depth == 1);
    CHECK(strcmp(str_at(frame(1) + FRAME_PATH), "main.src") == 0);
    CHECK(ptr_at(frame(1) + FRAME_FILE) != NULL);
    CHECK(u32_at(frame(1) + FRAME_LINE_NO) == 0xFFFFFFFFu);

    r = next();
    CHECK(token_is(r, KIND_RESERVED, "PROTOCOL") && i32_at(token + TOKEN_VALUE) == 0);
    /* Text mode: the line arrives with a line feed alone. */
    CHECK(u32_at(frame(1) + FRAME_LINE_NO) == 0);
    CHECK(strcmp(str_at(frame(1) + FRAME_LINE_TEXT), "PROTOCOL foo 42 \"str\" <= 'c'\n") == 0);
    CHECK(u16_at(frame(1) + FRAME_READ_POS) == 8);

    if (first) {
        /* A use before any declaration, then definition texts on it. */
        CHECK(lib.parse_ident(0, 20) == 0);
        CHECK(u16_at(token + TOKEN_KIND) == KIND_UNDECLARED && i32_at(token + TOKEN_VALUE) == 20);
        CHECK(lib.dict_extend("one", "two", "three", 1, 2, 250) == 0);
    } else {
        CHECK(lib.parse_ident(1, 13) == 0);
        CHECK(u16_at(token + TOKEN_KIND) == 13 && i32_at(token + TOKEN_VALUE) == 1);
    }
    CHECK(strcmp(str_at(token + TOKEN_TEXT), "FOO") == 0);

    r = next();
    CHECK(token_is(r, KIND_NUMBER, "42") && i32_at(token + TOKEN_VALUE) == 42);
    CHECK(token_is(next(), KIND_STRING, "str"));
    r = next();
    CHECK(r == KIND_OPERATOR && i32_at(token + TOKEN_VALUE) == 5);
    CHECK(token_is(next(), KIND_CHAR, "c"));
    lib.back_token();
    CHECK(token_is(next(), KIND_CHAR, "c"));

    /* The include, found relative to the working folder by its backslash
     * path; the word after the file name is never read. */
    r = next();
    CHECK(token_is(r, KIND_RESERVED, "STATE") && i32_at(token + TOKEN_VALUE) == 2);
    CHECK(*depth == 2);
    CHECK(strcmp(str_at(frame(2) + FRAME_PATH), "sub\\part.inc") == 0);
    CHECK(strcmp(str_at(frame(2) + FRAME_LINE_TEXT), "STATE 7\n") == 0);
    r = next();
    CHECK(token_is(r, KIND_NUMBER, "7") && i32_at(token + TOKEN_VALUE) == 7);

    r = next();
    CHECK(token_is(r, KIND_RESERVED, "WINDOW") && i32_at(token + TOKEN_VALUE) == 117);
    CHECK(*depth == 1);
    CHECK(ptr_at(frame(2) + FRAME_FILE) == NULL);
    CHECK(u32_at(frame(1) + FRAME_LINE_NO) == 2);

    r = next();
    if (first) {
        CHECK(token_is(r, KIND_UNDECLARED, "FOO") && i32_at(token + TOKEN_VALUE) == 20);
        CHECK(token[TOKEN_HAS_DEFINITION] == 1);
        CHECK(strcmp(str_at(token + TOKEN_DEF_TEXT1), "one") == 0);
        CHECK(strcmp(str_at(token + TOKEN_DEF_TEXT2), "two") == 0);
        CHECK(strcmp(str_at(token + TOKEN_DEF_TEXT3), "three") == 0);
        CHECK(token[TOKEN_DEF_FLAG1] == 1 && token[TOKEN_DEF_FLAG1 + 1] == 2 &&
              token[TOKEN_DEF_FLAG1 + 2] == 250);
    } else {
        CHECK(token_is(r, 13, "FOO") && i32_at(token + TOKEN_VALUE) == 1);
        CHECK(token[TOKEN_HAS_DEFINITION] == 0);
    }

    /* A diagnostic names the frame's path and line, as read. */
    if (capture_begin(".")) {
        lib.sg_DisplayError(BAD_CHARACTER);
        capture_end(line, sizeof line);
        CHECK_TEXT(line, "\nTemplate compiler error :\nBad Character\n"
                         "File: main.src    Line: 3\nwindow Foo\n");
    } else {
        CHECK(!"standard output captured");
    }

    /* A relative name with no include folders: refused, nothing pushed. */
    CHECK(lib.open_source_file("missing.src") == NO_INCLUDE_DIRS);
    CHECK(*depth == 1);

    r = next();
    if (first) CHECK(token_is(r, KIND_RESERVED, "TIMER") && i32_at(token + TOKEN_VALUE) == 70);
    if (first) r = next();
    /* The 0x1A ended the file: the bytes after it are never read. */
    CHECK(r == KIND_END);
    CHECK(*depth == 0);
    CHECK(ptr_at(frame(1) + FRAME_FILE) == NULL);
}

static int write_sources(void) {
    static const char main_src[] =
        "PROTOCOL foo 42 \"str\" <= 'c'\r\n"
        "#include \"sub\\part.inc\" EXTRA\r\n"
        "window Foo\r\n"
        "#ifdef DEBUG\r\n"
        "TIMER\r\n"
        "#endif\r\n"
        "\x1A$?\\ \r\n";
    static const char part_inc[] = "STATE 7\r\n";
    return CreateDirectoryA("sub", NULL) &&
           write_file("main.src", main_src, sizeof main_src - 1) &&
           write_file("sub\\part.inc", part_inc, sizeof part_inc - 1);
}

int main(void) {
    char temp[MAX_PATH];
    char dir[MAX_PATH];
    char names[2][8] = {"debug", "Trace"};
    char *name_list[2];
    char text[256];
    const char *message;

    setvbuf(stdout, NULL, _IONBF, 0);
    if (!load()) return 1;

    /* A fresh working folder, as the compiler runs in the user's. */
    if (GetTempPathA(sizeof temp, temp) == 0 ||
        GetTempFileNameA(temp, "tpl", 0, dir) == 0 || !DeleteFileA(dir) ||
        !CreateDirectoryA(dir, NULL) || !SetCurrentDirectoryA(dir) || !write_sources()) {
        printf("cannot prepare the working folder %s\n", dir);
        return 1;
    }

    CHECK(lib.sc_lex_init() == 0);
    check_layouts();
    if (failures) return 1;

    name_list[0] = names[0];
    name_list[1] = names[1];
    CHECK(lib.sc_lex_init_defines(name_list, 2) == 0);
    CHECK(strcmp(names[0], "DEBUG") == 0 && strcmp(names[1], "TRACE") == 0);

    CHECK(lib.sc_lex_init_file("main.src") == 1);
    pass(1);
    if (capture_begin(".")) {
        CHECK(lib.dict_check() == UNDECLARED_IDENTIFIER);
        capture_end(text, sizeof text);
        CHECK_TEXT(text, "\nUndeclared Identifier: FOO\nNumber of Undeclared Identifiers = 1");
    }

    CHECK(lib.rewind_input() == 1);
    CHECK(lib.dict_check() == 0);
    pass(0);
    CHECK(lib.dict_check() == 0);

    if (capture_begin(".")) {
        message = lib.sg_GetError(CANNOT_OPEN_SOURCE);
        capture_end(text, sizeof text);
        CHECK_TEXT(text, "\n\nError:   ");
        CHECK_TEXT(message, "Cannot Open Source File");
    }

    /* Closing again finds nothing open; the tables go last. */
    CHECK(lib.rewind_input() == 1);
    CHECK(ptr_at(frame(1) + FRAME_FILE) != NULL);
    CHECK(lib.sg_closesources() == 0);
    CHECK(ptr_at(frame(1) + FRAME_FILE) == NULL);
    CHECK(lib.sg_closesources() == 0);
    CHECK(lib.lex_free() == 0);

    /* lex_initialise is sc_lex_init's work under its own name. */
    CHECK(lib.lex_initialise() == 0);
    CHECK(lib.lex_free() == 0);

    SetCurrentDirectoryA(temp);
    {
        char path[MAX_PATH * 2];
        snprintf(path, sizeof path, "%s\\sub\\part.inc", dir);
        DeleteFileA(path);
        snprintf(path, sizeof path, "%s\\sub", dir);
        RemoveDirectoryA(path);
        snprintf(path, sizeof path, "%s\\main.src", dir);
        DeleteFileA(path);
        RemoveDirectoryA(dir);
    }

    printf("%d passed, %d failed\n", checks - failures, failures);
    return failures == 0 ? 0 : 1;
}

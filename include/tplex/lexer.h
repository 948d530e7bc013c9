/*
 * tplex: the lexical analyser of the template compiler.
 *
 * This header is the whole interface between the compiler's parser and the
 * lexer: the status code type and its values, the token kinds, the three
 * records that the parser reads directly through the addresses handed out by
 * sc_lex_setup(), and the sixteen exported functions.
 *
 * Plain C99, usable from C and C++. All state lives in the library and exists
 * once per process; one thread drives it, one call at a time.
 */
#ifndef TPLEX_LEXER_H
#define TPLEX_LEXER_H

#include <stddef.h>
#include <stdint.h>
#include <stdio.h>

#define TPLEX_VERSION_MAJOR 1
#define TPLEX_VERSION_MINOR 0
#define TPLEX_VERSION_PATCH 0
#define TPLEX_VERSION_STRING "1.0.0"

/* ------------------------------------------------------------------------ */
/* Export and calling convention                                            */
/* ------------------------------------------------------------------------ */

/* TPLEX_API marks the sixteen exported functions, TPLEX_CALL gives them the
 * caller-cleans convention (__cdecl on 32-bit Windows). Build the library
 * with TPLEX_BUILDING defined; link the static archive with TPLEX_STATIC. */
#if defined(_WIN32) || defined(__CYGWIN__)
#define TPLEX_CALL __cdecl
#if defined(TPLEX_BUILDING)
#define TPLEX_API __declspec(dllexport)
#elif defined(TPLEX_STATIC)
#define TPLEX_API
#else
#define TPLEX_API __declspec(dllimport)
#endif
#else
#define TPLEX_CALL
#if defined(TPLEX_BUILDING)
#define TPLEX_API __attribute__((visibility("default")))
#else
#define TPLEX_API
#endif
#endif

#ifdef __cplusplus
extern "C" {
#endif

/* ------------------------------------------------------------------------ */
/* Status codes                                                             */
/* ------------------------------------------------------------------------ */

/* 0 is success; other non-negative values are results (a token kind, a
 * source depth). Failures are negative: 0xD347xxxx, and 0xD3431001. */
typedef int32_t status_code;

/* clang-format off */
#define TPLEX_STATUS(v) ((status_code)(int32_t)(uint32_t)(v))

#define TPLEX_OK 0

/* Lexer, preprocessor, dictionary and source files; the texts are those of
 * sg_GetError(). Codes marked "caller" are never returned by the library:
 * they belong to the parser, which shares the message catalogue. */
#define TPLEX_GENERAL_FAILURE          TPLEX_STATUS(0xD3470201u) /* caller: "General Failure Code" */
#define TPLEX_DISASTER                 TPLEX_STATUS(0xD3470202u) /* "Disaster Failure Code" */
#define TPLEX_UNDECLARED_IDENTIFIER    TPLEX_STATUS(0xD3470203u) /* "Undeclared Identifier Used" */
#define TPLEX_END_OF_LINE_IN_STRING    TPLEX_STATUS(0xD3470204u) /* "End of Line in String" */
#define TPLEX_BAD_PDF_STRING           TPLEX_STATUS(0xD3470205u) /* "Bad PDF String" */
#define TPLEX_END_OF_LINE_IN_CHAR      TPLEX_STATUS(0xD3470206u) /* "End of Line in Character" */
#define TPLEX_BAD_CHARACTER            TPLEX_STATUS(0xD3470207u) /* "Bad Character" */
#define TPLEX_NULL_FILENAME            TPLEX_STATUS(0xD3470208u) /* "Null Filename": a null file name */
#define TPLEX_NO_INCLUDE_DIRS          TPLEX_STATUS(0xD3470209u) /* "No Includes to Search for Included File" */
#define TPLEX_TOO_MANY_INCLUDE_DIRS    TPLEX_STATUS(0xD347020Au) /* "Attempting too many Includes" */
#define TPLEX_BAD_DIRECTORY_NAME       TPLEX_STATUS(0xD347020Bu) /* caller: "Bad Directory Name" */
#define TPLEX_MALLOC_FAILED            TPLEX_STATUS(0xD347020Cu) /* "Malloc Failed" */
#define TPLEX_BAD_MATCH_EXPRESSION     TPLEX_STATUS(0xD347020Du) /* caller: "Bad Match Expression" */
#define TPLEX_BAD_BLOCK_START          TPLEX_STATUS(0xD347020Eu) /* caller: "Bad Start to a Block" */
#define TPLEX_BAD_PROTOCOL             TPLEX_STATUS(0xD347020Fu) /* caller: "Bad Protocol" */
#define TPLEX_BAD_TEMPLATE_START       TPLEX_STATUS(0xD3470210u) /* caller: "Bad Template Start" */
#define TPLEX_NOT_INITIALISED          TPLEX_STATUS(0xD3470211u) /* "Initialisation Failed": called before sc_lex_init */
#define TPLEX_RESERVED_WORD_NOT_VALID  TPLEX_STATUS(0xD3470212u) /* caller: "Reserved Word not Valid at this Point" */
#define TPLEX_EXPECTED_BLOCK_WORD      TPLEX_STATUS(0xD3470213u) /* caller: "Expected Reserved Word to Begin Block" */
#define TPLEX_BAD_TEMPLATE_NAME        TPLEX_STATUS(0xD3470214u) /* caller: "Bad Template Name" */
#define TPLEX_BAD_FIELD_START          TPLEX_STATUS(0xD3470215u) /* caller: "Bad Field Start" */
#define TPLEX_BAD_PROTOCOL_END         TPLEX_STATUS(0xD3470216u) /* caller: "Bad Protocol Block End" */
#define TPLEX_BAD_TEMPLATE_END         TPLEX_STATUS(0xD3470217u) /* caller: "Bad Template End" */
#define TPLEX_BAD_DIGIT                TPLEX_STATUS(0xD3470218u) /* "Digit Bad or Incompatible with Number Base" */
#define TPLEX_BAD_CONSTANT_DEFINITION  TPLEX_STATUS(0xD3470219u) /* caller: "Bad Constant Definition" */
#define TPLEX_BAD_TEMPLATE_IDENTIFIER  TPLEX_STATUS(0xD347021Au) /* caller: "Invalid Identifier for Template Name" */
#define TPLEX_DUPLICATE_TEMPLATE       TPLEX_STATUS(0xD347021Bu) /* caller: "Duplicate Template Name" */
#define TPLEX_TEMPLATE_NAME_IN_USE     TPLEX_STATUS(0xD347021Cu) /* caller: "Template Name - identifier already used ..." */
#define TPLEX_INCLUDE_NOT_OPENED       TPLEX_STATUS(0xD347021Du) /* caller: "Include File could not be Opened" */
#define TPLEX_INSTRUCTION_BUFFER_FULL  TPLEX_STATUS(0xD347021Eu) /* caller: "Template Generation Instruction Buffer is Full" */
#define TPLEX_FIELD_BUFFER_FULL        TPLEX_STATUS(0xD347021Fu) /* caller: "Template Generation Field Entry Buffer is Full" */
#define TPLEX_MATCH_VALUE_RANGE        TPLEX_STATUS(0xD3470220u) /* caller: "Message Match Value out of Range for Field Type" */
#define TPLEX_MATCH_NESTING            TPLEX_STATUS(0xD3470221u) /* caller: "Message Match - Too Many Levels of List Nesting" */
#define TPLEX_BAD_NIBBLES              TPLEX_STATUS(0xD3470222u) /* caller: "Not a Valid Nibbles String" */
#define TPLEX_STRING_NOT_ALLOWED       TPLEX_STATUS(0xD3470223u) /* "A String is not Allowed for this type of Field" */
#define TPLEX_CLOSE_FAILED             TPLEX_STATUS(0xD3470224u) /* "Error Closing File" */
#define TPLEX_TOO_MANY_INCLUDE_LEVELS  TPLEX_STATUS(0xD3470225u) /* "Too Many Include Levels" */
#define TPLEX_CANNOT_OPEN_SOURCE       TPLEX_STATUS(0xD3470226u) /* "Cannot Open Source File" */
#define TPLEX_TOO_MANY_MACRO_LEVELS    TPLEX_STATUS(0xD3470227u) /* "Too Many CONST Include Levels" */
#define TPLEX_TYPE_MISMATCH            TPLEX_STATUS(0xD3470228u) /* "Identifier Type Mismatch" */
#define TPLEX_ALREADY_DECLARED         TPLEX_STATUS(0xD3470229u) /* "This Identifier has Already been Declared" */
#define TPLEX_IDENTIFIER_EXPECTED      TPLEX_STATUS(0xD347022Au) /* "An Identifier is Expected at this Point" */
#define TPLEX_STRING_EXPECTED          TPLEX_STATUS(0xD347022Bu) /* "A String is Expected at this Point" */
#define TPLEX_TOO_MANY_COND_LEVELS     TPLEX_STATUS(0xD347022Cu) /* "Too Many Nested Layers of Hash" */
#define TPLEX_UNEXPECTED_HASH_WORD     TPLEX_STATUS(0xD347022Du) /* "Unexpected Hash Word" */
#define TPLEX_EXTRA_ENDIF              TPLEX_STATUS(0xD347022Eu) /* "Extra #endif Encountered" */
#define TPLEX_BAD_HASH_WORD            TPLEX_STATUS(0xD347022Fu) /* "Unrecognisd or Invalid Hash Word" */
#define TPLEX_BAD_GENERATE_VALUE       TPLEX_STATUS(0xD3470230u) /* caller: "Invalid Generate Field Value" */
                                                                 /* 0xD3470231: no text */
#define TPLEX_FIELD_NOT_PRESENT        TPLEX_STATUS(0xD3470232u) /* caller: "Not an allowed field not present statement" */

/* Beyond the catalogue: no text of their own. */
#define TPLEX_MACRO_REDEFINED          TPLEX_STATUS(0xD3470234u) /* #define with a body of a name already known */
#define TPLEX_MACRO_TOO_LONG           TPLEX_STATUS(0xD3470235u) /* #define body would reach 2500 characters */
#define TPLEX_MACRO_BAD_TOKEN          TPLEX_STATUS(0xD3470236u) /* #define body token of a kind not allowed */
#define TPLEX_ALREADY_DEFINED          TPLEX_STATUS(0xD3431001u) /* sc_lex_init_defines: name already known */

/* Table output module (tplex/table_output.h); no text in the catalogue. */
#define TPLEX_OUT_TOO_MANY_REFERENCES  TPLEX_STATUS(0xD347000Bu) /* 50000 reference ids handed out */
#define TPLEX_OUT_BAD_TARGET_ID        TPLEX_STATUS(0xD347000Cu) /* target set for an id not handed out */
#define TPLEX_OUT_DOUBLE_DEFINITION    TPLEX_STATUS(0xD347000Du) /* target of an id set twice */
#define TPLEX_OUT_BAD_USE_ID           TPLEX_STATUS(0xD347000Eu) /* use created for an id not handed out */
#define TPLEX_OUT_NO_MEMORY_RELOC      TPLEX_STATUS(0xD347000Fu) /* no memory for a relocation record */
#define TPLEX_OUT_NO_MEMORY_CHUNK      TPLEX_STATUS(0xD3470010u) /* no memory for a string store or memory chunk */
#define TPLEX_OUT_WRITE_FAILED         TPLEX_STATUS(0xD3470011u) /* a byte could not be written to the file */
#define TPLEX_OUT_CANNOT_OPEN          TPLEX_STATUS(0xD3470012u) /* the table file cannot be opened */
#define TPLEX_OUT_NO_MEMORY_TABLES     TPLEX_STATUS(0xD3470013u) /* no memory for the store or the relocatables */
#define TPLEX_OUT_STRING_TABLE_DAMAGED TPLEX_STATUS(0xD3470014u) /* string chain shorter than its total */
#define TPLEX_OUT_UNUSED_REFERENCE     TPLEX_STATUS(0xD3470015u) /* an id without any use at close */
#define TPLEX_OUT_UNDEFINED_REFERENCE  TPLEX_STATUS(0xD3470016u) /* an id never defined at close */
#define TPLEX_OUT_OUT_OF_RANGE         TPLEX_STATUS(0xD3470017u) /* a location or target at R or beyond */
#define TPLEX_OUT_SEEK_FAILED          TPLEX_STATUS(0xD3470018u) /* the seek back to the header failed */
#define TPLEX_OUT_NOT_OPEN             TPLEX_STATUS(0xD3470019u) /* AbandonOutput with no output open */
#define TPLEX_OUT_TOO_MANY_BLOCKS      TPLEX_STATUS(0xD347001Au) /* BeginBlock with 100 blocks open */
#define TPLEX_OUT_NO_OPEN_BLOCK        TPLEX_STATUS(0xD347001Bu) /* EndBlock with no block open */
#define TPLEX_OUT_STRING_TOO_LONG      TPLEX_STATUS(0xD347001Cu) /* a string of 10000 characters or more; nothing stored */

/* clang-format on */

/* ------------------------------------------------------------------------ */
/* Token kinds                                                              */
/* ------------------------------------------------------------------------ */

/* The kind of a token in token_record.kind, and of a dictionary entry. */
enum token_kind {
    tk_number = 1,   /* value: the number; text: its digits */
    tk_string = 2,   /* text: contents without the quotes */
    tk_operator = 3, /* value: character code, or 2..11 for a pair */
    tk_macro = 4,    /* name defined with a body (never delivered) */
    tk_end_of_input = 5,
    tk_reserved_word = 9,    /* value: reserved word code 0..117 */
    tk_new_identifier = 10,  /* text: the name, upper case */
    tk_undeclared = 12,      /* value: the class of its first use */
    tk_first_class = 13,     /* 13..27: declared identifier classes */
    tk_label = 16,           /* generated label (also a class) */
    tk_hash_word = 24,       /* value: 201..205 (never delivered) */
    tk_hash_definition = 25, /* value: 0 (#define) or 2 (predefined) */
    tk_last_class = 27,
    tk_pdf_string = 33, /* text: contents without <" and "> */
    tk_char = 34,       /* text: the one character */
    tk_end_of_line = 36 /* a scan result only (never delivered) */
};

/* Operator values of the two-character operators (kind tk_operator). */
enum token_operator {
    op_slash_equal = 2,   /* /= */
    op_or_or = 3,         /* || */
    op_and_and = 4,       /* && */
    op_less_equal = 5,    /* <= */
    op_greater_equal = 6, /* >= */
    op_shift_left = 7,    /* << */
    op_shift_right = 8,   /* >> */
    op_dot_dot = 9,       /* .. */
    op_xor_xor = 10,      /* ^^ */
    op_not_equal = 11     /* != */
};

/* Hash word codes (value of a tk_hash_word token). */
enum hash_word_code {
    hw_define = 201,
    hw_ifdef = 202,
    hw_ifndef = 203,
    hw_endif = 204,
    hw_include = 205
};

/* ------------------------------------------------------------------------ */
/* Limits                                                                   */
/* ------------------------------------------------------------------------ */

#define TPLEX_TEXT_SIZE 2500   /* token texts and definition texts */
#define TPLEX_LINE_SIZE 5000   /* a source line buffer */
#define TPLEX_PATH_SIZE 200    /* a source frame's path */
#define TPLEX_SOURCE_FRAMES 20 /* source stack frames; frame 0 holds no file */
#define TPLEX_RESERVED_WORDS 118
#define TPLEX_HASH_WORDS 5

/* ------------------------------------------------------------------------ */
/* Shared records                                                           */
/* ------------------------------------------------------------------------ */

/* current_token: the one record of the token scanned last. Fields that a
 * token does not set keep what the token before left there. */
typedef struct token_record {
    uint16_t kind;                   /* token kind */
    int32_t value;                   /* number, operator or dictionary code */
    char text[TPLEX_TEXT_SIZE];      /* token text, NUL-terminated */
    uint16_t slot;                   /* dictionary slot of the last lookup */
    char def_text1[TPLEX_TEXT_SIZE]; /* definition texts of the entry found */
    char def_text2[TPLEX_TEXT_SIZE];
    char def_text3[TPLEX_TEXT_SIZE];
    uint8_t has_definition; /* 1 when the entry found has them */
    uint8_t def_flag1;
    uint8_t def_flag2;
    uint8_t def_flag3;
} token_record;

/* One frame of the source stack: a file being read. */
typedef struct source_frame {
    uint16_t read_pos;               /* next character in line_text */
    uint32_t line_no;                /* 0-based line number; all ones before the first */
    char path[TPLEX_PATH_SIZE];      /* the path the file was opened under */
    char line_text[TPLEX_LINE_SIZE]; /* the current line, with its line feed */
    FILE *file;                      /* the open stream, or null */
} source_frame;

/* One record of the reserved word table; 118 of them back to back. */
typedef struct reserved_word_record {
    uint16_t code;              /* equals the record's index */
    char word[TPLEX_TEXT_SIZE]; /* upper case, zero-filled */
} reserved_word_record;

/* The layout is part of the interface: pin it. */
#if defined(__cplusplus)
#define TPLEX_STATIC_ASSERT(c, m) static_assert(c, m)
#elif defined(__STDC_VERSION__) && __STDC_VERSION__ >= 201112L
#define TPLEX_STATIC_ASSERT(c, m) _Static_assert(c, m)
#else
#define TPLEX_SA_CAT2(a, b) a##b
#define TPLEX_SA_CAT(a, b) TPLEX_SA_CAT2(a, b)
#define TPLEX_STATIC_ASSERT(c, m) \
    typedef char TPLEX_SA_CAT(tplex_layout_check_, __LINE__)[(c) ? 1 : -1]
#endif

#define TPLEX_OFFSET(t, f) offsetof(t, f)

TPLEX_STATIC_ASSERT(TPLEX_OFFSET(token_record, kind) == 0, "token_record.kind");
TPLEX_STATIC_ASSERT(TPLEX_OFFSET(token_record, value) == 4, "token_record.value");
TPLEX_STATIC_ASSERT(TPLEX_OFFSET(token_record, text) == 8, "token_record.text");
TPLEX_STATIC_ASSERT(TPLEX_OFFSET(token_record, slot) == 2508, "token_record.slot");
TPLEX_STATIC_ASSERT(TPLEX_OFFSET(token_record, def_text1) == 2510, "token_record.def_text1");
TPLEX_STATIC_ASSERT(TPLEX_OFFSET(token_record, def_text2) == 5010, "token_record.def_text2");
TPLEX_STATIC_ASSERT(TPLEX_OFFSET(token_record, def_text3) == 7510, "token_record.def_text3");
TPLEX_STATIC_ASSERT(TPLEX_OFFSET(token_record, has_definition) == 10010,
                    "token_record.has_definition");
TPLEX_STATIC_ASSERT(TPLEX_OFFSET(token_record, def_flag1) == 10011, "token_record.def_flag1");
TPLEX_STATIC_ASSERT(TPLEX_OFFSET(token_record, def_flag2) == 10012, "token_record.def_flag2");
TPLEX_STATIC_ASSERT(TPLEX_OFFSET(token_record, def_flag3) == 10013, "token_record.def_flag3");
TPLEX_STATIC_ASSERT(sizeof(token_record) == 10016, "token_record size");

TPLEX_STATIC_ASSERT(TPLEX_OFFSET(source_frame, read_pos) == 0, "source_frame.read_pos");
TPLEX_STATIC_ASSERT(TPLEX_OFFSET(source_frame, line_no) == 4, "source_frame.line_no");
TPLEX_STATIC_ASSERT(TPLEX_OFFSET(source_frame, path) == 8, "source_frame.path");
TPLEX_STATIC_ASSERT(TPLEX_OFFSET(source_frame, line_text) == 208, "source_frame.line_text");
TPLEX_STATIC_ASSERT(TPLEX_OFFSET(source_frame, file) == 5208, "source_frame.file");
TPLEX_STATIC_ASSERT(sizeof(source_frame) == 5208 + sizeof(FILE *), "source_frame size");

TPLEX_STATIC_ASSERT(TPLEX_OFFSET(reserved_word_record, code) == 0, "reserved_word_record.code");
TPLEX_STATIC_ASSERT(TPLEX_OFFSET(reserved_word_record, word) == 2, "reserved_word_record.word");
TPLEX_STATIC_ASSERT(sizeof(reserved_word_record) == 2502, "reserved_word_record size");

/* ------------------------------------------------------------------------ */
/* The sixteen exported functions                                           */
/* ------------------------------------------------------------------------ */

/* Creates the library's state: dictionary, macro and source stacks, the
 * 118 reserved words and 5 hash words. 0, or TPLEX_MALLOC_FAILED. */
TPLEX_API status_code TPLEX_CALL sc_lex_init(void);

/* Opens the main source file as frame 1. The new source depth (1 or more),
 * or a failure code of open_source_file(). */
TPLEX_API status_code TPLEX_CALL sc_lex_init_file(const char *name);

/* Writes through each non-null out-pointer: the address of current_token,
 * of the source stack's frames (valid from sc_lex_init on), of
 * source_depth, of the reserved word table and of declare_enabled.
 * Always 0. */
TPLEX_API status_code TPLEX_CALL sc_lex_setup(token_record **token, source_frame **frames,
                                              int16_t **depth,
                                              reserved_word_record **reserved_words,
                                              uint8_t **declare_enabled);

/* Scans the next token into current_token, running the preprocessor on the
 * way. Its kind (tk_end_of_input at the end), or a failure code; the next
 * call scans on after a failure. */
TPLEX_API status_code TPLEX_CALL sc_next_token(void);

/* Predefines names as tk_hash_definition with value 2, turning each of the
 * caller's strings to upper case in place. 0, or TPLEX_ALREADY_DEFINED at
 * the first name already known, or the failure of storing one
 * (TPLEX_MALLOC_FAILED, or TPLEX_DISASTER with the dictionary full); the
 * names before it stay defined. */
TPLEX_API status_code TPLEX_CALL sc_lex_init_defines(char **names, int32_t count);

/* What sc_lex_init() runs. 0, or TPLEX_MALLOC_FAILED with nothing kept. */
TPLEX_API status_code TPLEX_CALL lex_initialise(void);

/* Releases the dictionary, its definitions and both stacks. Always 0. */
TPLEX_API status_code TPLEX_CALL lex_free(void);

/* Gives the token just received back: the next scan returns it again. */
TPLEX_API void TPLEX_CALL back_token(void);

/* Pushes a source frame for a file, searching the include directories for
 * a relative name. The new source depth; or TPLEX_TOO_MANY_INCLUDE_LEVELS
 * with the stack as it was; or TPLEX_CANNOT_OPEN_SOURCE or
 * TPLEX_NO_INCLUDE_DIRS with the depth as it was and the frame above it
 * holding no file (read_pos 0, line_no 0xFFFFFFFF, file null). */
TPLEX_API status_code TPLEX_CALL open_source_file(const char *name);

/* Resets the lexer to the keywords, closes every source and reopens the
 * main file for a further pass. As open_source_file(). */
TPLEX_API status_code TPLEX_CALL rewind_input(void);

/* Reads the next token as an identifier and declares it with class_
 * (declare non-zero) or checks a use of it against class_. 0, the token's
 * result while declarations are switched off, or a failure code. */
TPLEX_API status_code TPLEX_CALL parse_ident(uint8_t declare, uint8_t class_);

/* Attaches three texts and three flags to the entry looked up last (at
 * current_token.slot). 0, or TPLEX_MALLOC_FAILED. */
TPLEX_API status_code TPLEX_CALL dict_extend(const char *text1, const char *text2,
                                             const char *text3, uint8_t flag1, uint8_t flag2,
                                             uint8_t flag3);

/* Prints every identifier used and never declared, and their number.
 * 0, or TPLEX_UNDECLARED_IDENTIFIER. */
TPLEX_API status_code TPLEX_CALL dict_check(void);

/* Prints the message of a status code with the current file, line number
 * and line on standard output. */
TPLEX_API void TPLEX_CALL sg_DisplayError(status_code code);

/* Prints "\n\nError:   " on standard output and returns the message text of
 * a status code: static, constant, never null. */
TPLEX_API const char *TPLEX_CALL sg_GetError(status_code code);

/* Closes every open source file. 0, or TPLEX_CLOSE_FAILED when a close
 * failed (the others are still closed). */
TPLEX_API status_code TPLEX_CALL sg_closesources(void);

#ifdef __cplusplus
}
#endif

#endif /* TPLEX_LEXER_H */

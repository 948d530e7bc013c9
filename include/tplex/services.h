/*
 * tplex parser services: the operations a parser has beyond the sixteen
 * exports, for a parser that links the static archive: libtplex.a, the CMake
 * target tplex::tplex_static, or by hand
 *   cc -DTPLEX_STATIC ... -Wl,-Bstatic $(pkg-config --static --libs tplex) -Wl,-Bdynamic
 * The shared library and the DLL do not export them.
 *
 * Plain C99, usable from C and C++. The same rules as tplex/lexer.h: every
 * operation runs on the one lexer state of the process, between sc_lex_init
 * and lex_free unless it says otherwise.
 */
#ifndef TPLEX_SERVICES_H
#define TPLEX_SERVICES_H

#include <stddef.h>
#include <stdint.h>

#include "tplex/lexer.h"

#ifdef __cplusplus
extern "C" {
#endif

/* ------------------------------------------------------------------------ */
/* Reserved words and hash words                                            */
/* ------------------------------------------------------------------------ */

/* The reserved words in code order, X(name, spelling): a reserved word token
 * (kind tk_reserved_word) has its code in value, and reserved_word_table
 * holds the same words at the same indices. The hash words' codes are the
 * hash_word_code enum of tplex/lexer.h (hw_define ... hw_include). */
#define TPLEX_RESERVED_WORD_LIST(X)            \
    X(rw_protocol, "PROTOCOL")                 \
    X(rw_process, "PROCESS")                   \
    X(rw_state, "STATE")                       \
    X(rw_nextstate, "NEXTSTATE")               \
    X(rw_input, "INPUT")                       \
    X(rw_undefined, "UNDEFINED")               \
    X(rw_output, "OUTPUT")                     \
    X(rw_all, "ALL")                           \
    X(rw_int, "INT")                           \
    X(rw_bit, "BIT")                           \
    X(rw_nibble, "NIBBLE")                     \
    X(rw_byte, "BYTE")                         \
    X(rw_template, "TEMPLATE")                 \
    X(rw_type, "TYPE")                         \
    X(rw_message, "MESSAGE")                   \
    X(rw_match, "MATCH")                       \
    X(rw_generate, "GENERATE")                 \
    X(rw_block, "BLOCK")                       \
    X(rw_signal, "SIGNAL")                     \
    X(rw_signalroute, "SIGNALROUTE")           \
    X(rw_connect, "CONNECT")                   \
    X(rw_endblock, "ENDBLOCK")                 \
    X(rw_start, "START")                       \
    X(rw_dcl, "DCL")                           \
    X(rw_endprocess, "ENDPROCESS")             \
    X(rw_endstate, "ENDSTATE")                 \
    X(rw_from, "FROM")                         \
    X(rw_env, "ENV")                           \
    X(rw_to, "TO")                             \
    X(rw_with, "WITH")                         \
    X(rw_task, "TASK")                         \
    X(rw_via, "VIA")                           \
    X(rw_and, "AND")                           \
    X(rw_bool, "BOOL")                         \
    X(rw_stop, "STOP")                         \
    X(rw_uint, "UINT")                         \
    X(rw_ubyte, "UBYTE")                       \
    X(rw_or, "OR")                             \
    X(rw_not, "NOT")                           \
    X(rw_less_equal, "<=")                     \
    X(rw_greater_equal, ">=")                  \
    X(rw_slash_equal, "/=")                    \
    X(rw_true, "TRUE")                         \
    X(rw_false, "FALSE")                       \
    X(rw_xor, "XOR")                           \
    X(rw_decision, "DECISION")                 \
    X(rw_else, "ELSE")                         \
    X(rw_enddecision, "ENDDECISION")           \
    X(rw_inmsg, "INMSG")                       \
    X(rw_sequencevalidity, "SEQUENCEVALIDITY") \
    X(rw_valid, "VALID")                       \
    X(rw_invalid, "INVALID")                   \
    X(rw_unknown, "UNKNOWN")                   \
    X(rw_recordnumber, "RECORDNUMBER")         \
    X(rw_previousinseq, "PREVIOUSINSEQ")       \
    X(rw_selectcode, "SELECTCODE")             \
    X(rw_charstring, "CHARSTRING")             \
    X(rw_nocreate, "NOCREATE")                 \
    X(rw_processkey, "PROCESSKEY")             \
    X(rw_join, "JOIN")                         \
    X(rw_link, "LINK")                         \
    X(rw_unlink, "UNLINK")                     \
    X(rw_pid, "PID")                           \
    X(rw_self, "SELF")                         \
    X(rw_parent, "PARENT")                     \
    X(rw_offspring, "OFFSPRING")               \
    X(rw_sender, "SENDER")                     \
    X(rw_set, "SET")                           \
    X(rw_active, "ACTIVE")                     \
    X(rw_reset, "RESET")                       \
    X(rw_timer, "TIMER")                       \
    X(rw_outmsg, "OUTMSG")                     \
    X(rw_use, "USE")                           \
    X(rw_standard, "STANDARD")                 \
    X(rw_time, "TIME")                         \
    X(rw_duration, "DURATION")                 \
    X(rw_now, "NOW")                           \
    X(rw_timestamp, "TIMESTAMP")               \
    X(rw_eventtype, "EVENTTYPE")               \
    X(rw_eventstatus, "EVENTSTATUS")           \
    X(rw_length, "LENGTH")                     \
    X(rw_jan, "JAN")                           \
    X(rw_feb, "FEB")                           \
    X(rw_mar, "MAR")                           \
    X(rw_apr, "APR")                           \
    X(rw_may, "MAY")                           \
    X(rw_jun, "JUN")                           \
    X(rw_jul, "JUL")                           \
    X(rw_aug, "AUG")                           \
    X(rw_sep, "SEP")                           \
    X(rw_oct, "OCT")                           \
    X(rw_nov, "NOV")                           \
    X(rw_dec, "DEC")                           \
    X(rw_system, "SYSTEM")                     \
    X(rw_channelroute, "CHANNELROUTE")         \
    X(rw_control, "CONTROL")                   \
    X(rw_log, "LOG")                           \
    X(rw_stream, "STREAM")                     \
    X(rw_userinterface, "USERINTERFACE")       \
    X(rw_endchannelroute, "ENDCHANNELROUTE")   \
    X(rw_referenced, "REFERENCED")             \
    X(rw_in, "IN")                             \
    X(rw_on, "ON")                             \
    X(rw_pc, "PC")                             \
    X(rw_dass, "DASS")                         \
    X(rw_endsystem, "ENDSYSTEM")               \
    X(rw_calltraceid, "CALLTRACEID")           \
    X(rw_dynamic, "DYNAMIC")                   \
    X(rw_static, "STATIC")                     \
    X(rw_field, "FIELD")                       \
    X(rw_value, "VALUE")                       \
    X(rw_position, "POSITION")                 \
    X(rw_mask, "MASK")                         \
    X(rw_crc, "CRC")                           \
    X(rw_protect, "PROTECT")                   \
    X(rw_source, "SOURCE")                     \
    X(rw_header, "HEADER")                     \
    X(rw_window, "WINDOW")

enum reserved_word_code {
#define TPLEX_RESERVED_WORD_CODE(name, spelling) name,
    TPLEX_RESERVED_WORD_LIST(TPLEX_RESERVED_WORD_CODE)
#undef TPLEX_RESERVED_WORD_CODE
        rw_code_count /* 118, TPLEX_RESERVED_WORDS */
};

/* ------------------------------------------------------------------------ */
/* Include directories                                                      */
/* ------------------------------------------------------------------------ */

/* Appends a directory to the list searched for a relative file name (the
 * main file's and every #include's): each is tried in order as directory,
 * one backslash, name. Once the list holds a directory, a relative name is
 * looked for in the list only. 0; TPLEX_TOO_MANY_INCLUDE_DIRS when the list
 * holds 9 already; TPLEX_BAD_DIRECTORY_NAME for a null directory or one
 * longer than 254 characters. The list is unchanged on failure.
 * lex_initialise and rewind_input empty the list. */
status_code add_include_dir(const char *dir);

/* ------------------------------------------------------------------------ */
/* Labels and string arguments                                              */
/* ------------------------------------------------------------------------ */

/* Declares (mode 1) or checks (any other mode) the label "$LAB-" followed by
 * number in five digits, which no source text can spell. Declaring stores it
 * with kind tk_label and the given code. 0; TPLEX_DISASTER when a declared
 * label exists already or a checked one does not; TPLEX_MALLOC_FAILED when a
 * declared label cannot be stored. */
status_code make_label(uint16_t number, int16_t code, uint8_t mode);

/* Reads the next token (as sc_next_token does) where a string argument is
 * forbidden (mode 0), optional (mode 1) or required (any other mode), and
 * copies a string's text into out, which holds at least TPLEX_TEXT_SIZE
 * bytes. A token that is not a string is given back (back_token) in modes 0
 * and 1, with out emptied. 0; TPLEX_STRING_NOT_ALLOWED (mode 0, a string);
 * TPLEX_STRING_EXPECTED (a required string missing); or the token reader's
 * failure, out untouched. */
status_code parse_string(char *out, uint8_t mode);

/* ------------------------------------------------------------------------ */
/* File names                                                               */
/* ------------------------------------------------------------------------ */

/* A file name taken apart into directory, name and extension. "$" as the
 * name is a marker for a default name (apply_default_name). */
typedef struct file_spec {
    char dir_part[200]; /* before the last separator; empty if none */
    char name_part[80]; /* the name, without an extension split off */
    char ext_part[16];  /* the expected extension when it was split off */
} file_spec;

/* Splits path (changed in place: it loses its directory) into out. The last
 * separator ("\" or "/") splits off the directory unless it is the path's
 * first character; the extension is split off only when it equals
 * expected_ext exactly. A part too long for its field is cut to the field,
 * and file_spec_invalid then refuses it. Null texts read as empty. */
void split_file_spec(char *path, const char *expected_ext, file_spec *out);
/* Puts name in place of a name_part that is exactly "$"; otherwise, or with
 * a null name, changes nothing. */
void apply_default_name(file_spec *parts, const char *name);
/* 1 when the parts do not make a valid file name: a directory of more than 100, a name
 * of more than 40 or an extension of more than 10 characters (or a field
 * without its NUL), a directory without a name, or a character not allowed
 * where it stands (the "$" marker included); 0 when it is valid. */
uint8_t file_spec_invalid(const file_spec *parts);

/* ------------------------------------------------------------------------ */
/* The dictionary listing and diagnostics                                   */
/* ------------------------------------------------------------------------ */

/* Prints the dictionary on standard output, one line per occupied slot
 * (slot, kind name, name), leaving out the reserved words and hash words
 * unless all is non-zero. After the 9th line and every 10 lines after it,
 * waits for a key: a character other than NUL on standard input, or its end. */
void dict_list(uint8_t all);
/* dict_list, waiting for a key only when pause is non-zero (a program whose
 * output goes to a file or a pipe has no one to press it). */
void tplex_dict_list(uint8_t all, int pause);

/* ------------------------------------------------------------------------ */
/* What a pass leaves open                                                  */
/* ------------------------------------------------------------------------ */

/* A place in a source file: the path as the source stack held it, and a
 * line counted from 1. */
typedef struct tplex_place {
    char path[TPLEX_PATH_SIZE];
    uint32_t line;
} tplex_place;

/* The #ifdef/#ifndef regions open now, outermost first: fills up to
 * capacity places with where each was opened and returns how many are open
 * (0 to 20). places may be null. Valid between sc_lex_init and lex_free. */
int32_t tplex_open_regions(tplex_place *places, int32_t capacity);

/* A running count of the block comments that have run past the end of the
 * file they were in (compare it before and after a call); a comment is
 * counted once, at the first file end it passes. The last one counted goes
 * to *ended (the file that ended and its last line) and *opened_line (the
 * line of that file where it began, or 0 when it began in a defined name's
 * body). Either pointer may be null. */
uint32_t tplex_comments_past_file_end(tplex_place *ended, uint32_t *opened_line);

/* Writes the diagnostic that sg_DisplayError(code) prints (its message, then
 * the current file, line number and line) into buffer as a NUL-terminated
 * text, and returns its full length. When the result is size or more, the
 * text was cut to size - 1 characters; TPLEX_DIAGNOSTIC_SIZE always holds
 * it whole. With size 0 nothing is written (buffer may then be null). */
size_t sg_FormatError(status_code code, char *buffer, size_t size);

/* Room for any diagnostic: the heading, a message, a path of 199 and a line
 * of 4999 characters, the line number and the NUL. */
#define TPLEX_DIAGNOSTIC_SIZE 5400

#ifdef __cplusplus
}
#endif

#endif /* TPLEX_SERVICES_H */

// The character source: hands the scanner one character at a time from the
// innermost pending macro body, else from the current source line, refilling
// lines and popping finished files as it goes.
//
// Fast path: read_cursor points at the next character of the buffer being
// read. Both kinds of buffer end in a NUL, so read_char and peek_char take a
// non-NUL character inline; everything else (the end of a body or a line, a
// pop, a refill, a cursor that must be derived again) goes through the
// out-of-line slow path, which follows the stacks exactly.
#ifndef TPLEX_SCAN_CHAR_SOURCE_H
#define TPLEX_SCAN_CHAR_SOURCE_H

#include <cstdint>

#include "base/compiler.h"
#include "base/limits.h"
#include "tplex/lexer.h"

namespace tplex {

// Character codes with a fixed meaning for the scanner.
inline constexpr std::uint8_t ch_end_of_body = 0;
inline constexpr std::uint8_t ch_comment_open = 251;   // "/*"
inline constexpr std::uint8_t ch_comment_close = 252;  // "*/"
inline constexpr std::uint8_t ch_line_comment = 253;   // "//"
inline constexpr std::uint8_t ch_end_of_input = 255;

// One pending macro body. The read position is wider than a byte, so a body
// of any length that fits (up to 2499 characters) is read to its end.
struct macro_frame {
    std::uint32_t read_pos;             // next character of body
    std::uint32_t length;               // characters in body before its NUL
    char body[text_size + read_slack];  // the NUL is followed by zero bytes
};

// The character source's state: the macro stack and the cursor. Of the
// source stack's frames it writes only read_pos, its cursor's place in a
// line, kept in the frame because the parser reads it there.
extern macro_frame *macro_stack;  // macro_frame_count frames; depth d is index d - 1
extern TPLEX_INTERNAL std::uint16_t macro_depth;

// The buffer read_cursor points into, so its position can be stored back.
enum class cursor_owner : std::uint8_t { none, macro, file };
struct cursor_origin {
    cursor_owner owner;
    int index;  // macro frame index, or source depth
    const unsigned char *base;
};
extern cursor_origin cursor_from;
extern TPLEX_INTERNAL const unsigned char *read_cursor;
// While the cursor reads a file's line: that line, and its frame's read_pos,
// so the position can be stored back cheaply. Otherwise the position is
// stored, without a test, into a spare that nothing reads.
extern TPLEX_INTERNAL const unsigned char *cursor_line;
extern TPLEX_INTERNAL std::uint16_t *cursor_line_pos;
extern TPLEX_INTERNAL std::uint16_t spare_line_pos;

inline bool cursor_reads_file() {
    return cursor_line_pos != &spare_line_pos;
}

std::uint8_t read_char_slow();

// The cursor has taken the line feed that ends a file's line: when the file
// has another line, reads it and points the cursor at its start (what the
// next read_char would do, without taking the first character). false, with
// nothing changed, when the general path must decide (a pending body, the
// end of the file).
bool next_file_line();
std::uint8_t peek_char_slow();

// Takes the next character.
inline std::uint8_t read_char() {
    std::uint8_t c = *read_cursor;
    if (c != 0) {
        ++read_cursor;
        return c;
    }
    return read_char_slow();
}

// The character read_char would take from the current buffer, or a blank
// where that buffer has nothing left; takes nothing.
inline std::uint8_t peek_char() {
    std::uint8_t c = *read_cursor;
    return c != 0 ? c : peek_char_slow();
}

// read_char with the comment brackets folded into their marker codes.
inline std::uint8_t next_char() {
    std::uint8_t c = read_char();
    if (c == '/') {
        std::uint8_t n = peek_char();
        if (n == '*') {
            read_char();
            return ch_comment_open;
        }
        if (n == '/') {
            read_char();
            return ch_line_comment;
        }
    } else if (c == '*' && peek_char() == '/') {
        read_char();
        return ch_comment_close;
    }
    return c;
}

// Allocates the macro stack: 0 or TPLEX_MALLOC_FAILED.
status_code char_source_create();
// The stacks' storage is going away: drops the cursor without storing it
// and releases the macro stack.
void char_source_destroy();

// Pushes a body (at most 2499 characters are kept). 0, or
// TPLEX_TOO_MANY_MACRO_LEVELS with the stack unchanged.
status_code push_macro(const char *body);

// The stacks are about to change, or have changed, under the character
// source: store the read position into its frame and derive it again from
// the stacks on the next read.
void char_source_sync();
// Abandons every pending body: reading goes on in the current file. This
// is also the character source's reset.
void drop_macros();

// The source stack's open and close, with the cursor stored first and
// derived again afterwards: what every reader above calls.
status_code open_source_file(const char *name);
status_code close_sources();

// Stores the read position into its source frame; the cursor stays where
// it is. (A macro frame's position is internal and stored when needed.)
inline void char_source_store() {
    *cursor_line_pos = static_cast<std::uint16_t>(read_cursor - cursor_line);
}

}  // namespace tplex

#endif

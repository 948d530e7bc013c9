#include "scan/char_source.h"

#include <cstring>

#include "base/memory.h"
#include "base/text.h"
#include "scan/pass_facts.h"
#include "source/source_stack.h"

namespace tplex {

macro_frame *macro_stack = nullptr;
std::uint16_t macro_depth = 0;

namespace {

const unsigned char end_of_buffer[read_slack] = {0};  // a buffer with nothing left

}  // namespace

cursor_origin cursor_from{cursor_owner::none, 0, end_of_buffer};
const unsigned char *read_cursor = end_of_buffer;
const unsigned char *cursor_line = end_of_buffer;
std::uint16_t spare_line_pos = 0;
std::uint16_t *cursor_line_pos = &spare_line_pos;

namespace {

cursor_origin &cur = cursor_from;

void store_position() {
    switch (cur.owner) {
        case cursor_owner::macro:
            macro_stack[cur.index].read_pos = static_cast<std::uint32_t>(read_cursor - cur.base);
            break;
        case cursor_owner::file:
            source_stack[cur.index].read_pos = static_cast<std::uint16_t>(read_cursor - cur.base);
            break;
        case cursor_owner::none:
            break;
    }
}

void drop_cursor() {
    cur.owner = cursor_owner::none;
    read_cursor = end_of_buffer;
    cursor_line_pos = &spare_line_pos;
}

void point_cursor(cursor_owner owner, int index, const char *base, std::uint32_t pos) {
    cur.owner = owner;
    cur.index = index;
    cur.base = reinterpret_cast<const unsigned char *>(base);
    read_cursor = cur.base + pos;
    if (owner == cursor_owner::file) {
        cursor_line = cur.base;
        cursor_line_pos = &source_stack[index].read_pos;
    } else {
        cursor_line_pos = &spare_line_pos;
    }
}

// The character of a frame's line at its read position; NUL past the line.
inline std::uint8_t line_char(const source_frame &f) {
    return f.read_pos < line_size ? static_cast<std::uint8_t>(f.line_text[f.read_pos]) : 0;
}

}  // namespace

status_code char_source_create() {
    macro_stack = static_cast<macro_frame *>(mem_alloc(sizeof(macro_frame) * macro_frame_count));
    return macro_stack != nullptr ? 0 : TPLEX_MALLOC_FAILED;
}

void char_source_destroy() {
    drop_cursor();
    mem_free(macro_stack);
    macro_stack = nullptr;
    macro_depth = 0;
}

void char_source_sync() {
    store_position();
    drop_cursor();
}

void drop_macros() {
    char_source_sync();
    macro_depth = 0;
}

bool next_file_line() {
    if (!cursor_reads_file()) return false;
    source_frame &f = source_stack[cur.index];
    if (!read_next_line(f)) return false;
    f.read_pos = 0;
    if (f.line_text[0] != '\0') {
        read_cursor = cursor_line;
    } else {
        drop_cursor();  // a line that starts with a NUL byte ends there: the general path goes on
    }
    return true;
}

std::uint8_t read_char_slow() {
    // The common case first: the file line being read has ended (a valid
    // file cursor means no body is pending and its frame is the current
    // one) and the file has another line. When the file has ended, the
    // general path below closes it.
    if (next_file_line()) {
        if (!cursor_reads_file()) return 0;  // a line that starts with a NUL byte
        *cursor_line_pos = 1;
        return *read_cursor++;
    }
    char_source_sync();

    // Macro text first; a frame goes only once its NUL has been handed out.
    while (macro_depth > 0 &&
           macro_stack[macro_depth - 1].read_pos > macro_stack[macro_depth - 1].length)
        --macro_depth;
    if (macro_depth > 0) {
        macro_frame &m = macro_stack[macro_depth - 1];
        const auto c = static_cast<std::uint8_t>(m.body[m.read_pos++]);
        if (c != 0) point_cursor(cursor_owner::macro, macro_depth - 1, m.body, m.read_pos);
        return c;
    }

    source_frame *f = current_source_frame();
    if (f == nullptr) return ch_end_of_input;
    if (f->line_no == no_line_yet || line_char(*f) == 0) {
        // A file that has no more lines is closed and the includer goes on
        // with its next line.
        while (!read_next_line(*f)) {
            note_file_end(*f);
            f = pop_source_file();
            if (f == nullptr) return ch_end_of_input;
        }
        f->read_pos = 0;
    }
    const std::uint8_t c = line_char(*f);
    if (c == 0) return 0;  // a line that starts with a NUL byte
    ++f->read_pos;
    point_cursor(cursor_owner::file, source_depth, f->line_text, f->read_pos);
    return c;
}

std::uint8_t peek_char_slow() {
    store_position();
    if (macro_depth >= 1) {
        const macro_frame &m = macro_stack[macro_depth - 1];
        return m.read_pos < m.length ? static_cast<std::uint8_t>(m.body[m.read_pos]) : ' ';
    }
    const source_frame *f = current_source_frame();
    if (f == nullptr) return ' ';
    const std::uint8_t c = line_char(*f);
    return c != 0 ? c : ' ';
}

status_code push_macro(const char *body) {
    if (macro_depth >= macro_frame_count) return TPLEX_TOO_MANY_MACRO_LEVELS;
    if (macro_stack == nullptr) return TPLEX_NOT_INITIALISED;
    char_source_sync();
    macro_frame &m = macro_stack[macro_depth];
    ++macro_depth;
    m.read_pos = 0;
    m.length = static_cast<std::uint32_t>(copy_text(m.body, text_size, body));
    std::memset(m.body + m.length, 0, read_slack);
    return 0;
}

status_code open_source_file(const char *name) {
    char_source_sync();
    return push_source_file(name);
}

status_code close_sources() {
    char_source_sync();
    return close_source_files();
}

}  // namespace tplex

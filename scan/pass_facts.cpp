#include "scan/pass_facts.h"

#include <cstring>

#include "base/text.h"
#include "scan/char_source.h"
#include "scan/directives.h"
#include "source/source_stack.h"

namespace tplex {

namespace {

// Where each region of cond_stack began; entry 0, the whole input, unused.
tplex_place region_places[cond_flag_count];

struct comment_state {
    bool open = false;           // a block comment is being skipped
    bool counted = false;        // and has already been counted
    std::int16_t depth = 0;      // the source depth it began at (0: in a body)
    std::uint32_t line = 0;      // its line there
    std::uint32_t past_end = 0;  // comments counted
    tplex_place ended{};         // the last one counted: the file that ended
    std::uint32_t opened_line = 0;
} comment;

void copy_place(tplex_place &to, const source_frame &f) {
    copy_text(to.path, path_size, f.path);
    to.line = f.line_no + 1u;  // all ones before the first line: 0
}

}  // namespace

void note_region_opened() {
    tplex_place &p = region_places[cond_depth];
    if (source_stack != nullptr && source_depth >= 1 && source_depth <= max_source_depth) {
        copy_place(p, source_stack[source_depth]);
    } else {
        p.path[0] = '\0';
        p.line = 0;
    }
}

void note_block_comment(bool open) {
    comment.open = open;
    if (!open) return;
    comment.counted = false;
    // A comment inside a pending body has no line of a file.
    const bool in_file = macro_depth == 0 && source_stack != nullptr && source_depth >= 1;
    comment.depth = in_file ? source_depth : std::int16_t{0};
    comment.line = in_file ? source_stack[source_depth].line_no + 1u : 0u;
}

void note_file_end(const source_frame &f) {
    if (!comment.open || comment.counted) return;
    comment.counted = true;
    ++comment.past_end;
    copy_place(comment.ended, f);
    const bool began_here = comment.depth >= 1 && &source_stack[comment.depth] == &f;
    comment.opened_line = began_here ? comment.line : 0u;
}

std::int32_t open_regions(tplex_place *places, std::int32_t capacity) {
    const std::int32_t open = cond_depth;
    for (std::int32_t i = 0; places != nullptr && i < open && i < capacity; ++i)
        places[i] = region_places[i + 1];
    return open;
}

std::uint32_t comments_past_file_end(tplex_place *ended, std::uint32_t *opened_line) {
    if (ended != nullptr) *ended = comment.ended;
    if (opened_line != nullptr) *opened_line = comment.opened_line;
    return comment.past_end;
}

}  // namespace tplex

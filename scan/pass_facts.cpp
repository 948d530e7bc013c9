#include "scan/pass_facts.h"

#include <cstring>

#include "base/text.h"
#include "scan/char_source.h"
#include "scan/directives.h"
#include "source/source_stack.h"

namespace tplex {

namespace {

void copy_place(tplex_place &to, const source_frame &f) {
    copy_text(to.path, path_size, f.path);
    to.line = f.line_no + 1u;  // all ones before the first line: 0
}

}  // namespace

pass_facts_state pass_facts;

void pass_facts_reset() {
    pass_facts = pass_facts_state{};
}

void note_region_opened() {
    tplex_place &p = pass_facts.region_places[cond_depth];
    if (const source_frame *f = current_source_frame()) {
        copy_place(p, *f);
    } else {
        p.path[0] = '\0';
        p.line = 0;
    }
}

void note_block_comment(bool open) {
    auto &c = pass_facts.comment;
    c.open = open;
    if (!open) return;
    c.counted = false;
    // A comment inside a pending body has no line of a file.
    const source_frame *f = macro_depth == 0 ? current_source_frame() : nullptr;
    c.depth = f != nullptr ? source_depth : std::int16_t{0};
    c.line = f != nullptr ? f->line_no + 1u : 0u;
}

void note_file_end(const source_frame &f) {
    auto &c = pass_facts.comment;
    if (!c.open || c.counted) return;
    c.counted = true;
    ++c.past_end;
    copy_place(c.ended, f);
    const bool began_here = c.depth >= 1 && &source_stack[c.depth] == &f;
    c.opened_line = began_here ? c.line : 0u;
}

std::int32_t open_regions(tplex_place *places, std::int32_t capacity) {
    const std::int32_t open = cond_depth;
    for (std::int32_t i = 0; places != nullptr && i < open && i < capacity; ++i)
        places[i] = pass_facts.region_places[i + 1];
    return open;
}

std::uint32_t comments_past_file_end(tplex_place *ended, std::uint32_t *opened_line) {
    const auto &c = pass_facts.comment;
    if (ended != nullptr) *ended = c.ended;
    if (opened_line != nullptr) *opened_line = c.opened_line;
    return c.past_end;
}

}  // namespace tplex

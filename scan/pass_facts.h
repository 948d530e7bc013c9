// Facts about the pass that a parser or the tplex tool may ask for after it
// (tplex/services.h):
// where each open #ifdef/#ifndef region began, and the block comments that
// ran past the end of a file. The scanner, the directives and the character
// source note them as they happen; nothing in the lexer reads them.
#ifndef TPLEX_SCAN_PASS_FACTS_H
#define TPLEX_SCAN_PASS_FACTS_H

#include <cstdint>

#include "scan/directives.h"
#include "tplex/lexer.h"
#include "tplex/services.h"

namespace tplex {

// What has been noted since lex_initialise (pass_facts_reset); a further
// pass keeps the running counts.
struct pass_facts_state {
    // Where each region of cond_stack began; entry 0, the whole input, unused.
    tplex_place region_places[cond_flag_count]{};
    struct {
        bool open = false;           // a block comment is being skipped
        bool counted = false;        // and has already been counted
        std::int16_t depth = 0;      // the source depth it began at (0: in a body)
        std::uint32_t line = 0;      // its line there
        std::uint32_t past_end = 0;  // comments counted
        tplex_place ended{};         // the last one counted: the file that ended
        std::uint32_t opened_line = 0;
    } comment;
};
extern pass_facts_state pass_facts;
void pass_facts_reset();

// A region has just been pushed at cond_depth by a directive of the
// current file.
void note_region_opened();
// A block comment begins (true) or has ended (false).
void note_block_comment(bool open);
// The file of frame f has no more lines and is about to be closed.
void note_file_end(const source_frame &f);

// The regions open now, outermost first: up to capacity places filled;
// the count open.
std::int32_t open_regions(tplex_place *places, std::int32_t capacity);
// The count of block comments that ran past a file's end, and the last.
std::uint32_t comments_past_file_end(tplex_place *ended, std::uint32_t *opened_line);

}  // namespace tplex

#endif

// Facts about the pass that a parser or the tplex tool may ask for after it
// (tplex/services.h):
// where each open #ifdef/#ifndef region began, and the block comments that
// ran past the end of a file. The scanner, the directives and the character
// source note them as they happen; nothing in the lexer reads them.
#ifndef TPLEX_SCAN_PASS_FACTS_H
#define TPLEX_SCAN_PASS_FACTS_H

#include <cstdint>

#include "tplex/lexer.h"
#include "tplex/services.h"

namespace tplex {

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

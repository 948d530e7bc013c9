// Facts about the pass that only the tplex tool asks for (tplex/tool_queries.h):
// where each open #ifdef/#ifndef region began, and the block comments that
// ran past the end of a file. The scanner, the directives and the character
// source note them as they happen; nothing in the lexer reads them.
#ifndef TPLEX_SCAN_PASS_FACTS_H
#define TPLEX_SCAN_PASS_FACTS_H

#include "tplex/lexer.h"

namespace tplex {

// A region has just been pushed at cond_depth by a directive of the
// current file.
void note_region_opened();
// A block comment begins (true) or has ended (false).
void note_block_comment(bool open);
// The file of frame f has no more lines and is about to be closed.
void note_file_end(const source_frame &f);

}  // namespace tplex

#endif

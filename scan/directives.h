// The preprocessing layer between the scanner and the parser: drops ends of
// line and switched-off regions, and executes the five hash words.
#ifndef TPLEX_SCAN_DIRECTIVES_H
#define TPLEX_SCAN_DIRECTIVES_H

#include <cstdint>

#include "base/compiler.h"
#include "base/limits.h"
#include "tplex/lexer.h"

namespace tplex {

// Flags of the nested #ifdef/#ifndef regions: 1 delivers, 0 skips. Entry 0
// is the whole input and is always 1; cond_depth indexes the innermost.
extern TPLEX_INTERNAL std::uint8_t cond_stack[cond_flag_count];
extern TPLEX_INTERNAL std::uint16_t cond_depth;

// True while tokens of the current region are delivered.
inline bool region_live() {
    return cond_stack[cond_depth] == 1;
}

// Region 0 only, live: the directives' reset.
void directives_reset();
// Runs the hash word in current_token (its code in value). 0 or more to go
// on, or a failure code.
status_code process_hash_directive();
// Predefines names as kind 25, code 2. 0, or TPLEX_ALREADY_DEFINED, or the
// failure of storing a name (TPLEX_MALLOC_FAILED), at the first name that
// is not defined by the call; the names before it stay defined.
status_code sc_lex_init_defines(char **names, std::int32_t count);

}  // namespace tplex

#endif

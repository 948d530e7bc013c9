// The lexer's token state and lifecycle: current_token, the two flags the
// parser sees, initialisation, reset and release of all global state.
#ifndef TPLEX_LEX_LEXER_H
#define TPLEX_LEX_LEXER_H

#include "lex/compiler.h"
#include "lex/limits.h"
#include "tplex/lexer.h"

namespace tplex {

extern TPLEX_INTERNAL token_record current_token;  // the token scanned last
extern TPLEX_INTERNAL uint8_t push_back_flag;      // set by back_token, honoured by scan_token
extern uint8_t declare_enabled;                    // parse_ident declares and checks only while 1

// Allocates the dictionary and both stacks, resets every counter and flag
// and loads the keywords. 0, or TPLEX_MALLOC_FAILED with nothing kept.
status_code lex_initialise();
// Releases everything lex_initialise made. Always 0.
status_code lex_free();
// The first half of rewind_input: counters and depths back to their start,
// the dictionary emptied down to the keywords; the storage is kept.
void lex_reset();

// Sets push_back_flag.
void back_token();

}  // namespace tplex

#endif

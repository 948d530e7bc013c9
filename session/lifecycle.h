// The lexer's lifecycle: initialisation, the reset of a further pass and
// release. Each subsystem creates, resets and releases its own state; this
// layer only calls them in order.
#ifndef TPLEX_SESSION_LIFECYCLE_H
#define TPLEX_SESSION_LIFECYCLE_H

#include "tplex/lexer.h"

namespace tplex {

// Allocates the dictionary and both stacks, resets every counter and flag
// and loads the keywords. 0, or TPLEX_MALLOC_FAILED with nothing kept.
status_code lex_initialise();
// Releases everything lex_initialise made. Always 0.
status_code lex_free();
// The first half of rewind_input: counters and depths back to their start,
// the dictionary emptied down to the keywords; the storage is kept.
void lex_reset();
// lex_reset, then closes everything and reopens the main file.
status_code rewind_input();

}  // namespace tplex

#endif

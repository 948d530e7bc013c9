// The message catalogue and the two message operations.
#ifndef TPLEX_ERRORS_MESSAGES_H
#define TPLEX_ERRORS_MESSAGES_H

#include <cstddef>

#include "tplex/lexer.h"

namespace tplex {

// The catalogue text of a code, or null for a code outside it.
const char *status_text(status_code code);
// Writes the diagnostic of a code with the current position into buffer,
// as snprintf does: its full length, the text cut to size - 1 characters.
std::size_t format_diagnostic(status_code code, char *buffer, std::size_t size);
// Prints the diagnostic of a code with the current position.
void display_error(status_code code);
// Prints the "Error:" prefix and returns the text of a code.
const char *get_error(status_code code);

}  // namespace tplex

#endif

// The reader of string arguments.
#ifndef TPLEX_SERVICES_STRING_ARG_H
#define TPLEX_SERVICES_STRING_ARG_H

#include <cstdint>

#include "tplex/lexer.h"

namespace tplex {

// Reads the next token where a string is forbidden (mode 0), optional
// (mode 1) or required (any other mode), copying a string into out (at
// least 2500 bytes). A token that is not a string is given back in modes 0
// and 1, with out emptied. 0, TPLEX_STRING_NOT_ALLOWED,
// TPLEX_STRING_EXPECTED, or the token reader's failure (out untouched).
status_code parse_string(char *out, std::uint8_t mode);

}  // namespace tplex

#endif

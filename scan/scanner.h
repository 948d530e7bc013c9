// The token scanner: one token per call into current_token.
#ifndef TPLEX_SCAN_SCANNER_H
#define TPLEX_SCAN_SCANNER_H

#include <cstdint>

#include "tplex/lexer.h"

namespace tplex {

// Scans the next token. Its kind (>= 0), tk_end_of_line for an end of line
// or of a macro body (the record untouched), or a failure code. Honours
// push_back_flag: returns the current kind again without reading.
status_code scan_token();

// Adds c as the next digit of *number in base: 0, or TPLEX_BAD_DIGIT when c
// is no digit of the base. Wraps at 32 bits.
status_code add_digit(std::uint32_t *number, std::uint8_t c, std::uint8_t base);

// A letter, digit or underscore.
bool is_ident_char(std::uint8_t c);

}  // namespace tplex

#endif

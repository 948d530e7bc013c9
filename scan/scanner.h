// The token scanner: one token per call into current_token, and the filter
// between it and the parser (here, so the scan inlines into it).
#ifndef TPLEX_SCAN_SCANNER_H
#define TPLEX_SCAN_SCANNER_H

#include <cstdint>

#include "base/compiler.h"
#include "tplex/lexer.h"

namespace tplex {

// The scanner's state: set by back_token, honoured by the next scan.
extern TPLEX_INTERNAL std::uint8_t push_back_flag;

// Clears push_back_flag.
void scanner_reset();
// Sets push_back_flag.
void back_token();

// Scans the next token. Its kind (>= 0), tk_end_of_line for an end of line
// or of a macro body (the record untouched), or a failure code. Honours
// push_back_flag: returns the current kind again without reading.
status_code scan_token();

// The next token the parser gets: its kind, or a failure code. Hash words
// are executed, ends of line and switched-off regions dropped. The next call
// goes on after the point where a failure happened.
status_code next_token_filtered();

// Adds c as the next digit of *number in base: 0, or TPLEX_BAD_DIGIT when c
// is no digit of the base. Wraps at 32 bits.
status_code add_digit(std::uint32_t *number, std::uint8_t c, std::uint8_t base);

}  // namespace tplex

#endif

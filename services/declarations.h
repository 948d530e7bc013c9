// The parser's symbol table services: declaring and checking identifiers
// with per-class numbering, generated labels, and the undeclared check.
#ifndef TPLEX_SERVICES_DECLARATIONS_H
#define TPLEX_SERVICES_DECLARATIONS_H

#include <cstdint>

#include "tplex/lexer.h"

namespace tplex {

// The declarations' state: the switch the parser holds by address, and
// the two counters that number declared identifiers.
extern std::uint8_t declare_enabled;        // parse_ident declares and checks only while 1
extern std::uint16_t shared_class_counter;  // classes 13, 14, 15, 16, 19, 26
extern std::uint16_t general_counter;       // every other class

// The counters to their start (a further pass); the switch is the parser's.
void declarations_reset();
// The counters to their start and the switch on (a fresh start).
void declarations_init();

// Reads the next token as an identifier and declares it with class_
// (declare non-zero) or checks a use of it against class_.
status_code parse_ident(std::uint8_t declare, std::uint8_t class_);
// The next number of a class's counter (wrapping at 16 bits).
std::uint16_t next_ident_number(std::uint8_t class_);
// Declares (mode 1) or checks the label "$LAB-" + number in five digits.
// 0, TPLEX_DISASTER when a declared label exists or a checked one does not,
// or the failure of storing a declared label (TPLEX_MALLOC_FAILED).
status_code make_label(std::uint16_t number, std::int16_t code, std::uint8_t mode);
// Prints every identifier of kind 12 and their number. 0 or
// TPLEX_UNDECLARED_IDENTIFIER.
status_code dict_check();

}  // namespace tplex

#endif

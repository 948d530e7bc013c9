// How the tool shows what the library delivers: token kind names, escaped
// texts, JSON strings, the diagnostic of a failure as sg_DisplayError
// prints it, taken apart into message and position, and the summary of a
// checked table file.
#ifndef TPLEX_TOOLS_REPORT_H
#define TPLEX_TOOLS_REPORT_H

#include <cstdint>
#include <cstdio>
#include <string>

#include "tplex/lexer.h"
#include "tplex/table_output.h"

namespace tplex::tool {

// What sg_DisplayError printed for one failure.
struct Diagnostic {
    std::string message;        // its message line ("Bad Character", "unspecified error: ...")
    bool has_position = false;  // false for a code printed without one
    std::string file;           // the "File:" of the diagnostic
    long line = 0;              // its "Line:"
    std::string source;         // the source line it showed, without its line feed
};

// The diagnostic sg_DisplayError(code) would print (sg_FormatError), taken
// apart.
Diagnostic diagnostic_of(status_code code);

// The tool's name of a token kind ("identifier", "reserved-word", ...).
std::string kind_name(std::uint16_t kind);
// True for the kinds whose value field the scanner or the dictionary sets.
bool kind_has_value(std::uint16_t kind);
// The spelling of an operator token from its value ("<=", ";").
std::string operator_spelling(std::int32_t value);

// Text between double quotes with C escapes: \\ \" \n \r \t, and \xNN for
// every other byte below 32 or above 126. Always one line.
std::string quoted(const std::string &text);
// A JSON string literal, valid UTF-8: well-formed UTF-8 passes through,
// and each byte above 127 that is not part of it is written as \udcXX
// (0xDC00 plus the byte, a lone surrogate that no text holds, as Python's
// "surrogateescape" does), so the original bytes can be recovered.
std::string json_string(const std::string &text);

// A path as the tool shows it: with "/" for "\" on a POSIX host, where
// the library keeps the Windows separator in its frames.
std::string display_path(std::string path);

// "0xd3470207": a status code as lower-case hexadecimal.
std::string hex_code(status_code code);

// Prints the summary of a sound table: header, body, strings, relocations.
void print_table_summary(const table_check &check, std::FILE *out);

}  // namespace tplex::tool

#endif

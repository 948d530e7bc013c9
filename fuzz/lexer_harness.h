// The lexer harness: one input drives one whole life of the lexer through
// its exported functions.
//
// Input layout: main source, byte 0x1E, included source, byte 0x1E, script.
// The two sources become main.src and inc.src in the working folder (the
// main source includes the other with #include "inc.src"). Each script byte
// picks a call (its low four bits) and the bytes after it give the call's
// arguments; when the script ends, tokens are read until the end of input
// or the step limit. Then sg_closesources and lex_free, and every
// descriptor the run opened must be closed again.
#ifndef TPLEX_FUZZ_LEXER_HARNESS_H
#define TPLEX_FUZZ_LEXER_HARNESS_H

#include <cstddef>
#include <cstdint>

namespace tplex::fuzz {

void run_lexer(const std::uint8_t *data, std::size_t size);

}  // namespace tplex::fuzz

#endif

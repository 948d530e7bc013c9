// Lexing helpers: write a text to a file in a temporary folder, open it as
// the main source and collect what sc_next_token hands out.
#ifndef TPLEX_TESTS_LEX_HARNESS_H
#define TPLEX_TESTS_LEX_HARNESS_H

#include <cstdint>
#include <string>
#include <vector>

#include "test_support.h"
#include "tplex/lexer.h"

namespace tplex::test {

// One result of sc_next_token and the record as it stood after it.
struct Token {
    status_code result;
    std::uint16_t kind;
    std::int32_t value;
    std::string text;
};

// A short, readable form of a token, for comparing token streams as lists:
//   n:VALUE:TEXT  number          s:TEXT   string       op:VALUE  operator
//   rw:VALUE      reserved word   id:TEXT  identifier   pdf:TEXT  PDF string
//   ch:TEXT       character       eof      end of input def:TEXT:VALUE kind 25
//   k{KIND}:VALUE:TEXT any other kind   err:xxxxxxxx a failure (hex)
std::string describe(const Token &t);
using Tokens = std::vector<std::string>;

// The library's state for one test: sc_lex_init on construction,
// sg_closesources and lex_free on destruction, and a folder for its files.
class LexSession {
public:
    LexSession();
    ~LexSession();
    LexSession(const LexSession &) = delete;
    LexSession &operator=(const LexSession &) = delete;

    // Writes a file below the session's folder; returns its absolute path.
    std::string file(const std::string &name, const std::string &bytes) const;
    // Writes the main file and opens it with sc_lex_init_file; returns the
    // result of the open.
    status_code open(const std::string &bytes, const std::string &name = "main.src") const;

    // One sc_next_token, recorded.
    static Token next();
    // sc_next_token until the end of input (or at most limit calls).
    static std::vector<Token> all(std::size_t limit = 20000);
    // The same, described.
    static Tokens all_described(std::size_t limit = 20000);

    const TempDir &dir() const { return dir_; }

private:
    TempDir dir_;
};

// Lexes a whole text (written to a fresh file) in a fresh session.
Tokens lex(const std::string &text);
// Lexes a text after predefining names with sc_lex_init_defines.
Tokens lex_with_defines(const std::string &text, std::vector<std::string> names);

// The record right now, described as a token with the given result.
Token snapshot(status_code result);

// Hex form used by describe for failures, e.g. "err:d3470218".
std::string err(status_code code);

}  // namespace tplex::test

#endif

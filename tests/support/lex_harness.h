// Lexing helpers: a session of the library's state, files in a temporary
// folder, and the tokens sc_next_token hands out in a short form:
//   n:VALUE:TEXT number   s:TEXT string    op:VALUE operator  rw:VALUE reserved word
//   id:TEXT identifier    pdf:TEXT PDF     ch:TEXT character  def:TEXT:VALUE kind 25
//   eof  end of input     k{KIND}:VALUE:TEXT any other kind   err:xxxxxxxx a failure
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
using Tokens = std::vector<std::string>;
std::string describe(const Token &t);
std::string err(status_code code);  // "err:d3470218"

// sc_lex_init on construction; sg_closesources and lex_free on destruction.
class LexSession {
public:
    LexSession();
    ~LexSession();
    LexSession(const LexSession &) = delete;
    LexSession &operator=(const LexSession &) = delete;

    // Writes a file below the session's folder; returns its path.
    std::string file(const std::string &name, const std::string &bytes) const {
        return dir_.write(name, bytes);
    }
    // Writes the main file and opens it with sc_lex_init_file.
    status_code open(const std::string &bytes) const {
        return sc_lex_init_file(file("main.src", bytes).c_str());
    }
    static Token next();
    // sc_next_token up to the end of input (at most 20000 calls).
    static std::vector<Token> all();
    static Tokens all_described();
    const TempDir &dir() const { return dir_; }

private:
    TempDir dir_;
};

// A text lexed from a fresh file in a fresh session; names predefined with
// sc_lex_init_defines first.
Tokens lex(const std::string &text);
Tokens lex_with_defines(const std::string &text, std::vector<std::string> names);

}  // namespace tplex::test

#endif

// Lexing helpers: a session of the library's state with files in a
// temporary folder, and tokens in a short form, joined by blanks:
//   n:VALUE:TEXT number   s:TEXT string    op:VALUE operator  rw:VALUE reserved word
//   id:TEXT identifier    pdf:TEXT PDF     ch:TEXT character  def:TEXT:VALUE kind 25
//   eof  end of input     kKIND:VALUE:TEXT any other kind     err:xxxxxxxx a failure
#ifndef TPLEX_TESTS_LEX_HARNESS_H
#define TPLEX_TESTS_LEX_HARNESS_H

#include <string>
#include <vector>

#include "test_support.h"
#include "tplex/lexer.h"

namespace tplex::test {

std::string err(status_code code);  // "err:d3470218"
// The result of a call and the token record as it stands.
std::string describe(status_code result);

// sc_lex_init on construction; sg_closesources and lex_free on destruction.
class LexSession {
public:
    LexSession() { sc_lex_init(); }
    ~LexSession() { sg_closesources(), lex_free(); }
    LexSession(const LexSession &) = delete;
    LexSession &operator=(const LexSession &) = delete;
    std::string file(const std::string &name, const std::string &bytes) const {
        return dir.write(name, bytes);
    }
    // Writes main.src and opens it with sc_lex_init_file.
    status_code open(const std::string &bytes) const {
        return sc_lex_init_file(file("main.src", bytes).c_str());
    }
    TempDir dir;
};

std::string next();  // one sc_next_token, described
std::string rest();  // sc_next_token up to the end of input (at most 20000 calls)

// A text lexed from a fresh file in a fresh session, names predefined first.
std::string lex(const std::string &text, std::vector<std::string> defines = {});

}  // namespace tplex::test

#endif

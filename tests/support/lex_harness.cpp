#include "lex_harness.h"

#include <cstdio>

namespace tplex::test {

std::string err(status_code code) {
    char buf[32];
    std::snprintf(buf, sizeof buf, "err:%08x", static_cast<unsigned>(code));
    return buf;
}

std::string describe(const Token &t) {
    if (t.result < 0) return err(t.result);
    const std::string v = std::to_string(t.value);
    switch (t.kind) {
        case tk_number: return "n:" + v + ":" + t.text;
        case tk_string: return "s:" + t.text;
        case tk_operator: return "op:" + v;
        case tk_end_of_input: return "eof";
        case tk_reserved_word: return "rw:" + v;
        case tk_new_identifier: return "id:" + t.text;
        case tk_hash_definition: return "def:" + t.text + ":" + v;
        case tk_pdf_string: return "pdf:" + t.text;
        case tk_char: return "ch:" + t.text;
        default: return "k" + std::to_string(t.kind) + ":" + v + ":" + t.text;
    }
}

Token snapshot(status_code result) {
    token_record *tok = nullptr;
    sc_lex_setup(&tok, nullptr, nullptr, nullptr, nullptr);
    return Token{result, tok->kind, tok->value, std::string(tok->text)};
}

LexSession::LexSession() { sc_lex_init(); }

LexSession::~LexSession() {
    sg_closesources();
    lex_free();
}

std::string LexSession::file(const std::string &name, const std::string &bytes) const {
    return dir_.write(name, bytes);
}

status_code LexSession::open(const std::string &bytes, const std::string &name) const {
    return sc_lex_init_file(file(name, bytes).c_str());
}

Token LexSession::next() { return snapshot(sc_next_token()); }

std::vector<Token> LexSession::all(std::size_t limit) {
    std::vector<Token> out;
    for (std::size_t i = 0; i < limit; ++i) {
        out.push_back(next());
        if (out.back().result == tk_end_of_input) break;
    }
    return out;
}

Tokens LexSession::all_described(std::size_t limit) {
    Tokens out;
    for (const Token &t : all(limit)) out.push_back(describe(t));
    return out;
}

Tokens lex(const std::string &text) {
    LexSession s;
    if (s.open(text) != 1) return {"open failed"};
    return LexSession::all_described();
}

Tokens lex_with_defines(const std::string &text, std::vector<std::string> names) {
    LexSession s;
    std::vector<char *> ptrs;
    for (std::string &n : names) ptrs.push_back(n.data());
    const status_code r = sc_lex_init_defines(ptrs.data(), static_cast<int32_t>(ptrs.size()));
    if (r != 0) return {"defines: " + err(r)};
    if (s.open(text) != 1) return {"open failed"};
    return LexSession::all_described();
}

}  // namespace tplex::test

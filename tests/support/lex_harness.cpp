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
        case tk_number:
            return "n:" + v + ":" + t.text;
        case tk_string:
            return "s:" + t.text;
        case tk_operator:
            return "op:" + v;
        case tk_end_of_input:
            return "eof";
        case tk_reserved_word:
            return "rw:" + v;
        case tk_new_identifier:
            return "id:" + t.text;
        case tk_hash_definition:
            return "def:" + t.text + ":" + v;
        case tk_pdf_string:
            return "pdf:" + t.text;
        case tk_char:
            return "ch:" + t.text;
        default:
            return "k" + std::to_string(t.kind) + ":" + v + ":" + t.text;
    }
}

LexSession::LexSession() {
    sc_lex_init();
}

LexSession::~LexSession() {
    sg_closesources();
    lex_free();
}

Token LexSession::next() {
    const status_code r = sc_next_token();
    token_record *tok = nullptr;
    sc_lex_setup(&tok, nullptr, nullptr, nullptr, nullptr);
    return Token{r, tok->kind, tok->value, std::string(tok->text)};
}

std::vector<Token> LexSession::all() {
    std::vector<Token> out;
    while (out.size() < 20000 && (out.empty() || out.back().result != tk_end_of_input))
        out.push_back(next());
    return out;
}

Tokens LexSession::all_described() {
    Tokens out;
    for (const Token &t : all()) out.push_back(describe(t));
    return out;
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

Tokens lex(const std::string &text) {
    return lex_with_defines(text, {});
}

}  // namespace tplex::test

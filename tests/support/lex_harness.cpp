#include "lex_harness.h"

#include <cstdio>

namespace tplex::test {

std::string err(status_code code) {
    char buf[32];
    std::snprintf(buf, sizeof buf, "err:%08x", static_cast<unsigned>(code));
    return buf;
}

std::string describe(status_code result) {
    if (result < 0) return err(result);
    token_record *t = nullptr;
    sc_lex_setup(&t, nullptr, nullptr, nullptr, nullptr);
    const std::string v = std::to_string(t->value), text = t->text;
    switch (t->kind) {
        case tk_number:
            return "n:" + v + ":" + text;
        case tk_string:
            return "s:" + text;
        case tk_operator:
            return "op:" + v;
        case tk_end_of_input:
            return "eof";
        case tk_reserved_word:
            return "rw:" + v;
        case tk_new_identifier:
            return "id:" + text;
        case tk_hash_definition:
            return "def:" + text + ":" + v;
        case tk_pdf_string:
            return "pdf:" + text;
        case tk_char:
            return "ch:" + text;
        default:
            return "k" + std::to_string(t->kind) + ":" + v + ":" + text;
    }
}

std::string next() {
    return describe(sc_next_token());
}

std::string rest() {
    std::string out;
    for (int i = 0; i < 20000; ++i) {
        const status_code r = sc_next_token();
        out += (out.empty() ? "" : " ") + describe(r);
        if (r == tk_end_of_input) break;
    }
    return out;
}

std::string lex(const std::string &text, std::vector<std::string> defines) {
    LexSession s;
    std::vector<char *> names;
    for (std::string &n : defines) names.push_back(n.data());
    const status_code r = sc_lex_init_defines(names.data(), static_cast<int32_t>(names.size()));
    if (r != 0) return "defines: " + err(r);
    if (s.open(text) != 1) return "open failed";
    return rest();
}

}  // namespace tplex::test
